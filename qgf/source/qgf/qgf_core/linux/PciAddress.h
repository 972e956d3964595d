// PCI addresses as the kernel prints them: "0000:01:00.0"; the domain has up to 8 digits.
#pragma once

#include <string>

namespace QGF {

bool IsPciAddress(const std::string& text);

} // namespace QGF
