// Alone in its file, so that a program that defines this function has a clock of its own.
#include <windows.h>

#include <cstdint>

#include "pmutil/System.h"

namespace pmutil {

double GetClockSeconds()
{
    constexpr double kSecondsPerTick = 1e-7;
    constexpr std::int64_t kTicksFrom1601To1970 = 116444736000000000;
    FILETIME now{};
    GetSystemTimeAsFileTime(&now);
    ULARGE_INTEGER ticks{};
    ticks.LowPart = now.dwLowDateTime;
    ticks.HighPart = now.dwHighDateTime;
    return static_cast<double>(static_cast<std::int64_t>(ticks.QuadPart) - kTicksFrom1601To1970) *
           kSecondsPerTick;
}

} // namespace pmutil
