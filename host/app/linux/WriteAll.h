// A write that isn't done before all is written.
#pragma once

#include <string_view>
#include <system_error>

namespace assay_host {

// Waits where the descriptor would have the caller wait, also if it is one that doesn't block.
std::error_code WriteAll(int descriptor, std::string_view text);

} // namespace assay_host
