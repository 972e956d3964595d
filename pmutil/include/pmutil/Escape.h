// Turns characters into printable text and back. One rule for one-byte and two-byte characters,
// used for log lines, adapter names and the value formatter.
#pragma once

#include <string>
#include <string_view>

namespace pmutil {

// Appends the printable form of one character to `out`: "\b", "\t", "\n", "\f", "\r" and "\\" for
// their codes; a backslash and the quote for `quote`; the character itself if its code is below 256
// and isgraph (of the C locale in force) or a blank; else "\x" and exactly 2 * `size` lower-case
// hexadecimal digits. `size` is the character's size in bytes, 1 or 2; another one is a programming
// error and trips an assertion.
void EscapeCharacter(std::string& out, unsigned code, unsigned quote, int size);

// Reads one character back. Advances `position` over what it used, up to `end`, and returns the
// code; 0 at the end of the input. A lone backslash at the end stands for itself, and so does any
// character behind a backslash that has no meaning of its own. After "\x" at most 2 * `size`
// hexadecimal digits of either case are read.
template <typename Char>
unsigned UnescapeCharacter(const Char*& position, const Char* end, int size);

extern template unsigned UnescapeCharacter(const char*& position, const char* end, int size);
extern template unsigned UnescapeCharacter(const char16_t*& position, const char16_t* end,
                                           int size);

// The text inside a quoted string, unescaped. The quotes themselves, at both ends, are taken off;
// a text without them is read as it stands.
std::string UnescapeQuoted(std::string_view quoted);
std::u16string UnescapeQuoted(std::u16string_view quoted);

// A whole text with each character escaped: the bytes of a narrow one (size 1), the code units of a
// wide one (size 2). No quotes are added.
std::string EscapeText(std::string_view text, char quote);
std::string EscapeText(std::u16string_view text, char quote);

} // namespace pmutil
