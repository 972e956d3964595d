// Which signals stand for the wish that this process ends.
#pragma once

#include <csignal>

namespace assay_host {

// All whose default is to end a process, without SIGKILL, those of a fault of its own (which end it
// whatever it does), those of a failing write, and what is ignored now.
sigset_t GetEndSignals();

} // namespace assay_host
