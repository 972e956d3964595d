// Writes a text to a handle.
#pragma once

#include <windows.h>

#include <string_view>
#include <system_error>

namespace assay_host {

// Writes all of the text. Blocks until it is written. Returns the system's error, or none.
std::error_code WriteAll(HANDLE handle, std::string_view text);

} // namespace assay_host
