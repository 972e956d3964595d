// Zero-terminated texts of foreign origin, made fit for a log line.
#pragma once

#include <string>

namespace pmutil {

// The text with each character escaped, the double quote as the quote; "<NULL>" for null.
std::string EscapedOrNull(const char* text);
std::string EscapedOrNull(const char16_t* text);

} // namespace pmutil
