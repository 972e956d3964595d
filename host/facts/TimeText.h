// Formats times for a document. Any thread may call.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace assay_host {

// Returns "2026-11-22T01:26:02Z" for the seconds since 1970 in UTC. Years beyond 9999 are limited
// to 9999, and times before 1970 to 1970.
std::string MakeUtcText(std::int64_t seconds);

// Reads a text of MakeUtcText(). Returns nothing for any other text.
std::optional<std::int64_t> ReadUtcText(std::string_view text);

// Returns "+01:00" or "-09:30" for an offset in minutes. Offsets of a day or more are limited to
// one minute less than a day.
std::string MakeOffsetText(int minutes);

} // namespace assay_host
