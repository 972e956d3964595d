// Interrupts: Ctrl-C, a closed terminal, SIGTERM, and each other signal that ends a process by
// default and that a process can catch.
#pragma once

#include <functional>
#include <memory>

#include "supervise/StopRequest.h"

namespace assay_host {

// Call at the start of the process. Undoes inherited signal settings, so that signals arrive and
// children can be waited for, and lets a failing write fail instead of ending the process.
void PrepareSignals();

// From now on an interrupt doesn't end this process but raises `stop` at once, on a thread of its
// own. A signal that was ignored when the process began, such as SIGHUP under nohup, stays ignored.
// Call once in a process.
void WatchForInterrupt(std::shared_ptr<StopRequest> stop);

// From now on an interrupt calls `end` instead, on that thread. Returns the number of interrupts so
// far.
int SetInterruptEnd(std::function<void()> end);

// Ends the process with the status at once, without waiting for any thread.
[[noreturn]] void EndProcess(int status);

} // namespace assay_host
