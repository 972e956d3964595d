// The prefix of log lines.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// Returns "NNNNN.YYYY.MM.DD_HH:MM:SS.mmm(+S.mmm)[tid=T] ". `seconds` is the time since 1970-01-01
// UTC, printed truncated to milliseconds; `delta` is the time in seconds since the previous line.
std::string MakeLogPrefix(std::uint32_t lineNumber, double seconds, double delta,
                          const std::string& thread);

} // namespace pmutil
