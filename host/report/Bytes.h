// Handles bytes that need not be valid UTF-8, as drivers may return them. Any thread may call.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace assay_host {

struct Character {
    char32_t fCode = 0;
    std::size_t fSize = 0; // in bytes; 0 if there is no well-formed character
};

// Reads the character at the start of the bytes. An overlong form, a surrogate, a code above
// U+10FFFF and a truncated character are not well-formed.
Character ReadCharacter(std::string_view bytes);

// Appends the character as UTF-8. The code must be at most U+10FFFF.
void AppendCharacter(std::string& text, char32_t code);

// Returns the bytes as one line that is safe to write to a terminal. A line end, a control
// character, a character that changes the direction of writing and a byte that isn't UTF-8 are
// escaped: "\n", "\x1B", "\u{202E}", "\xFF".
std::string ShowBytes(std::string_view bytes);

// Returns the number of characters of a text that ShowBytes returned. Wide and combining characters
// count as one column too.
std::size_t CountColumns(std::string_view text);

} // namespace assay_host
