#include "facts/TimeText.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <stdexcept>

#include <boost/date_time/gregorian/gregorian_types.hpp>
#include <fmt/format.h>

#include "report/Numbers.h"

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

std::optional<std::int64_t> ReadUtcText(std::string_view text)
{
    constexpr std::string_view kForm = "0000-00-00T00:00:00Z";
    if (text.size() != kForm.size())
        return std::nullopt;
    std::array<int, 6> numbers{};
    std::size_t count = 0;
    for (std::size_t at = 0; at < kForm.size();) {
        const std::size_t end = std::min(kForm.find_first_not_of('0', at), kForm.size() - 1);
        const auto number = ReadUnsigned(text.substr(at, end - at));
        if (!number || text[end] != kForm[end])
            return std::nullopt;
        numbers[count++] = static_cast<int>(*number);
        at = end + 1;
    }
    const auto [year, month, day, hour, minute, second] = numbers;
    try {
        const boost::gregorian::date date(static_cast<unsigned short>(year),
                                          static_cast<unsigned short>(month),
                                          static_cast<unsigned short>(day));
        const std::int64_t days = (date - boost::gregorian::date(1970, 1, 1)).days();
        if (days < 0 || hour > 23 || minute > 59 || second > 59)
            return std::nullopt;
        return ((days * 24 + hour) * 60 + minute) * 60 + second;
    } catch (const std::out_of_range&) {
        return std::nullopt; // no such day
    }
}

std::string MakeOffsetText(int minutes)
{
    constexpr int kMax = 24 * 60 - 1;
    const int offset = std::clamp(minutes, -kMax, kMax);
    return fmt::format("{}{:02}:{:02}", offset < 0 ? '-' : '+', std::abs(offset) / 60,
                       std::abs(offset) % 60);
}

} // namespace assay_host
