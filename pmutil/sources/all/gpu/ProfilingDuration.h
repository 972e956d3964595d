// The execution time of an OpenCL command by the device's counters.
#pragma once

#include "qgf/OCLFunctionTable.h"

namespace pmutil {

// Returns the seconds between start and end of the command of a finished event of a profiling
// queue. The status of the two queries isn't checked: a counter whose query fails is 0, and the
// result is then meaningless.
double ProfilingDuration(cl_event event);

} // namespace pmutil
