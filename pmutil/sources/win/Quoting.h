// Quotes arguments for a Windows command line. Any thread may call.
#pragma once

#include <string>

namespace pmutil {

// Returns the argument in quotation marks, so that CommandLineToArgvW and the C runtime parse it
// back unchanged. It must not contain zeros.
std::wstring Quote(const std::wstring& argument);

} // namespace pmutil
