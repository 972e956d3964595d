// Sees to it that nothing that this program starts outlives it.
#pragma once

namespace assay_host {

// From now on whatever this process starts ends with it, however its own end comes. Called once in
// a process, at its start, before there are threads.
//
// On Linux the process that the user started stays as the guardian and doesn't come back from this
// call: it waits, passes signals on, and ends as its worker does, once all is ended. The worker, a
// copy of it in a process group of its own, returns. On Windows a job does it.
void GuardProcess();

// Before this process ends: where the guardian has ended already, ends what is still left.
void EndUnguarded();

} // namespace assay_host
