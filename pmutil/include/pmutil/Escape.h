// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Escapes characters as printable text and back, by the same rules for one-byte and two-byte
// characters. Used for log lines, adapter names and the value formatter.
#pragma once

#include <string>
#include <string_view>

namespace pmutil {

// Appends the printable form of one character to `out`: "\b", "\t", "\n", "\f", "\r" and "\\" for
// their codes; a backslash and the quote for `quote`; the character itself if its code is below 256
// and it is a blank or isgraph() in the current C locale; else "\x" and exactly 2 * `size`
// lower-case hexadecimal digits. `size` is the character's size in bytes; it must be 1 or 2, which
// is asserted.
void EscapeCharacter(std::string& out, unsigned code, unsigned quote, int size);

// Unescapes one character: advances `position` past it, at most to `end`, and returns its code; 0
// at the end of the input. After a backslash, a character without a special meaning stands for
// itself, as does a backslash at the end. After "\x", at most 2 * `size` hexadecimal digits of
// either case are read.
template <typename Char>
unsigned UnescapeCharacter(const Char*& position, const Char* end, int size);

extern template unsigned UnescapeCharacter(const char*& position, const char* end, int size);
extern template unsigned UnescapeCharacter(const char16_t*& position, const char16_t* end,
                                           int size);

// Unescapes a text. If it has single or double quotes at both ends, removes them first.
std::string UnescapeQuoted(std::string_view quoted);
std::u16string UnescapeQuoted(std::u16string_view quoted);

// Escapes a text: the bytes of a narrow text (size 1) or the code units of a wide text (size 2).
// Adds no quotes.
std::string EscapeText(std::string_view text, char quote);
std::string EscapeText(std::u16string_view text, char quote);

} // namespace pmutil
