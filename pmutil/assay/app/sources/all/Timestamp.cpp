#include "Timestamp.h"

#include <boost/date_time/c_time.hpp>

#include "pmutil/Format.h"

namespace assay {

std::string LocalTimeText(std::time_t calendarTime)
{
    std::tm parts{};
    // Boost's localtime is thread-safe on every platform and throws the documented exception.
    const std::tm local = *boost::date_time::c_time::localtime(&calendarTime, &parts);
    return pmutil::FormatString("%04d-%02d-%02d_%02d:%02d:%02d", local.tm_year + 1900,
                                local.tm_mon + 1, local.tm_mday, local.tm_hour, local.tm_min,
                                local.tm_sec);
}

} // namespace assay
