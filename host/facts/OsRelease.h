// Reads the file that names a Linux distribution (os-release).
#pragma once

#include <string>
#include <string_view>

namespace assay_host {

// Returns the value of a variable in the text of the file, without its quotes and escapes; empty if
// it isn't set. If it is set twice, the last value counts, as in a shell. Any thread may call.
std::string FindOsRelease(std::string_view text, std::string_view name);

// Returns the build that the text of the file names, or else its version; empty without either. Any
// thread may call.
std::string FindOsBuild(std::string_view text);

// Returns the text of the file below a folder; empty without one. Any thread may call.
std::string ReadOsRelease(const std::string& root);

} // namespace assay_host
