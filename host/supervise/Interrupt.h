// Interrupts: Ctrl-C, a closed terminal, SIGTERM, and every other signal that ends a process by
// default and can be caught.
#pragma once

#include <functional>
#include <memory>

#include "pmutil/StopRequest.h"

namespace assay_host {

// Resets inherited signal settings, so that signals are delivered and children can be waited for,
// and makes writes to a closed pipe or beyond a file-size limit fail instead of ending the process.
// Call at the start of the process.
void PrepareSignals();

// From now on an interrupt raises `stop`, on a thread of its own, instead of ending this process. A
// signal that was ignored when the process started, such as SIGHUP under nohup, stays ignored. Call
// once in a process.
void WatchForInterrupt(std::shared_ptr<pmutil::StopRequest> stop);

// From now on an interrupt calls `end` instead, on the same thread. Returns the number of
// interrupts so far. Any thread may call.
int SetInterruptEnd(std::function<void()> end);

// Ends the process with the status at once, without waiting for its threads. Any thread may call.
[[noreturn]] void EndProcess(int status);

} // namespace assay_host
