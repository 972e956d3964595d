#include <gtest/gtest.h>

#include <string>

#include "report/Bytes.h"

namespace assay_host {
namespace {

TEST(Bytes, ReadEachWellFormedCharacter)
{
    for (char32_t code = 0; code <= 0x10FFFF; ++code) {
        if (code >= 0xD800 && code <= 0xDFFF)
            continue;
        std::string text;
        AppendCharacter(text, code);
        const Character character = ReadCharacter(text + "x");
        ASSERT_EQ(character.fCode, code);
        ASSERT_EQ(character.fSize, text.size());
        for (std::size_t size = 0; size < text.size(); ++size)
            ASSERT_EQ(ReadCharacter(text.substr(0, size)).fSize, 0U) << code;
    }
}

TEST(Bytes, RejectMalformedCharacters)
{
    for (const char* bytes :
         {"\x80", "\xBF", "\xC0\x80", "\xC1\xBF", "\xC2\x7F", "\xC2\xC0", "\xE0\x9F\xBF",
          "\xE1\x80\x7F", "\xED\xA0\x80", "\xED\xBF\xBF", "\xF0\x8F\xBF\xBF", "\xF4\x90\x80\x80",
          "\xF5\x80\x80\x80", "\xFE", "\xFF", "\xF0\x90\x80\x7F"})
        EXPECT_EQ(ReadCharacter(bytes).fSize, 0U) << bytes;
}

TEST(Bytes, EscapeWhatControlsATerminal)
{
    EXPECT_EQ(ShowBytes("plain \"text\" \\ \xC3\xA9 \xE4\xB8\xAD \xF0\x9F\x98\x80"),
              "plain \"text\" \\ \xC3\xA9 \xE4\xB8\xAD \xF0\x9F\x98\x80");
    EXPECT_EQ(ShowBytes(std::string("\0\x1B[31m\n\r\t\x7F", 10)), "\\x00\\x1B[31m\\n\\r\\t\\x7F");
    EXPECT_EQ(ShowBytes("\xC2\x9B"
                        "1m\xE2\x80\xAE"
                        "abc"),
              "\\u{009B}1m\\u{202E}abc");
    EXPECT_EQ(ShowBytes("a\xFF\xC3(\xED\xA0\x80"), "a\\xFF\\xC3(\\xED\\xA0\\x80");
    for (int byte = 0; byte < 256; ++byte) {
        const std::string shown = ShowBytes(std::string(1, static_cast<char>(byte)));
        for (const char character : shown)
            EXPECT_TRUE(character >= ' ' && character <= '~') << byte;
    }
}

TEST(Bytes, EscapeEachRangeToItsLimits)
{
    constexpr char32_t kRanges[][2] = {
        {0x00, 0x1F},     {0x7F, 0x9F},     {0x061C, 0x061C}, {0x200E, 0x200F},
        {0x2028, 0x202E}, {0x2066, 0x2069}, {0xFEFF, 0xFEFF},
    };
    const auto isShown = [](char32_t code) {
        std::string text;
        AppendCharacter(text, code);
        return ShowBytes(text) == text;
    };
    for (const auto& [first, last] : kRanges) {
        if (first > 0)
            EXPECT_TRUE(isShown(first - 1)) << first;
        EXPECT_FALSE(isShown(first)) << first;
        EXPECT_FALSE(isShown(last)) << last;
        EXPECT_TRUE(isShown(last + 1)) << last;
    }
    EXPECT_EQ(ShowBytes("\xC2\x80"), "\\u{0080}");
}

TEST(Bytes, CountOneColumnForEachCharacter)
{
    EXPECT_EQ(CountColumns(""), 0U);
    EXPECT_EQ(CountColumns("abc"), 3U);
    EXPECT_EQ(CountColumns("\xC3\xA9\xE4\xB8\xAD\xF0\x9F\x98\x80"), 3U);
}

} // namespace
} // namespace assay_host
