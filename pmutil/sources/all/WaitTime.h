// The clock of waits, and the conversion of seconds to Boost's durations.
#pragma once

#include <boost/date_time/posix_time/posix_time_types.hpp>

namespace pmutil {

// Returns a monotonic clock in seconds, with the system's best resolution.
double GetWaitClock();

// Returns the seconds from now until `deadline`, never below 0.
double GetTimeLeft(double deadline);

// Converts seconds, rounded to milliseconds. Times beyond 100 years become infinite durations, NaN
// becomes not_a_date_time.
boost::posix_time::time_duration ToWaitDuration(double seconds);

} // namespace pmutil
