// Alone in its file, so that a program that defines this function has a clock of its own.
#include <ctime>

#include "pmutil/System.h"

namespace pmutil {

double GetClockSeconds()
{
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) * 1e-9;
}

} // namespace pmutil
