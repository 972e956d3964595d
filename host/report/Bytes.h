// Bytes of drivers that may be no text at all, as UTF-8 goes.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace assay_host {

// The character that well-formed UTF-8 has at the start of the bytes. Its size is 0 where there is
// none: an overlong form, a surrogate, a number above U+10FFFF, a character that breaks off.
struct Character {
    char32_t fCode = 0;
    std::size_t fSize = 0;
};
Character ReadCharacter(std::string_view bytes);

void AppendCharacter(std::string& text, char32_t code);

// The bytes on one line for a terminal: a line end, a control character, one that turns the
// direction of writing, or a byte that is no UTF-8 shows as "\n", "\u{202E}", "\xFF". With it no
// driver steers the terminal.
std::string ShowBytes(std::string_view bytes);

// How many columns a text of ShowBytes takes, a column a character.
std::size_t CountColumns(std::string_view text);

} // namespace assay_host
