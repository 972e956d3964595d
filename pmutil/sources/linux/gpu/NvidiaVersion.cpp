#include "linux/gpu/NvidiaVersion.h"

#include <algorithm>
#include <ctime>
#include <iomanip>
#include <iterator>
#include <locale>
#include <sstream>
#include <vector>

namespace pmutil {
namespace {

constexpr int kMinYear = 1990; // no driver is older

// The time zones in the driver's build dates, in minutes east of UTC.
struct Zone {
    const char* name;
    int minutes;
};
constexpr Zone kZones[] = {{"UTC", 0}, {"GMT", 0}, {"PST", -480}, {"PDT", -420}};

bool IsVersion(const std::string& word)
{
    return word.find('.') != std::string::npos && word.front() != '.' && word.back() != '.' &&
           word.find_first_not_of("0123456789.") == std::string::npos;
}

// The words "Aug 19 01:15:15 UTC 2023" from index `first` on.
std::string DateAt(const std::vector<std::string>& words, std::size_t first)
{
    const auto zone = std::find_if(std::begin(kZones), std::end(kZones), [&](const Zone& known) {
        return words[first + 3] == known.name;
    });
    if (zone == std::end(kZones))
        return {};
    std::istringstream in(words[first] + ' ' + words[first + 1] + ' ' + words[first + 2] + ' ' +
                          words[first + 4]);
    in.imbue(std::locale::classic());
    std::tm date{};
    in >> std::get_time(&date, "%b %d %H:%M:%S %Y");
    const bool complete = in && in.peek() == std::istringstream::traits_type::eof();
    if (!complete || date.tm_year < kMinYear - 1900)
        return {};
    std::ostringstream out;
    out.imbue(std::locale::classic());
    out << std::put_time(&date, "%Y%m%d%H%M%S.000000") << std::showpos << std::internal
        << std::setfill('0') << std::setw(4) << zone->minutes;
    return out.str();
}

} // namespace

NvidiaVersion ParseNvidiaVersion(const std::string& text)
{
    NvidiaVersion found;
    static const char kKey[] = "NVRM version:";
    const std::size_t begin = text.find(kKey);
    if (begin == std::string::npos)
        return found;
    std::istringstream line(text.substr(begin, text.find('\n', begin) - begin));
    std::vector<std::string> words;
    for (std::string word; line >> word;)
        words.push_back(word);
    for (std::size_t i = 0; i != words.size(); ++i) {
        if (found.version.empty() && IsVersion(words[i]))
            found.version = words[i];
        if (found.date.empty() && i + 5 <= words.size())
            found.date = DateAt(words, i);
    }
    return found;
}

} // namespace pmutil
