// Writes a text to a file descriptor.
#pragma once

#include <string_view>
#include <system_error>

namespace assay_host {

// Writes all of the text. Blocks until it is written, also on a non-blocking descriptor. Returns
// the system's error, or none.
std::error_code WriteAll(int descriptor, std::string_view text);

} // namespace assay_host
