#include "qgf/qgf_core/linux/PciIds.h"

#include <string_view>

namespace QGF {
namespace {

// The name in a line "xxxx  name"; empty if the line's id isn't `id`.
std::string_view NameOf(std::string_view line, const char (&id)[5])
{
    if (line.substr(0, 4) != std::string_view(id, 4) || line.size() < 6 || line[4] != ' ')
        return std::string_view();
    line.remove_prefix(line.find_first_not_of(' ', 4) == std::string_view::npos
                           ? line.size()
                           : line.find_first_not_of(' ', 4));
    while (!line.empty() && (line.back() == ' ' || line.back() == '\r'))
        line.remove_suffix(1);
    return line;
}

void WriteId(std::uint16_t id, char (&text)[5])
{
    static const char kDigits[] = "0123456789abcdef";
    for (int i = 3; i >= 0; --i) {
        text[i] = kDigits[id & 0xF];
        id = static_cast<std::uint16_t>(id >> 4);
    }
    text[4] = '\0';
}

} // namespace

// In the database a vendor's line has no indent, a device's line one tab and a subsystem's line
// two; the lines of the device classes, at the end, start with "C ".
std::string FindPciName(const std::string& database, std::uint16_t vendor, std::uint16_t device)
{
    char vendorId[5];
    char deviceId[5];
    WriteId(vendor, vendorId);
    WriteId(device, deviceId);
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
            vendorName = NameOf(line, vendorId);
            continue;
        }
        if (vendorName.empty() || line.size() < 2 || line[1] == '\t')
            continue;
        const std::string_view deviceName = NameOf(line.substr(1), deviceId);
        if (!deviceName.empty())
            return std::string(vendorName).append(" ").append(deviceName);
    }
    return std::string();
}

} // namespace QGF
