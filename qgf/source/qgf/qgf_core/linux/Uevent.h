// Parses a device's "uevent" file.
#pragma once

#include <string>

namespace QGF {

// Returns the value of the first line "key=value" in the text of such a file; empty if there is
// none.
std::string UeventValue(const std::string& uevent, const std::string& key);

} // namespace QGF
