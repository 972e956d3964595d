#include "linux/gpu/SystemNumbers.h"

#include <charconv>
#include <limits>

#include "qgf/SystemFiles.h"

namespace pmutil {

bool ParseSystemNumber(const std::string& line, std::uint64_t& number)
{
    const bool hexadecimal = line.compare(0, 2, "0x") == 0;
    const char* const begin = line.data() + (hexadecimal ? 2 : 0);
    const char* const end = line.data() + line.size();
    std::uint64_t parsed = 0;
    const std::from_chars_result result =
        std::from_chars(begin, end, parsed, hexadecimal ? 16 : 10);
    if (result.ec != std::errc() || result.ptr != end)
        return false;
    number = parsed;
    return true;
}

bool ReadSystemNumber(const std::string& path, std::uint64_t& number)
{
    return ParseSystemNumber(QGF::ReadSystemLine(path), number);
}

bool ParseMemoryTotal(const std::string& meminfo, std::uint64_t& bytes)
{
    static const char kKey[] = "MemTotal:";
    static const char kUnit[] = " kB";
    std::size_t begin = 0;
    while (begin < meminfo.size()) {
        const std::size_t end = std::min(meminfo.find('\n', begin), meminfo.size());
        const std::string line = meminfo.substr(begin, end - begin);
        begin = end + 1;
        if (line.compare(0, sizeof kKey - 1, kKey) != 0)
            continue;
        const std::size_t first = line.find_first_not_of(' ', sizeof kKey - 1);
        const std::size_t unit = line.rfind(kUnit);
        std::uint64_t kilobytes = 0;
        if (first == std::string::npos || unit == std::string::npos || unit < first ||
            !ParseSystemNumber(line.substr(first, unit - first), kilobytes) ||
            kilobytes > std::numeric_limits<std::uint64_t>::max() / 1024)
            return false;
        bytes = kilobytes * 1024;
        return true;
    }
    return false;
}

} // namespace pmutil
