// Texts of Windows errors.
#pragma once

#include <string>

namespace QGF {
namespace Core {

// Returns the system's text of a Windows error code and the code, in UTF-8: "Access is denied
// (error 5)"; "error N" if the system has no text.
std::string SystemErrorText(unsigned long error);

// Converts a zero-terminated UTF-16 text to UTF-8.
std::string ToUTF8(const wchar_t* text);

} // namespace Core
} // namespace QGF
