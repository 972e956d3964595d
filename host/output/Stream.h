// This program's own standard streams without a buffer: a write that waits for a reader holds no
// lock that another thread needs to end the process.
#pragma once

#include <string_view>
#include <system_error>

namespace assay_host {

enum class StandardStream { kOutput, kError };

// Writes all of it, and waits for the reader without limit. Returns the error.
std::error_code WriteStream(StandardStream stream, std::string_view text);

} // namespace assay_host
