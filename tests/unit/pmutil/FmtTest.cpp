#include "pmutil/Fmt.h"

#include <algorithm>
#include <climits>
#include <gtest/gtest.h>
#include <iterator>
#include <memory>
#include <new>

using pmutil::Fmt;

namespace {

template <typename T>
std::string Text(T value)
{
    std::string text = "earlier";
    Fmt::ToText(text, value);
    return text;
}

template <typename T, typename F>
std::string Text(T value, F format)
{
    std::string text = "earlier";
    Fmt::ToText(text, value, format);
    return text;
}

std::string CodeText(std::uint32_t code)
{
    std::string text = "earlier";
    Fmt::CodeToText(text, code);
    return text;
}

TEST(Fmt, Bool)
{
    EXPECT_EQ(Text(false), "false");
    EXPECT_EQ(Text(true), "true");
    EXPECT_EQ(Text(true, Fmt::GetBoolFormat()), "true");
    EXPECT_EQ(std::string(Fmt::GetBoolFormat()), "false");
}

TEST(Fmt, BoolWithEachConstant)
{
    EXPECT_EQ(Text(false, pmutil::kFormatNoYes), "No");
    EXPECT_EQ(Text(true, pmutil::kFormatNoYes), "Yes");
    EXPECT_EQ(Text(false, pmutil::kFormatNOYES), "NO");
    EXPECT_EQ(Text(true, pmutil::kFormatNOYES), "YES");
    EXPECT_EQ(Text(false, pmutil::kFormatnoyes), "no");
    EXPECT_EQ(Text(true, pmutil::kFormatnoyes), "yes");
    EXPECT_EQ(Text(false, pmutil::kFormatFalseTrue), "False");
    EXPECT_EQ(Text(true, pmutil::kFormatFalseTrue), "True");
    EXPECT_EQ(Text(false, pmutil::kFormatfalsetrue), "false");
    EXPECT_EQ(Text(true, pmutil::kFormatfalsetrue), "true");
}

TEST(Fmt, Char)
{
    EXPECT_EQ(Text('a'), "'a'");
    EXPECT_EQ(Text('\n'), "'\\n'");
    EXPECT_EQ(Text('\''), "'\\''");
    EXPECT_EQ(Text('"'), "'\"'");
    EXPECT_EQ(Text('\0'), "'\\x00'");
    EXPECT_EQ(Text('\x7f'), "'\\x7f'");
}

TEST(Fmt, CharWithAFunctionOfItsOwn)
{
    const Fmt::CharFormat format = [](std::string& out, char value, char quote) {
        out += quote;
        out += quote;
        out += value;
    };
    EXPECT_EQ(Text('a', format), "''a");
}

TEST(Fmt, SignedIntegers)
{
    EXPECT_EQ(Text(static_cast<signed char>(-128)), "-128");
    EXPECT_EQ(Text(static_cast<short>(-32768)), "-32768");
    EXPECT_EQ(Text(INT_MIN), "-2147483648");
    EXPECT_EQ(Text(INT_MAX), "2147483647");
    EXPECT_EQ(Text(-1L), "-1");
    EXPECT_EQ(Text(LLONG_MIN), "-9223372036854775808");
    EXPECT_EQ(Text(0), "0");
}

TEST(Fmt, UnsignedIntegersAreBitPatterns)
{
    EXPECT_EQ(Text(static_cast<unsigned char>(10)), "0x0a");
    EXPECT_EQ(Text(static_cast<unsigned short>(10)), "0x000a");
    EXPECT_EQ(Text(10U), "0x0000000a");
    EXPECT_EQ(Text(0xFFFFFFFFU), "0xffffffff");
    EXPECT_EQ(Text(0x0123456789ABCDEFULL), "0x0123456789abcdef");
    EXPECT_EQ(Text(0ULL), "0x0000000000000000");
}

TEST(Fmt, UnsignedLongHasAWidthOfFourBytesOnEveryPlatform)
{
    EXPECT_STREQ(Fmt::GetULongFormat(), "0x%08lx");
    EXPECT_EQ(Text(10UL), "0x0000000a");
    if constexpr (sizeof(unsigned long) == 8)
        EXPECT_EQ(Text(static_cast<unsigned long>(0x1234567890ULL)), "0x1234567890");
}

TEST(Fmt, FloatingPoint)
{
    EXPECT_EQ(Text(1.5F), "1.50");
    EXPECT_EQ(Text(-2.125), "-2.12");
    EXPECT_EQ(Text(1e300).size(), 304U) << "longer than any stack buffer's short forms";
}

TEST(Fmt, TextsBeyondTheUsualLength)
{
    for (const int width : {254, 255, 256, 257}) {
        const std::string format = "%0" + std::to_string(width) + "d";
        EXPECT_EQ(Text(7, format.c_str()),
                  std::string(static_cast<std::size_t>(width) - 1, '0') + "7");
    }
    EXPECT_EQ(Text(7, "%0400d"), std::string(399, '0') + "7");
    const std::string longText(1000, 'x');
    EXPECT_EQ(Text(longText.c_str()), '"' + longText + '"');
    EXPECT_EQ(Text(longText.c_str(), "<%s>"), '<' + longText + '>');
}

TEST(Fmt, CString)
{
    EXPECT_EQ(Text("abc"), "\"abc\"");
    EXPECT_EQ(Text(""), "\"\"");
    EXPECT_EQ(Text("a\"b"), "\"a\\\"b\"");
    EXPECT_EQ(Text("a'b"), "\"a'b\"");
    EXPECT_EQ(Text("a\tb\x01"), "\"a\\tb\\x01\"");
    EXPECT_EQ(Text("~\x7F \\"), "\"~\\x7f \\\\\"");
    const char* const null = nullptr;
    EXPECT_EQ(Text(null), "<NULL>");
    EXPECT_EQ(Text(null, "[%s]"), "<NULL>");
}

TEST(Fmt, CStringIsEscapedBeforeItIsPrinted)
{
    EXPECT_EQ(Text("a\"b", "[%s]"), "[a\\\"b]");
    EXPECT_EQ(Text("\n", "%5s"), "   \\n");
    EXPECT_EQ(Text("100%d", "%s"), "100%d");
}

TEST(Fmt, Pointer)
{
    int object = 0;
    char expected[32];
    std::snprintf(expected, sizeof expected, "0x%016llx",
                  static_cast<unsigned long long>(reinterpret_cast<std::uintptr_t>(&object)));
    EXPECT_EQ(Text(static_cast<const void*>(&object)), expected);
    EXPECT_EQ(Text(static_cast<const void*>(nullptr)), "0x0000000000000000");
    EXPECT_EQ(Text(reinterpret_cast<const void*>(std::uintptr_t{10}), "%llu"), "10");
    std::snprintf(expected, sizeof expected, "%p", static_cast<void*>(&object));
    EXPECT_EQ(Text(static_cast<const void*>(&object), "%p"), expected);
    EXPECT_EQ(Text(static_cast<const void*>(&object), "100%%, %p"),
              std::string("100%, ") + expected);
}

TEST(Fmt, PlatformsDefaultForPointersServesFormattersMadeLater)
{
    EXPECT_STREQ(Fmt::GetPointerFormat(), Fmt::GetULongLongFormat());
    Fmt earlier;
    Fmt::SetPlatformPointerFormat("%llx");
    Fmt later;
    Fmt::SetPlatformPointerFormat(nullptr);
    std::string text;
    const auto* const pointer = reinterpret_cast<const void*>(std::uintptr_t{255});
    later.Format(text, pointer);
    EXPECT_EQ(text, "ff");
    earlier.Format(text, pointer);
    EXPECT_EQ(text, "0x00000000000000ff");
}

TEST(Fmt, AFormatPerCallReplacesTheDefault)
{
    EXPECT_EQ(Text(static_cast<signed char>(-1), "%04d"), "-001");
    EXPECT_EQ(Text(static_cast<unsigned char>(255), "%d"), "255");
    EXPECT_EQ(Text(static_cast<short>(-1), "%x"), "ffffffff") << "sign-extended to 32 bits";
    EXPECT_EQ(Text(static_cast<unsigned short>(0xFFFF), "%d"), "65535") << "zero-extended";
    EXPECT_EQ(Text(5, "<%3d>"), "<  5>");
    EXPECT_EQ(Text(5U, "%u"), "5");
    EXPECT_EQ(Text(5L, "%03ld"), "005");
    EXPECT_EQ(Text(5UL, "%lu"), "5");
    EXPECT_EQ(Text(5LL, "%+lld"), "+5");
    EXPECT_EQ(Text(5ULL, "%llu"), "5");
    EXPECT_EQ(Text(0.5F, "%.1f"), "0.5");
    EXPECT_EQ(Text(0.5, "%g"), "0.5");
    EXPECT_EQ(Text(5, nullptr), "5");
}

TEST(Fmt, DefaultEntriesOfTheTable)
{
    EXPECT_STREQ(Fmt::GetSCharFormat(), "%d");
    EXPECT_STREQ(Fmt::GetUCharFormat(), "0x%02x");
    EXPECT_STREQ(Fmt::GetShortFormat(), "%d");
    EXPECT_STREQ(Fmt::GetUShortFormat(), "0x%04x");
    EXPECT_STREQ(Fmt::GetIntFormat(), "%d");
    EXPECT_STREQ(Fmt::GetUIntFormat(), "0x%08x");
    EXPECT_STREQ(Fmt::GetLongFormat(), "%ld");
    EXPECT_STREQ(Fmt::GetLongLongFormat(), "%lld");
    EXPECT_STREQ(Fmt::GetULongLongFormat(), "0x%016llx");
    EXPECT_STREQ(Fmt::GetFloatFormat(), "%.2f");
    EXPECT_STREQ(Fmt::GetDoubleFormat(), "%.2f");
    EXPECT_STREQ(Fmt::GetCStringFormat(), "\"%s\"");
    std::string text;
    Fmt::GetCharFormat()(text, 'x', '|');
    EXPECT_EQ(text, "|x|");
}

TEST(Fmt, GeneratedFormatsAreMadeOnce)
{
    EXPECT_EQ(Fmt::GetUIntFormat(), Fmt::GetUIntFormat());
    EXPECT_EQ(Fmt::GetULongFormat(), Fmt::GetULongFormat());
    EXPECT_EQ(Fmt::GetULongLongFormat(), Fmt::GetULongLongFormat());
}

TEST(Fmt, GeneratedDecimalFormats)
{
    EXPECT_EQ(Fmt::MakeDecimalFormat(1, "hh"), "%4hhd");
    EXPECT_EQ(Fmt::MakeDecimalFormat(2, "h"), "%6hd");
    EXPECT_EQ(Fmt::MakeDecimalFormat(4, ""), "%11d");
    EXPECT_EQ(Fmt::MakeDecimalFormat(8, "ll"), "%20lld");
}

TEST(Fmt, FourCharacterCode)
{
    EXPECT_EQ(CodeText(0x41424344), "'ABCD'");
    EXPECT_EQ(CodeText(0), "''");
    EXPECT_EQ(CodeText(0x41420044), "'AB'") << "stops at the first zero byte";
    EXPECT_EQ(CodeText(0x41274222), "'A'B\\\"'") << "only the double quote is escaped";
    EXPECT_EQ(CodeText(0x410A4243), "'A\\nBC'");
}

TEST(Fmt, ATableOfItsOwn)
{
    Fmt fmt;
    fmt.SetFormat(Fmt::kUInt, "%u");
    fmt.SetFormat(Fmt::kBool, pmutil::kFormatNoYes);
    fmt.SetFormat([](std::string& out, char value, char) { out += value; });
    std::string text = "earlier";
    fmt.Format(text, 10U);
    EXPECT_EQ(text, "10");
    fmt.Format(text, true);
    EXPECT_EQ(text, "Yes");
    fmt.Format(text, 'x');
    EXPECT_EQ(text, "x");
    fmt.FormatCode(text, 0x41424344);
    EXPECT_EQ(text, "'ABCD'");
    EXPECT_EQ(Text(10U), "0x0000000a") << "the head's table is another one";
}

TEST(Fmt, PointersDoNotGoThroughTheOverrideOfAnotherKind)
{
    class Loud : public Fmt {
        void FormatULongLong(std::string& out, unsigned long long /*value*/,
                             const char* /*format*/) override
        {
            out = "number";
        }
    };
    Loud fmt;
    std::string text;
    fmt.Format(text, 5ULL);
    EXPECT_EQ(text, "number");
    const void* pointer = nullptr;
    fmt.Format(text, pointer);
    EXPECT_EQ(text, "0x0000000000000000");
}

TEST(Fmt, OverridesOfTheVirtualOperationsAreCalled)
{
    class Loud : public Fmt {
        void FormatInt(std::string& out, int value, const char* format) override
        {
            Fmt::FormatInt(out, value, format);
            out += '!';
        }
    };
    Loud fmt;
    std::string text;
    fmt.Format(text, 5);
    EXPECT_EQ(text, "5!");
}

// The memory of a formatter, which is filled with one byte once it is destroyed.
class FormatterPlace {
public:
    void Make() { new (fBytes) Fmt; }
    void Destroy()
    {
        reinterpret_cast<Fmt*>(fBytes)->~Fmt();
        std::fill(std::begin(fBytes), std::end(fBytes), kFilling);
    }
    bool IsUntouched() const
    {
        return std::all_of(std::begin(fBytes), std::end(fBytes),
                           [](unsigned char byte) { return byte == kFilling; });
    }

private:
    static constexpr unsigned char kFilling = 0x5A;

    alignas(Fmt) unsigned char fBytes[sizeof(Fmt)];
};

TEST(Fmt, NobodyTouchesAFormatterThatIsGone)
{
    constexpr std::size_t kOrders[][3] = {{0, 1, 2}, {0, 2, 1}, {1, 0, 2},
                                          {1, 2, 0}, {2, 0, 1}, {2, 1, 0}};
    for (const auto& order : kOrders) {
        FormatterPlace places[3];
        for (FormatterPlace& place : places)
            place.Make();
        for (const std::size_t gone : order)
            places[gone].Destroy();
        {
            const Fmt later;
        }
        for (const FormatterPlace& place : places)
            EXPECT_TRUE(place.IsUntouched()) << order[0] << order[1] << order[2];
    }
}

TEST(Fmt, HeadOfTheChainStaysWhateverComesAndGoes)
{
    const Fmt* const head = &Fmt::GetHead();
    {
        auto first = std::make_unique<Fmt>();
        auto second = std::make_unique<Fmt>();
        auto third = std::make_unique<Fmt>();
        second.reset();
        first.reset();
        EXPECT_EQ(&Fmt::GetHead(), head);
    }
    EXPECT_EQ(&Fmt::GetHead(), head);
}

} // namespace
