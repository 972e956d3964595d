// Ends what this program has started when the program itself ends.
#pragma once

namespace assay_host {

// From now on what this process starts ends with it, also if it is killed. Call once in a process,
// at its start, before there are threads.
//
// On Linux the process that the user started becomes the guardian and doesn't return from this
// call: it waits, forwards signals, ends what is left, and ends as its worker did. The worker, a
// fork of it in a process group of its own, returns. On Windows a job does the same.
void GuardProcess();

// Call before this process ends: ends what is left if the guardian has ended already.
void EndUnguarded();

} // namespace assay_host
