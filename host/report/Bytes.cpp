#include "report/Bytes.h"

#include <algorithm>
#include <cstdint>

#include <fmt/format.h>

namespace assay_host {

namespace {

// The well-formed byte sequences of UTF-8 (Unicode Standard, table 3-7): the ranges of the first
// and the second byte. The other bytes are 80 to BF.
struct Form {
    unsigned char fFirstLow;
    unsigned char fFirstHigh;
    unsigned char fSize;
    unsigned char fSecondLow;
    unsigned char fSecondHigh;
    unsigned char fFirstBits;
};
constexpr Form kForms[] = {
    {0x00, 0x7F, 1, 0x00, 0x00, 0x7F}, {0xC2, 0xDF, 2, 0x80, 0xBF, 0x1F},
    {0xE0, 0xE0, 3, 0xA0, 0xBF, 0x0F}, {0xE1, 0xEC, 3, 0x80, 0xBF, 0x0F},
    {0xED, 0xED, 3, 0x80, 0x9F, 0x0F}, {0xEE, 0xEF, 3, 0x80, 0xBF, 0x0F},
    {0xF0, 0xF0, 4, 0x90, 0xBF, 0x07}, {0xF1, 0xF3, 4, 0x80, 0xBF, 0x07},
    {0xF4, 0xF4, 4, 0x80, 0x8F, 0x07},
};

unsigned char Byte(std::string_view bytes, std::size_t at)
{
    return static_cast<unsigned char>(bytes[at]);
}

bool IsIn(unsigned char byte, unsigned char low, unsigned char high)
{
    return byte >= low && byte <= high;
}

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
    if (bytes.empty())
        return {};
    const unsigned char first = Byte(bytes, 0);
    for (const Form& form : kForms) {
        if (!IsIn(first, form.fFirstLow, form.fFirstHigh))
            continue;
        if (bytes.size() < form.fSize)
            return {};
        auto code = static_cast<char32_t>(first & form.fFirstBits);
        for (std::size_t at = 1; at < form.fSize; ++at) {
            const unsigned char low = at == 1 ? form.fSecondLow : 0x80;
            const unsigned char high = at == 1 ? form.fSecondHigh : 0xBF;
            if (!IsIn(Byte(bytes, at), low, high))
                return {};
            code = code << 6 | (Byte(bytes, at) & 0x3FU);
        }
        return {code, form.fSize};
    }
    return {};
}

void AppendCharacter(std::string& text, char32_t code)
{
    const auto append = [&text](char32_t byte) { text += static_cast<char>(byte & 0xFF); };
    if (code < 0x80) {
        append(code);
        return;
    }
    if (code < 0x800) {
        append(0xC0 | code >> 6);
    } else {
        if (code < 0x10000) {
            append(0xE0 | code >> 12);
        } else {
            append(0xF0 | code >> 18);
            append(0x80 | (code >> 12 & 0x3F));
        }
        append(0x80 | (code >> 6 & 0x3F));
    }
    append(0x80 | (code & 0x3F));
}

std::string ShowBytes(std::string_view bytes)
{
    std::string text;
    while (!bytes.empty()) {
        const Character character = ReadCharacter(bytes);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (character.fSize == 0)
            text += fmt::format("\\x{:02X}", Byte(bytes, 0));
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
