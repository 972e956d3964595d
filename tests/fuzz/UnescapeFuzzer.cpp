// Checks that unescaping accepts any input and reverses escaping.
#include <cstdint>
#include <string>
#include <string_view>

#include "Require.h"
#include "pmutil/Escape.h"

namespace {

std::u16string Widen(std::string_view text)
{
    return std::u16string(text.begin(), text.end());
}

template <typename Char>
void CheckCharacters(std::basic_string_view<Char> text)
{
    const Char* position = text.data();
    const Char* const end = position + text.size();
    while (position != end) {
        const Char* const before = position;
        const unsigned code = pmutil::UnescapeCharacter(position, end, sizeof(Char));
        Require(position > before && position <= end);
        Require(code < 1U << (8 * sizeof(Char)));
    }
    Require(pmutil::UnescapeCharacter(position, end, sizeof(Char)) == 0);
}

void CheckRoundTrip(std::string_view text)
{
    for (const char quote : {'"', '\''}) {
        const std::string escaped = pmutil::EscapeText(text, quote);
        Require(pmutil::UnescapeQuoted(quote + escaped + quote) == text);
    }
}

void CheckRoundTrip(std::u16string_view text)
{
    for (const char quote : {'"', '\''}) {
        const std::string escaped = pmutil::EscapeText(text, quote);
        Require(pmutil::UnescapeQuoted(Widen(quote + escaped + quote)) == text);
    }
}

template <typename Char>
void Check(std::basic_string_view<Char> text)
{
    CheckCharacters(text);
    Require(pmutil::UnescapeQuoted(text).size() <= text.size());
    CheckRoundTrip(text);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string narrow(data, data + size);
    Check<char>(narrow);
    std::u16string wide;
    for (std::size_t at = 0; at + 1 < size; at += 2)
        wide += static_cast<char16_t>(data[at] | data[at + 1] << 8);
    Check<char16_t>(wide);
    return 0;
}
