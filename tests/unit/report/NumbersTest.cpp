#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "report/Numbers.h"

namespace assay_host {
namespace {

TEST(Numbers, AreIntegersIfExact)
{
    EXPECT_EQ(ReadNumber("0"), Number(std::int64_t{0}));
    EXPECT_EQ(ReadNumber("-7"), Number(std::int64_t{-7}));
    EXPECT_EQ(ReadNumber("9007199254740992"), Number(std::int64_t{9007199254740992}));
    EXPECT_EQ(ReadNumber("-9007199254740992"), Number(std::int64_t{-9007199254740992}));
    EXPECT_EQ(ReadNumber("3.35544e+09"), Number(3.35544e+09));
    EXPECT_EQ(ReadNumber("0.5"), Number(0.5));
}

TEST(Numbers, AreRejectedIfDigitsWouldBeLost)
{
    for (const char* text :
         {"9007199254740993", "-9007199254740993", "9223372036854775807", "18446744073709551615",
          "18446744073709551616", "9007199254740993.0", "0.1000000000000000055511151231257827",
          "1.00000000000000000001", "1e-400", "123456789012345678e2"})
        EXPECT_FALSE(ReadNumber(text)) << text;
    EXPECT_FALSE(ReadNumberList("[1, 9007199254740993]"));
}

TEST(Numbers, KeepTheirDigitsInAnyNotation)
{
    EXPECT_EQ(ReadNumber("0.1"), Number(0.1));
    EXPECT_EQ(ReadNumber("-0.10"), Number(-0.1));
    EXPECT_EQ(ReadNumber("1e3"), Number(1000.0));
    EXPECT_EQ(ReadNumber("100e-2"), Number(1.0));
    EXPECT_EQ(ReadNumber("1e23"), Number(1e23));
    EXPECT_EQ(ReadNumber("1.7976931348623157e+308"), Number(1.7976931348623157e+308));
    EXPECT_EQ(ReadNumber("5e-324"), Number(5e-324));
    EXPECT_EQ(ReadNumber("0.000"), Number(0.0));
    EXPECT_EQ(ReadNumber("0e9"), Number(0.0));
    EXPECT_EQ(ReadNumber("0.0e-9223372036854775808"), Number(0.0));
    EXPECT_EQ(ReadNumber("0.0e-2147483648"), Number(0.0));
    EXPECT_EQ(ReadUnsigned("18446744073709551615"), 18446744073709551615U);
}

TEST(Numbers, RejectOtherTexts)
{
    for (const char* text : {"", " 1", "1 ", "+1", "0x10", "1,5", "one", "inf", "-inf", "nan",
                             "1e999", "--1", "[1]", "1.2.3"})
        EXPECT_FALSE(ReadNumber(text)) << text;
    EXPECT_FALSE(ReadUnsigned("-1"));
    EXPECT_FALSE(ReadDouble("inf"));
}

TEST(Numbers, FormLists)
{
    const auto list = ReadNumberList("[8, -4, 0.5]");
    ASSERT_TRUE(list);
    EXPECT_EQ(*list, (std::vector<Number>{std::int64_t{8}, std::int64_t{-4}, 0.5}));
    EXPECT_EQ(ReadNumberList("[16]")->size(), 1U);
    for (const char* text :
         {"", "[", "]", "[]", "8", "[8", "8]", "[8,4]", "[8, ]", "[a]", "[8, 4", "(8]", "[8)"})
        EXPECT_FALSE(ReadNumberList(text)) << text;
}

} // namespace
} // namespace assay_host
