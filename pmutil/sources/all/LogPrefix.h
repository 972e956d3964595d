// The text in front of each log line.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// "NNNNN.YYYY.MM.DD_HH:MM:SS.mmm(+S.mmm)[tid=T] " for a moment in seconds since 1970-01-01,
// truncated to milliseconds, and the seconds since the line before.
std::string MakeLogPrefix(std::uint32_t lineNumber, double seconds, double delta,
                          const std::string& thread);

} // namespace pmutil
