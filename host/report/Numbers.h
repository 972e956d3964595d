// Reads the numbers of a report's values. Independent of the locale; any thread may call.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <variant>
#include <vector>

namespace assay_host {

using Number = std::variant<std::int64_t, double>;

// Reads a number that every JSON reader keeps exactly: an integer from -2^53 to 2^53, or a number
// with a fraction or an exponent whose digits all survive in a double. Returns nothing for any
// other text.
std::optional<Number> ReadNumber(std::string_view text);

// Reads a list such as "[8, 4]" of numbers as ReadNumber accepts them; nothing for any other text.
std::optional<std::vector<Number>> ReadNumberList(std::string_view text);

// Reads a finite number; nothing for any other text, or a number beyond the range of a double.
std::optional<double> ReadDouble(std::string_view text);

// Reads a decimal integer without a sign; nothing for any other text, or a larger number.
std::optional<std::uint64_t> ReadUnsigned(std::string_view text);

} // namespace assay_host
