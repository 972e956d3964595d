// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Parses command-line options of the form -name=value, for the child that performs them and for the
// host that predicts their effect.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace pmutil {

struct Option {
    std::string fName;
    std::string fValue;
};

// Splits "-name=value" at the first "=". Returns nothing without a leading hyphen or without "=".
// Removes double quotes around the value.
std::optional<Option> SplitOption(const std::string& argument);

// Parses the integer at the start of the text: decimal, hexadecimal with "0x" or octal with "0".
// Clamps it to 32 bits. Returns 0 if the text doesn't start with a number.
std::int32_t ParseInteger(const std::string& text);

} // namespace pmutil
