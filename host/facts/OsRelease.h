// The file with which a Linux distribution names itself (os-release).
#pragma once

#include <string>
#include <string_view>

namespace assay_host {

// The value of a variable in the text of the file, without its quotes and escapes; empty if it is
// not set. Of a variable that is set twice the last one counts, as in a shell.
std::string FindOsRelease(std::string_view text, std::string_view name);

} // namespace assay_host
