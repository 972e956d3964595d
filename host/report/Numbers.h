// The numbers of a report's values, whatever the locale.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <variant>
#include <vector>

namespace assay_host {

using Number = std::variant<std::int64_t, double>;

// The whole text as a number that every JSON reader keeps exactly: an integer from -2^53 to 2^53,
// or a number with a fraction or an exponent of which a double loses no digit. Nothing for any
// other text.
std::optional<Number> ReadNumber(std::string_view text);

// "[8, 4]" as numbers; nothing if the text has another form, or holds something else.
std::optional<std::vector<Number>> ReadNumberList(std::string_view text);

std::optional<double> ReadDouble(std::string_view text);
std::optional<std::uint64_t> ReadUnsigned(std::string_view text);

} // namespace assay_host
