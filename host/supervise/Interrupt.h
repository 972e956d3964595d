// The user's or the system's wish that this process comes to its end: Ctrl-C, a closed terminal,
// SIGTERM, and each other signal whose default is to end a process, as far as a process can see it.
#pragma once

#include <functional>
#include <memory>

#include "supervise/StopRequest.h"

namespace assay_host {

// At the start of the process: what it inherited doesn't decide which signals it sees, that the end
// of a child can be waited for, and that a failing write fails instead of ending it.
void PrepareSignals();

// From now on such a wish ends this process only as the functions here say; one that was ignored
// when the process began, as SIGHUP under nohup, stays so. Each wish raises `stop`, at once, on a
// thread of its own. Called once in a process.
void WatchForInterrupt(std::shared_ptr<StopRequest> stop);

// From now on the next wish calls `end` instead, on that thread. Gives how many wishes came before.
int SetInterruptEnd(std::function<void()> end);

// Ends the process with the status, now: nothing is waited for, and no thread that is stuck can
// keep it.
[[noreturn]] void EndProcess(int status);

} // namespace assay_host
