#include "all/LogPrefix.h"

#include <boost/date_time/posix_time/posix_time_types.hpp>

#include "pmutil/Format.h"

namespace pmutil {

std::string MakeLogPrefix(std::uint32_t lineNumber, double seconds, double delta,
                          const std::string& thread)
{
    using boost::posix_time::ptime;
    static const ptime kEpoch(boost::gregorian::date(1970, 1, 1));
    const auto milliseconds = static_cast<std::int64_t>(seconds * 1000);
    const ptime moment = kEpoch + boost::posix_time::milliseconds(milliseconds);
    const auto day = moment.date().year_month_day();
    const auto time = moment.time_of_day();
    const double fraction = static_cast<double>(time.total_milliseconds() % 60000) / 1000;
    return FormatString("%05ld.%04d.%02d.%02d_%02d:%02d:%06.3f(+%06.3f)[tid=%s] ",
                        static_cast<long>(lineNumber), static_cast<int>(day.year),
                        static_cast<int>(day.month), static_cast<int>(day.day),
                        static_cast<int>(time.hours()), static_cast<int>(time.minutes()), fraction,
                        delta, thread.c_str());
}

} // namespace pmutil
