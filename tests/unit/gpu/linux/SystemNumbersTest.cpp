#include "linux/gpu/SystemNumbers.h"

#include <gtest/gtest.h>

#include "support/AdapterTree.h"

namespace pmutil {
namespace {

TEST(SystemNumbersTest, ReadsDecimalAndHexadecimal)
{
    std::uint64_t number = 1;
    EXPECT_TRUE(ParseSystemNumber("0", number));
    EXPECT_EQ(number, 0U);
    EXPECT_TRUE(ParseSystemNumber("25753026560", number));
    EXPECT_EQ(number, 25753026560U);
    EXPECT_TRUE(ParseSystemNumber("0x10de", number));
    EXPECT_EQ(number, 0x10DEU);
    EXPECT_TRUE(ParseSystemNumber("18446744073709551615", number));
    EXPECT_EQ(number, UINT64_MAX);
}

TEST(SystemNumbersTest, RejectsOtherTexts)
{
    for (const char* line : {"", "0x", "-1", "+1", " 1", "1 ", "1 bytes", "10de", "0xg", "x10",
                             "18446744073709551616", "0x10000000000000000", "1.5", "--"}) {
        std::uint64_t number = 7;
        EXPECT_FALSE(ParseSystemNumber(line, number)) << line;
        EXPECT_EQ(number, 7U);
    }
    std::uint64_t number = 7;
    EXPECT_FALSE(ParseSystemNumber(std::string("1\0", 2), number));
}

TEST(SystemNumbersTest, ReadsTheFirstLine)
{
    const AdapterTree tree("empty");
    tree.write("/a", "0x1002\nmore\n");
    std::uint64_t number = 0;
    EXPECT_TRUE(ReadSystemNumber("/a", number));
    EXPECT_EQ(number, 0x1002U);
    EXPECT_FALSE(ReadSystemNumber("/none", number));
}

TEST(SystemNumbersTest, MemoryTotalIsInBytes)
{
    std::uint64_t bytes = 0;
    EXPECT_TRUE(ParseMemoryTotal("MemFree:  1 kB\nMemTotal:       16777216 kB\n", bytes));
    EXPECT_EQ(bytes, std::uint64_t{16} << 30);
    EXPECT_TRUE(ParseMemoryTotal("MemTotal: 1 kB", bytes));
    EXPECT_EQ(bytes, 1024U);
}

TEST(SystemNumbersTest, AMalformedMemoryTotalIsRejected)
{
    for (const char* text : {"", "MemTotal:", "MemTotal: kB", "MemTotal: 1 MB", "MemTotal: x kB",
                             "MemTotal: 18446744073709551615 kB", "MemFree: 1 kB"}) {
        std::uint64_t bytes = 7;
        EXPECT_FALSE(ParseMemoryTotal(text, bytes)) << text;
        EXPECT_EQ(bytes, 7U);
    }
}

} // namespace
} // namespace pmutil
