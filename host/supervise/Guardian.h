// Kills the processes that this program has started when the program itself ends.
#pragma once

namespace assay_host {

// From now on all processes that this process starts are killed when it ends, even if it is killed.
// Call once, at the start of the process, before it has threads.
//
// On Linux the process that the user started becomes the guardian and doesn't return from this
// call: it waits, forwards signals, kills the remaining processes, and ends with the status or the
// signal of its worker. The worker, a fork of it in a process group of its own, returns. On Windows
// a job does the same.
void GuardProcess();

// Kills the remaining processes if the guardian has ended already. Call before this process ends.
void EndUnguarded();

} // namespace assay_host
