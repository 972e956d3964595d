// What the operating system says of a failed call.
#pragma once

#include <string>

namespace QGF {
namespace Core {

// The system's text of a Windows error code and the code itself, in UTF-8: "Access is denied
// (error 5)".
std::string SystemErrorText(unsigned long error);

// A wide text of the system in UTF-8.
std::string ToUTF8(const wchar_t* text);

} // namespace Core
} // namespace QGF
