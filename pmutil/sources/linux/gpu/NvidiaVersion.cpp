#include "linux/gpu/NvidiaVersion.h"

#include <cstdio>
#include <sstream>
#include <vector>

namespace pmutil {
namespace {

const char* const kMonths[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                               "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};

// The zones of the driver's own builders, in minutes east of Greenwich.
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
    int month = 0;
    for (int i = 0; i != 12; ++i)
        if (words[first] == kMonths[i])
            month = i + 1;
    int day = 0;
    int year = 0;
    int hour = 0;
    int minute = 0;
    int second = 0;
    char rest = 0;
    // NOLINTBEGIN(cert-err34-c): widths bound the numbers, and the ranges are checked below.
    const bool complete = std::sscanf(words[first + 1].c_str(), "%2d%c", &day, &rest) == 1 &&
                          std::sscanf(words[first + 2].c_str(), "%2d:%2d:%2d%c", &hour, &minute,
                                      &second, &rest) == 3 &&
                          std::sscanf(words[first + 4].c_str(), "%4d%c", &year, &rest) == 1;
    // NOLINTEND(cert-err34-c)
    if (!complete || month == 0 || day < 1 || day > 31 || hour < 0 || hour > 23 || minute < 0 ||
        minute > 59 || second < 0 || second > 60 || year < 1990)
        return std::string();
    for (const Zone& zone : kZones) {
        if (words[first + 3] == zone.name) {
            char text[80];
            std::snprintf(text, sizeof text, "%04d%02d%02d%02d%02d%02d.000000%+04d", year, month,
                          day, hour, minute, second, zone.minutes);
            return text;
        }
    }
    return std::string();
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
