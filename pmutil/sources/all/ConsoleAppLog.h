// Enables the log statements about launched children.
#pragma once

#include "pmutil/PMLogging.h"

namespace pmutil {

inline DebugValue gConsoleAppLog{"ConsoleAppLog", 0};

} // namespace pmutil
