// Writes a whole text.
#pragma once

#include <windows.h>

#include <string_view>
#include <system_error>

namespace assay_host {

std::error_code WriteAll(HANDLE handle, std::string_view text);

} // namespace assay_host
