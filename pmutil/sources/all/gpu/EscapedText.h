// Escapes zero-terminated texts for log lines.
#pragma once

#include <string>

namespace pmutil {

// Returns the escaped text, with the double quote as the quote character; "<NULL>" for null.
std::string EscapedOrNull(const char* text);
std::string EscapedOrNull(const char16_t* text);

} // namespace pmutil
