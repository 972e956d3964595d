#include "requirements/Version.h"

#include <algorithm>

#include "report/Numbers.h"

namespace assay_host {

std::optional<Version> ReadVersion(std::string_view text)
{
    constexpr std::string_view kDigits = "0123456789";
    text.remove_prefix(std::min(text.find_first_of(kDigits), text.size()));
    Version version;
    while (!text.empty()) {
        const std::size_t end = std::min(text.find_first_not_of(kDigits), text.size());
        const auto number = ReadUnsigned(text.substr(0, end));
        if (!number)
            return std::nullopt;
        version.push_back(*number);
        text.remove_prefix(end);
        if (text.size() < 2 || text[0] != '.' || kDigits.find(text[1]) == std::string_view::npos)
            break;
        text.remove_prefix(1);
    }
    if (version.empty())
        return std::nullopt;
    while (!version.empty() && version.back() == 0)
        version.pop_back();
    return version;
}

} // namespace assay_host
