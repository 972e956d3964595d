// The signals that ask this process to end.
#pragma once

#include <csignal>

namespace assay_host {

// Returns all signals that end a process by default, except SIGKILL, those of a fault of the
// process, those of a failing write, and those that are ignored now.
sigset_t GetEndSignals();

} // namespace assay_host
