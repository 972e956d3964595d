// The user's or the system's wish that this process comes to its end: Ctrl-C, a closed terminal,
// SIGTERM.
#pragma once

namespace assay_host {

// From now on the first such wish is only noted; the second one ends the process.
void WatchForInterrupt();

// Any thread may ask.
bool WasInterrupted();

} // namespace assay_host
