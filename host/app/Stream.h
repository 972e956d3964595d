// This program's own standard streams, byte by byte, without a buffer in between: a write that
// waits for a reader holds no lock that another thread needs to end the process.
#pragma once

#include <string_view>
#include <system_error>

namespace assay_host {

enum class StandardStream { kOutput, kError };

// Writes all of it, waiting for the reader as long as that takes. Gives what went wrong.
std::error_code WriteStream(StandardStream stream, std::string_view text);

} // namespace assay_host
