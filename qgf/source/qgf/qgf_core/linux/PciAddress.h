// PCI addresses as the kernel writes them: "0000:01:00.0", with a longer domain where it needs one.
#pragma once

#include <string>

namespace QGF {

bool IsPciAddress(const std::string& text);

} // namespace QGF
