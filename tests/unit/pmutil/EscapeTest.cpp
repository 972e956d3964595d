#include "pmutil/Escape.h"

#include <cctype>
#include <clocale>
#include <cstdlib>

#include <gtest/gtest.h>

namespace pmutil {
namespace {

std::string Escaped(unsigned code, unsigned quote, int size)
{
    std::string out = "<";
    EscapeCharacter(out, code, quote, size);
    return out.substr(1);
}

TEST(EscapeTest, ShortForms)
{
    const struct {
        unsigned code;
        const char* text;
    } kCases[] = {{8, "\\b"}, {9, "\\t"}, {10, "\\n"}, {12, "\\f"}, {13, "\\r"}, {92, "\\\\"}};
    for (const auto& test : kCases) {
        EXPECT_EQ(Escaped(test.code, '"', 1), test.text);
        EXPECT_EQ(Escaped(test.code, '"', 2), test.text);
    }
}

TEST(EscapeTest, TheQuoteGivenIsEscapedAndAnotherStandsForItself)
{
    EXPECT_EQ(Escaped('"', '"', 1), "\\\"");
    EXPECT_EQ(Escaped('\'', '\'', 2), "\\'");
    EXPECT_EQ(Escaped('\'', '"', 1), "'");
    EXPECT_EQ(Escaped('"', '\'', 2), "\"");
}

TEST(EscapeTest, BackslashAsTheQuoteIsWrittenOnce)
{
    EXPECT_EQ(Escaped('\\', '\\', 1), "\\\\");
}

TEST(EscapeTest, GraphicCharactersAndTheBlankStandForThemselves)
{
    for (unsigned code = 0x20; code < 0x7f; ++code) {
        if (code == '\\' || code == '"')
            continue;
        EXPECT_EQ(Escaped(code, '"', 1), std::string(1, static_cast<char>(code)));
        EXPECT_EQ(Escaped(code, '"', 2), std::string(1, static_cast<char>(code)));
    }
}

TEST(EscapeTest, OtherCodesAreHexadecimalOfTwiceTheSize)
{
    EXPECT_EQ(Escaped(0, '"', 1), "\\x00");
    EXPECT_EQ(Escaped(7, '"', 1), "\\x07");
    EXPECT_EQ(Escaped(11, '"', 1), "\\x0b");
    EXPECT_EQ(Escaped(127, '"', 1), "\\x7f");
    EXPECT_EQ(Escaped(127, '"', 2), "\\x007f");
    EXPECT_EQ(Escaped(0x1234, '"', 2), "\\x1234");
    EXPECT_EQ(Escaped(0xABCD, '"', 2), "\\xabcd");
    EXPECT_EQ(Escaped(0x100, '"', 2), "\\x0100");
}

TEST(EscapeTest, HighBytesFollowTheLocalesIsgraph)
{
    if (std::isgraph(200) != 0)
        GTEST_SKIP() << "code 200 is graphic in the locale in force";
    EXPECT_EQ(Escaped(200, '"', 1), "\\xc8");
    EXPECT_EQ(Escaped(200, '"', 2), "\\x00c8");
}

// Sets a locale of the C library, the first that exists, until it is destroyed.
class Latin1 {
public:
    Latin1()
    {
#ifdef ASSAY_TEST_LOCALES // a folder with locales that the build made
        ::setenv("LOCPATH", ASSAY_TEST_LOCALES, 1);
#endif
        for (const char* const name : {"en_US.ISO-8859-1", "de_DE.ISO-8859-1", ".1252"})
            fIsSet = fIsSet || std::setlocale(LC_CTYPE, name) != nullptr;
#ifdef ASSAY_TEST_LOCALES
        ::unsetenv("LOCPATH");
#endif
    }
    ~Latin1()
    {
        std::setlocale(LC_CTYPE, fBefore.c_str());
    }
    Latin1(const Latin1&) = delete;
    Latin1& operator=(const Latin1&) = delete;

