#include "report/JsonBytes.h"

#include <algorithm>
#include <string_view>

#include "report/Bytes.h"

namespace assay_host {

namespace {

constexpr char32_t kByteBase = 0xF700;

bool IsByteCharacter(char32_t code)
{
    return code >= kByteBase + 0x80 && code <= kByteBase + 0xFF;
}

// Most texts are plain ASCII, which is the same in both forms.
bool IsPlain(const std::string& bytes)
{
    return std::all_of(bytes.begin(), bytes.end(),
                       [](char byte) { return static_cast<unsigned char>(byte) < 0x80; });
}

} // namespace

std::string EncodeBytes(const std::string& bytes)
{
    if (IsPlain(bytes))
        return bytes;
    std::string text;
    std::string_view rest = bytes;
    while (!rest.empty()) {
        const Character character = ReadCharacter(rest);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (character.fSize > 0 && !IsByteCharacter(character.fCode))
            text += rest.substr(0, size);
        else
            for (const char byte : rest.substr(0, size))
                AppendCharacter(text, kByteBase + static_cast<unsigned char>(byte));
        rest.remove_prefix(size);
    }
    return text;
}

std::string DecodeBytes(const std::string& text)
{
    if (IsPlain(text))
        return text;
    std::string bytes;
    std::string_view rest = text;
    while (!rest.empty()) {
        const Character character = ReadCharacter(rest);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (IsByteCharacter(character.fCode))
            bytes += static_cast<char>(character.fCode - kByteBase);
        else
            bytes += rest.substr(0, size);
        rest.remove_prefix(size);
    }
    return bytes;
}

} // namespace assay_host
