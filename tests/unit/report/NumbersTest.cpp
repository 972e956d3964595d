#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "report/Numbers.h"

namespace assay_host {
namespace {

TEST(Numbers, AreIntegersWhereOneHoldsThem)
{
    EXPECT_EQ(ReadNumber("0"), Number(std::int64_t{0}));
    EXPECT_EQ(ReadNumber("-7"), Number(std::int64_t{-7}));
    EXPECT_EQ(ReadNumber("9223372036854775807"), Number(std::int64_t{9223372036854775807}));
    EXPECT_EQ(ReadNumber("18446744073709551615"), Number(std::uint64_t{18446744073709551615U}));
    EXPECT_EQ(ReadNumber("18446744073709551616"), Number(18446744073709551616.0));
    EXPECT_EQ(ReadNumber("3.35544e+09"), Number(3.35544e+09));
    EXPECT_EQ(ReadNumber("0.5"), Number(0.5));
}

TEST(Numbers, AreNothingElse)
{
    for (const char* text : {"", " 1", "1 ", "+1", "0x10", "1,5", "one", "inf", "-inf", "nan",
                             "1e999", "--1", "[1]", "1.2.3"})
        EXPECT_FALSE(ReadNumber(text)) << text;
    EXPECT_FALSE(ReadUnsigned("-1"));
    EXPECT_FALSE(ReadDouble("inf"));
}

TEST(Numbers, MakeLists)
{
    const auto list = ReadNumberList("[8, -4, 0.5]");
    ASSERT_TRUE(list);
    EXPECT_EQ(*list, (std::vector<Number>{std::int64_t{8}, std::int64_t{-4}, 0.5}));
    EXPECT_EQ(ReadNumberList("[16]")->size(), 1U);
    for (const char* text : {"", "[", "]", "[]", "8", "[8", "8]", "[8,4]", "[8, ]", "[a]", "[8, 4"})
        EXPECT_FALSE(ReadNumberList(text)) << text;
}

} // namespace
} // namespace assay_host