    bool IsSet() const
    {
        return fIsSet;
    }

private:
    const std::string fBefore = std::setlocale(LC_CTYPE, nullptr);
    bool fIsSet = false;
};

TEST(EscapeTest, HighBytesThatALocaleTakesForGraphicStandForThemselves)
{
    const Latin1 locale;
    if (!locale.IsSet())
        GTEST_SKIP()
            << "this machine has no locale of 8-bit characters, and no localedef and charmaps "
               "to make one";
    ASSERT_NE(std::isgraph(0xE9), 0);
    EXPECT_EQ(Escaped(0xE9, '"', 1), "\xE9");
    EXPECT_EQ(Escaped(0xE9, '"', 2), "\xE9");
    EXPECT_EQ(Escaped(0x1E9, '"', 2), "\\x01e9");
    EXPECT_EQ(Escaped(0x85, '"', 1), std::isgraph(0x85) != 0 ? "\x85" : "\\x85");
}

TEST(EscapeDeathTest, SizeOtherThan1Or2IsAProgrammingError)
{
    testing::GTEST_FLAG(death_test_style) = "threadsafe";
    EXPECT_DEATH(Escaped('a', '"', 0), "size == 1");
    EXPECT_DEATH(Escaped('a', '"', 4), "size == 1");
    const char text[] = "a";
    EXPECT_DEATH(
        {
            const char* position = text;
            UnescapeCharacter(position, text + 1, 3);
        },
        "size == 1");
}

// Unescapes one character, and returns the rest too.
template <typename Char>
std::pair<unsigned, std::size_t> Unescaped(std::basic_string_view<Char> text, int size)
{
    const Char* position = text.data();
    const Char* const end = position + text.size();
    const unsigned code = UnescapeCharacter(position, end, size);
    return {code, static_cast<std::size_t>(end - position)};
}

using Result = std::pair<unsigned, std::size_t>;

TEST(UnescapeTest, OneCharacter)
{
    const struct {
        std::string_view text;
        int size;
        Result result;
    } kCases[] = {
        {"", 1, {0, 0}},
        {"a", 1, {'a', 0}},
        {"ab", 1, {'a', 1}},
        {"\xC8", 1, {200, 0}},
        {"\\", 1, {'\\', 0}}, // alone at the end
        {"\\b", 1, {8, 0}},
        {"\\f", 1, {12, 0}},
        {"\\n", 1, {10, 0}},
        {"\\r", 1, {13, 0}},
        {"\\t", 1, {9, 0}},
        {"\\\\", 1, {'\\', 0}},
        {"\\\"", 1, {'"', 0}},
        {"\\'", 1, {'\'', 0}},
        {"\\q", 1, {'q', 0}},
        {"\\X41", 1, {'X', 2}},
        {"\\x7f", 1, {0x7f, 0}},
        {"\\x7F", 1, {0x7f, 0}},
        {"\\xAb1", 1, {0xab, 1}},
        {"\\x4", 1, {4, 0}},
        {"\\x4g", 1, {4, 1}},
        {"\\x", 1, {0, 0}},
        {"\\xg", 1, {0, 1}},
        {"\\x1234", 2, {0x1234, 0}},
        {"\\x12345", 2, {0x1234, 1}},
        {"\\x12z", 2, {0x12, 1}},
    };
    for (const auto& test : kCases)
        EXPECT_EQ(Unescaped(test.text, test.size), test.result) << test.text;
}

TEST(UnescapeTest, OneWideCharacter)
{
    EXPECT_EQ(Unescaped<char16_t>(u"", 2), Result(0, 0));
    EXPECT_EQ(Unescaped<char16_t>(u"\u1234x", 2), Result(0x1234, 1));
    EXPECT_EQ(Unescaped<char16_t>(u"\\x00e9x", 2), Result(0xe9, 1));
    EXPECT_EQ(Unescaped<char16_t>(u"\\n", 2), Result(10, 0));
    EXPECT_EQ(Unescaped<char16_t>(u"\\\u1234", 2), Result(0x1234, 0));
    EXPECT_EQ(Unescaped<char16_t>(u"\\", 2), Result('\\', 0));
    // A code unit whose low byte is a digit is not a digit.
    EXPECT_EQ(Unescaped<char16_t>(u"\\x4\u0131", 2), Result(4, 1));
}

TEST(UnescapeTest, WholeQuotedText)
{
    EXPECT_EQ(UnescapeQuoted("\"a\\tb\\x21\""), "a\tb!");
    EXPECT_EQ(UnescapeQuoted("'a\\'b'"), "a'b");
    EXPECT_EQ(UnescapeQuoted("\"\""), "");
    EXPECT_EQ(UnescapeQuoted(""), "");
    EXPECT_EQ(UnescapeQuoted(u"\"a\\x1234\""), u"a\u1234");
    EXPECT_EQ(UnescapeQuoted(std::string_view("\"a\\x00b\"")), std::string("a\0b", 3));
}

TEST(UnescapeTest, TextWithoutQuotesAtBothEndsIsReadAsItStands)
{
    EXPECT_EQ(UnescapeQuoted("a\\nb"), "a\nb");
    EXPECT_EQ(UnescapeQuoted("\""), "\"");
    EXPECT_EQ(UnescapeQuoted("\"a"), "\"a");
    EXPECT_EQ(UnescapeQuoted("a\""), "a\"");
    EXPECT_EQ(UnescapeQuoted("\"a'"), "\"a'");
    EXPECT_EQ(UnescapeQuoted("\"a\\\""), "\"a\""); // the last quote is escaped
    EXPECT_EQ(UnescapeQuoted("\"a\\\\\""), "a\\");
    EXPECT_EQ(UnescapeQuoted("a\\"), "a\\");
}

TEST(EscapeTest, EveryByteComesBack)
{
    std::string all;
    for (int code = 0; code < 256; ++code)
        all += static_cast<char>(code);
    all += "f\\x41"; // digits after an escaped byte, and an escape as text
    for (const char quote : {'"', '\''})
        EXPECT_EQ(UnescapeQuoted(quote + EscapeText(all, quote) + quote), all);
}

TEST(EscapeTest, EveryCodeUnitComesBack)
{
    std::u16string all;
    for (unsigned code = 0; code < 0x10000; ++code)
        all += static_cast<char16_t>(code);
    const std::string escaped = '"' + EscapeText(all, '"') + '"';
    EXPECT_EQ(UnescapeQuoted(std::u16string(escaped.begin(), escaped.end())), all);
}

TEST(EscapeTest, WholeTexts)
{
    EXPECT_EQ(EscapeText(std::string_view("a\"b\n"), '"'), "a\\\"b\\n");
    EXPECT_EQ(EscapeText(std::u16string_view(u"Caf\u00e9 \u1234"), '"'),
              std::isgraph(0xe9) != 0 ? "Caf\xe9 \\x1234" : "Caf\\x00e9 \\x1234");
    EXPECT_EQ(EscapeText(std::string_view(), '"'), "");
    const std::string longText(100000, 'x');
    EXPECT_EQ(EscapeText(longText, '"'), longText);
}

} // namespace
} // namespace pmutil
