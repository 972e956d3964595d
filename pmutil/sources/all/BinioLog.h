// Enables the log statements about handles and pipes.
#pragma once

#include "pmutil/PMLogging.h"

namespace pmutil {

inline DebugValue gBinioLog{"BINIO_LOG", 0};

} // namespace pmutil
