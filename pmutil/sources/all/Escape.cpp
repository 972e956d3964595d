#include "pmutil/Escape.h"

#include <algorithm>
#include <cctype>
#include <type_traits>

#include <boost/assert.hpp>

namespace pmutil {

namespace {

struct ShortForm {
    unsigned code;
    char letter;
};

// For both directions. Reading doesn't need the entry of the backslash, which stands for itself.
constexpr ShortForm kShortForms[] = {{8, 'b'},  {9, 't'},  {10, 'n'},
                                     {12, 'f'}, {13, 'r'}, {'\\', '\\'}};

constexpr char kDigits[] = "0123456789abcdef";

template <typename Char>
unsigned CodeOf(Char character)
{
    return static_cast<std::make_unsigned_t<Char>>(character);
}

// The value of a hexadecimal digit of either case; -1 for anything else.
int DigitValue(unsigned code)
{
    if (code >= '0' && code <= '9')
        return static_cast<int>(code - '0');
    if (code >= 'a' && code <= 'f')
        return static_cast<int>(code - 'a') + 10;
    if (code >= 'A' && code <= 'F')
        return static_cast<int>(code - 'A') + 10;
    return -1;
}

// Returns true for printable ASCII that needs no escape, which is graphic in all locales. This
// avoids isgraph() for most characters.
bool IsPlain(unsigned code, unsigned quote)
{
    return code >= 0x20 && code <= 0x7e && code != '\\' && code != quote;
}

template <typename Char>
std::string EscapeAll(std::basic_string_view<Char> text, char quote)
{
    const unsigned quoteCode = CodeOf(quote);
    std::string out;
    out.reserve(text.size());
    for (auto at = text.begin(); at != text.end();) {
        const auto plainEnd = std::find_if_not(
            at, text.end(), [&](Char character) { return IsPlain(CodeOf(character), quoteCode); });
        out.append(at, plainEnd);
        at = plainEnd;
        if (at != text.end())
            EscapeCharacter(out, CodeOf(*at++), quoteCode, sizeof(Char));
    }
    return out;
}

// Returns whether the text's last character is a quote that isn't escaped by a backslash.
template <typename Char>
bool EndsWithBareQuote(std::basic_string_view<Char> text, Char quote)
{
    if (text.empty() || text.back() != quote)
        return false;
    const auto before = text.substr(0, text.size() - 1);
    const auto lastOther = before.find_last_not_of(Char('\\'));
    const auto backslashes = before.size() - (lastOther == before.npos ? 0 : lastOther + 1);
    return backslashes % 2 == 0;
}

template <typename Char>
std::basic_string<Char> UnescapeAll(std::basic_string_view<Char> text)
{
    if (!text.empty() && (text.front() == Char('"') || text.front() == Char('\'')) &&
        EndsWithBareQuote(text.substr(1), text.front()))
        text = text.substr(1, text.size() - 2);
    std::basic_string<Char> out;
    out.reserve(text.size());
    const Char* position = text.data();
    const Char* const end = position + text.size();
    while (position != end)
        out += static_cast<Char>(UnescapeCharacter(position, end, sizeof(Char)));
    return out;
}

} // namespace

void EscapeCharacter(std::string& out, unsigned code, unsigned quote, int size)
{
    BOOST_ASSERT(size == 1 || size == 2);
    if (IsPlain(code, quote)) {
        out += static_cast<char>(code);
        return;
    }
    for (const ShortForm& form : kShortForms) {
        if (code == form.code) {
            out += '\\';
            out += form.letter;
            return;
        }
    }
    if (code == quote) {
        out += '\\';
        out += static_cast<char>(quote);
    } else if (code < 256 && (code == ' ' || std::isgraph(static_cast<int>(code)) != 0)) {
        out += static_cast<char>(code);
    } else {
        out += "\\x";
        for (int digit = 2 * size - 1; digit >= 0; --digit)
            out += kDigits[code >> (4 * digit) & 0xf];
    }
}

template <typename Char>
unsigned UnescapeCharacter(const Char*& position, const Char* end, int size)
{
    BOOST_ASSERT(size == 1 || size == 2);
    if (position == end)
        return 0;
    const unsigned first = CodeOf(*position++);
    if (first != '\\' || position == end)
        return first;
    const unsigned second = CodeOf(*position++);
    if (second == 'x') {
        unsigned code = 0;
        for (int digits = 0; digits < 2 * size && position != end; ++digits) {
            const int value = DigitValue(CodeOf(*position));
            if (value < 0)
                break;
            code = 16 * code + static_cast<unsigned>(value);
            ++position;
        }
        return code;
    }
    for (const ShortForm& form : kShortForms)
        if (second == CodeOf(form.letter))
            return form.code;
    return second;
}

template unsigned UnescapeCharacter(const char*& position, const char* end, int size);
template unsigned UnescapeCharacter(const char16_t*& position, const char16_t* end, int size);

std::string UnescapeQuoted(std::string_view quoted)
{
    return UnescapeAll(quoted);
}

std::u16string UnescapeQuoted(std::u16string_view quoted)
{
    return UnescapeAll(quoted);
}

std::string EscapeText(std::string_view text, char quote)
{
    return EscapeAll(text, quote);
}

std::string EscapeText(std::u16string_view text, char quote)
{
    return EscapeAll(text, quote);
}

} // namespace pmutil
