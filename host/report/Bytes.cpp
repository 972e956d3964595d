#include "report/Bytes.h"

#include <algorithm>
#include <cstdint>
#include <iterator>

#include <boost/nowide/utf/utf.hpp>
#include <fmt/format.h>

namespace assay_host {

namespace {

using Utf8 = boost::nowide::utf::utf_traits<char>;

// Control characters, and format characters that change the direction of writing or are invisible.
bool IsControl(char32_t code)
{
    struct Range {
        char32_t fFirst;
        char32_t fLast;
    };
    constexpr Range kRanges[] = {
        {0x00, 0x1F},     {0x7F, 0x9F},     {0x061C, 0x061C}, {0x200E, 0x200F},
        {0x2028, 0x202E}, {0x2066, 0x2069}, {0xFEFF, 0xFEFF},
    };
    return std::any_of(std::begin(kRanges), std::end(kRanges), [code](const Range& range) {
        return code >= range.fFirst && code <= range.fLast;
    });
}

std::string ShowControl(char32_t code)
{
    switch (code) {
    case '\n':
        return "\\n";
    case '\r':
        return "\\r";
    case '\t':
        return "\\t";
    default:
        break;
    }
    const auto number = static_cast<std::uint32_t>(code);
    return number < 0x80 ? fmt::format("\\x{:02X}", number) : fmt::format("\\u{{{:04X}}}", number);
}

} // namespace

Character ReadCharacter(std::string_view bytes)
{
    using namespace boost::nowide::utf;
    const char* at = bytes.data();
    const code_point code = Utf8::decode(at, at + bytes.size());
    if (code == illegal || code == incomplete)
        return {};
    return {code, static_cast<std::size_t>(at - bytes.data())};
}

void AppendCharacter(std::string& text, char32_t code)
{
    Utf8::encode(code, std::back_inserter(text));
}

std::string ShowBytes(std::string_view bytes)
{
    std::string text;
    while (!bytes.empty()) {
        const Character character = ReadCharacter(bytes);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (character.fSize == 0)
            text += fmt::format("\\x{:02X}", static_cast<unsigned char>(bytes[0]));
        else if (IsControl(character.fCode))
            text += ShowControl(character.fCode);
        else
            text += bytes.substr(0, size);
        bytes.remove_prefix(size);
    }
    return text;
}

std::size_t CountColumns(std::string_view text)
{
    return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), [](char byte) {
        return (static_cast<unsigned char>(byte) & 0xC0) != 0x80;
    }));
}

} // namespace assay_host
