#include "pmutil/Format.h"

#include <gtest/gtest.h>

namespace pmutil {
namespace {

TEST(FormatTest, FormatsLikePrintf)
{
    EXPECT_EQ(FormatString("%d %s %c %05.1f", -3, "text", 'x', 2.25), "-3 text x 002.2");
    EXPECT_EQ(FormatString("100%%"), "100%");
    EXPECT_EQ(FormatString("%s", ""), "");
}

TEST(FormatTest, ANullTextIsShown)
{
    const char* volatile none = nullptr;
    EXPECT_EQ(FormatString("%s", none), "(null)");
    EXPECT_EQ(FormatString("<%s>", none), "<(null)>");
}

TEST(FormatTest, TextOfAnyLengthIsWhole)
{
    for (const std::size_t size : {254U, 255U, 256U, 257U, 1000U, 1000000U}) {
        const std::string text(size, 'y');
        EXPECT_EQ(FormatString("%s", text.c_str()), text);
        EXPECT_EQ(FormatString("%s%c", text.c_str(), 'z'), text + 'z');
    }
}

TEST(FormatTest, HexFormatHasTwoDigitsPerByteAndTheModifier)
{
    EXPECT_EQ(MakeHexFormat(4, ""), "0x%08x");
    EXPECT_EQ(MakeHexFormat(4, "l"), "0x%08lx");
    EXPECT_EQ(MakeHexFormat(8, "ll"), "0x%016llx");
    EXPECT_EQ(MakeHexFormat(1, "hh"), "0x%02hhx");
}

} // namespace
} // namespace pmutil
