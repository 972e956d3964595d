#include "qgf/qgf_core/linux/Uevent.h"

#include <sstream>

namespace QGF {

std::string UeventValue(const std::string& uevent, const std::string& key)
{
    std::istringstream lines(uevent);
    for (std::string line; std::getline(lines, line);)
        if (line.compare(0, key.size(), key) == 0 && line[key.size()] == '=')
            return line.substr(key.size() + 1);
    return std::string();
}

} // namespace QGF
