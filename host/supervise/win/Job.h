// The processes of a Windows job.
#pragma once

#include <windows.h>

#include <optional>
#include <set>

namespace assay_host {

// The job of this process and its descendants, made at the first call; null if the system doesn't
// allow one. The system ends what is left in the job when this process ends, also if it is killed.
HANDLE GetOwnJob();

// The processes of the job but this one; nothing if the system doesn't report them.
std::optional<std::set<DWORD>> ListProcesses(HANDLE job);

// Ends by force the processes of the job but this one and those before. False if some are left
// after so many seconds, or if the system doesn't report them.
bool EndNewProcesses(HANDLE job, const std::set<DWORD>& before, double seconds);

} // namespace assay_host
