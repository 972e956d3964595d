// Writes a whole text.
#pragma once

#include <string_view>
#include <system_error>

namespace assay_host {

// Waits until all is written, also on a non-blocking descriptor. Returns the error.
std::error_code WriteAll(int descriptor, std::string_view text);

} // namespace assay_host
