// Seconds as the supervision of children counts them, and Boost's durations.
#pragma once

#include <boost/date_time/posix_time/posix_time_types.hpp>

namespace pmutil {

// A monotonic clock with the system's best resolution.
double GetWaitClock();

// Seconds from now until `deadline`, never below 0.
double GetTimeLeft(double deadline);

// Rounded to milliseconds. What no calendar holds becomes an infinite duration, and what is no
// number the special value for no valid time.
boost::posix_time::time_duration ToWaitDuration(double seconds);

} // namespace pmutil
