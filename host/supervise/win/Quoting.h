// Arguments on a Windows command line.
#pragma once

#include <string>

namespace assay_host {

// The argument in quotation marks, from which CommandLineToArgvW and the C runtime make exactly the
// argument again. It must hold no zero.
std::wstring Quote(const std::wstring& argument);

} // namespace assay_host
