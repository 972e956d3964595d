// Writes to this program's standard streams without the C library's buffers: a write that blocks
// holds no lock that another thread needs to end the process.
#pragma once

#include <string_view>
#include <system_error>

namespace assay_host {

enum class StandardStream { kOutput, kError };

// Writes all of the text. Blocks as long as the reader doesn't read. Returns the system's error, or
// none. Any thread may call.
std::error_code WriteStream(StandardStream stream, std::string_view text);

} // namespace assay_host
