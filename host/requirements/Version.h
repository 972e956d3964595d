// Versions such as "4.50" or "535.183.01": numbers with points between them.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace assay_host {

// The numbers of a version. Those at the end that are 0 are left out, so that 3 equals 3.0.
using Version = std::vector<std::uint64_t>;

// Reads the first version in a driver's text: that of "OpenCL 1.2 (r3)" is 1.2. Returns nothing for
// a text without a digit, or with a number above 2^64 - 1. Versions compare by the operators of
// Version: 4.50 is above 4.6. Any thread may call.
std::optional<Version> ReadVersion(std::string_view text);

} // namespace assay_host
