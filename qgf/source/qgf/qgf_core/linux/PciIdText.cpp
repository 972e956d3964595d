#include "qgf/qgf_core/linux/PciIds.h"

#include <cstdio>
#include <string_view>

namespace QGF {
namespace {

// How a line with that id begins.
std::string BeginningOf(std::uint16_t id)
{
    char text[8];
    std::snprintf(text, sizeof text, "%04x ", unsigned{id});
    return text;
}

// The name in a line "xxxx  name"; empty if the line begins otherwise.
std::string_view NameOf(std::string_view line, std::string_view beginning)
{
    const char* const blanks = " \r";
    if (line.substr(0, beginning.size()) != beginning)
        return std::string_view();
    const std::size_t first = line.find_first_not_of(blanks, beginning.size());
    if (first == std::string_view::npos)
        return std::string_view();
    return line.substr(first, line.find_last_not_of(blanks) - first + 1);
}

} // namespace

// In the database a vendor's line has no indent, a device's line one tab and a subsystem's line
// two; the lines of the device classes, at the end, start with "C ".
std::string FindPciName(const std::string& database, std::uint16_t vendor, std::uint16_t device)
{
    const std::string ofVendor = BeginningOf(vendor);
    const std::string ofDevice = BeginningOf(device);
    std::string_view vendorName;
    std::string_view rest = database;
    while (!rest.empty()) {
        const std::size_t end = rest.find('\n');
        const std::string_view line = rest.substr(0, end);
        rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
        if (line.empty() || line[0] == '#')
            continue;
        if (line[0] != '\t') {
            if (!vendorName.empty())
                break;
            vendorName = NameOf(line, ofVendor);
            continue;
        }
        if (vendorName.empty())
            continue;
        const std::string_view deviceName = NameOf(line.substr(1), ofDevice);
        if (!deviceName.empty())
            return std::string(vendorName).append(" ").append(deviceName);
    }
    return std::string();
}

} // namespace QGF
