#include "all/WaitTime.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdint>

namespace pmutil {

namespace {

// Seconds. A longer wait counts as infinite; dates would overflow.
constexpr double kMaxWait = 100.0 * 365 * 24 * 60 * 60;

} // namespace

double GetWaitClock()
{
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

double GetTimeLeft(double deadline)
{
    return std::max(0.0, deadline - GetWaitClock());
}

boost::posix_time::time_duration ToWaitDuration(double seconds)
{
    if (std::isnan(seconds))
        return boost::posix_time::not_a_date_time;
    if (seconds > kMaxWait)
        return boost::posix_time::pos_infin;
    if (seconds < -kMaxWait)
        return boost::posix_time::neg_infin;
    // NOLINTNEXTLINE(bugprone-incorrect-roundings): all negative times end a wait at once
    const auto milliseconds = static_cast<std::int64_t>(seconds * 1000.0 + 0.5);
    return boost::posix_time::microseconds(milliseconds * 1000);
}

} // namespace pmutil
