// The processes of a Windows job.
#pragma once

#include <windows.h>

#include <optional>
#include <set>

namespace assay_host {

// Makes a job whose processes the system kills when its last handle is closed; null if the system
// doesn't allow one.
HANDLE MakeKillingJob();

// Returns the job of this process and its descendants, made at the first call; null if the system
// doesn't allow one. When this process ends, even if it is killed, the system kills the other
// processes of the job.
HANDLE GetOwnJob();

// Returns the ids of the job's processes except this one; nothing if the system doesn't report
// them.
std::optional<std::set<DWORD>> ListProcesses(HANDLE job);

// Kills the processes of the job except this one and those in `before`. Returns false if some are
// left after this time, or if the system doesn't report them.
bool EndNewProcesses(HANDLE job, const std::set<DWORD>& before, double seconds);

} // namespace assay_host
