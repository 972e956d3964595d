// How long a device worked on one command, by its own counters.
#pragma once

#include "qgf/OCLFunctionTable.h"

namespace pmutil {

// Seconds between start and end of the command behind a finished event of a profiling queue. A
// driver that refuses is not told from one that answers: its counter stays 0, and the result has no
// meaning.
double ProfilingDuration(cl_event event);

} // namespace pmutil
