// The processes of a Windows job.
#pragma once

#include <windows.h>

#include <optional>
#include <set>

namespace assay_host {

// The job that this process and all that descends from it belong to, made at the first call; null
// where the system doesn't allow one. It ends what is left in it when this process ends, however
// that comes.
HANDLE GetOwnJob();

// The processes of the job but this one; nothing if the system doesn't tell.
std::optional<std::set<DWORD>> ListProcesses(HANDLE job);

// Ends by force the processes of the job but this one and those before. False if some are left
// after so many seconds, or if the system doesn't tell.
bool EndNewProcesses(HANDLE job, const std::set<DWORD>& before, double seconds);

} // namespace assay_host
