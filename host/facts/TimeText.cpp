#include "facts/TimeText.h"

#include <algorithm>
#include <cstdlib>

#include <boost/date_time/gregorian/gregorian_types.hpp>
#include <fmt/format.h>

namespace assay_host {

std::string MakeUtcText(std::int64_t seconds)
{
    constexpr std::int64_t kDay = 24 * 60 * 60;
    const boost::gregorian::date epoch(1970, 1, 1);
    const std::int64_t maxDays = (boost::gregorian::date(9999, 12, 31) - epoch).days();
    const std::int64_t time = std::clamp<std::int64_t>(seconds, 0, maxDays * kDay + kDay - 1);
    const boost::gregorian::date date =
        epoch + boost::gregorian::days(static_cast<long>(time / kDay));
    const std::int64_t rest = time % kDay;
    return fmt::format("{:04}-{:02}-{:02}T{:02}:{:02}:{:02}Z", static_cast<int>(date.year()),
                       date.month().as_number(), date.day().as_number(), rest / 3600,
                       rest / 60 % 60, rest % 60);
}

std::string MakeOffsetText(int minutes)
{
    constexpr int kMax = 24 * 60 - 1;
    const int offset = std::clamp(minutes, -kMax, kMax);
    return fmt::format("{}{:02}:{:02}", offset < 0 ? '-' : '+', std::abs(offset) / 60,
                       std::abs(offset) % 60);
}

} // namespace assay_host
