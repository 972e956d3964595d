// Closes an attempt: with the end of its child, or later, after its host ended.
#pragma once

#include <vector>

#include "memory/Attempt.h"
#include "memory/Machine.h"
#include "report/Report.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Closes the attempt with the outcome of its run. The crash of a child that another process killed
// isn't one of a driver: a system that shuts down sends SIGTERM to all processes, and SIGKILL comes
// from one that needs memory. Any thread may call.
void CloseAttempt(Attempt& attempt, const Report& report, const RunOutcome& outcome,
                  std::int64_t now);

enum class OpenState {
    kNone,   // no attempt is open
    kAlive,  // the host of the open one exists
    kSettled // open ones were closed: their hosts don't exist any more
};

// Closes the attempts that are open, unless their host still exists. An attempt of another machine,
// or of a boot that isn't known, says nothing about a freeze.
OpenState SettleOpen(std::vector<Attempt>& attempts, Machine& machine);

} // namespace assay_host
