// Command-line options of the form -name=value, taken apart in one way for the child that performs
// them and for the host that predicts what they do.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace pmutil {

struct Option {
    std::string fName;
    std::string fValue;
};

// The name and the value of "-name=value"; nothing if there is no hyphen in front or no "=". The
// first "=" counts. A value inside double quotes is without them.
std::optional<Option> SplitOption(const std::string& argument);

// The number at the start of the text, in C's notation: decimal, "0x" hexadecimal or "0" octal.
// Clamped to 32 bits on every platform; 0 if there is none.
std::int32_t ParseInteger(const std::string& text);

} // namespace pmutil
