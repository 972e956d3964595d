#include "all/LogPrefix.h"

#include <charconv>
#include <cmath>
#include <iterator>
#include <limits>
#include <utility>

#include <gtest/gtest.h>

namespace pmutil {
namespace {

std::string PrefixAt(double seconds)
{
    return MakeLogPrefix(0, seconds, 0, "t");
}

TEST(LogPrefixTest, SplitsTheMomentByTheCalendar)
{
    const struct {
        double seconds;
        const char* moment;
    } kCases[] = {
        {0, "1970.01.01_00:00:00.000"},
        {1, "1970.01.01_00:00:01.000"},
        {951782400, "2000.02.29_00:00:00.000"},
        {951868799, "2000.02.29_23:59:59.000"},
        {1709251199, "2024.02.29_23:59:59.000"},
        {1709251200, "2024.03.01_00:00:00.000"},
        {1735689599, "2024.12.31_23:59:59.000"},
        {1735689600, "2025.01.01_00:00:00.000"},
        {2147483648, "2038.01.19_03:14:08.000"},
        {4107542400, "2100.03.01_00:00:00.000"},
        // The last moment of each unit of a day, and the first of the next.
        {86399.9995, "1970.01.01_23:59:59.999"},
        {86340, "1970.01.01_23:59:00.000"},
        {82800, "1970.01.01_23:00:00.000"},
        {82799.9995, "1970.01.01_22:59:59.999"},
        {86339.9995, "1970.01.01_23:58:59.999"},
        {86398.9995, "1970.01.01_23:59:58.999"},
    };
    for (const auto& test : kCases)
        EXPECT_EQ(PrefixAt(test.seconds),
                  "00000." + std::string(test.moment) + "(+00.000)[tid=t] ");
}

TEST(LogPrefixTest, TruncatesToWholeMilliseconds)
{
    EXPECT_EQ(PrefixAt(1709251199.9999).substr(17, 12), "23:59:59.999");
    EXPECT_EQ(PrefixAt(10.0625).substr(17, 12), "00:00:10.062");
    EXPECT_EQ(PrefixAt(10.9996).substr(17, 12), "00:00:10.999");
}

TEST(LogPrefixTest, TellsTheDeltaInSecondsRoundedToMilliseconds)
{
    const struct {
        double delta;
        const char* text;
    } kCases[] = {
        {0, "(+00.000)"},        {0.0004, "(+00.000)"},
        {0.0006, "(+00.001)"},   {1.5, "(+01.500)"},
        {59.9996, "(+60.000)"},  {123.4567, "(+123.457)"},
        {-0.25, "(+-0.250)"},    {-12.5, "(+-12.500)"},
        {0.0625, "(+00.062)"},   {86400.125, "(+86400.125)"},
        {0.1875, "(+00.188)"},   {98.9994, "(+98.999)"},
        {99.9996, "(+100.000)"}, {-0.0, "(+-0.000)"},
    };
    for (const auto& test : kCases)
        EXPECT_EQ(MakeLogPrefix(0, 0, test.delta, "t").substr(29),
                  std::string(test.text) + "[tid=t] ");
}

// Returns "%06.3f" of a number that isn't negative. Not by printf, which on Windows rounds exact
// halves up.
std::string WithThreeDecimals(double number)
{
    char digits[400];
    const auto end =
        std::to_chars(std::begin(digits), std::end(digits), number, std::chars_format::fixed, 3)
            .ptr;
    const std::string text(digits, end);
    return std::string(text.size() < 6 ? 6 - text.size() : 0, '0') + text;
}

// Near a half the exact value of the delta decides, not its product with 1000.
TEST(LogPrefixTest, RoundsTheExactDelta)
{
    const double infinity = std::numeric_limits<double>::infinity();
    for (const double whole : {0.0, 1.0, 41.0, 98.0, 99.0, 1000.0}) {
        for (int thousandth = 0; thousandth < 1000; ++thousandth) {
            const double half = whole + (thousandth + 0.5) / 1000;
            for (const double delta :
                 {half, std::nextafter(half, -infinity), std::nextafter(half, infinity)})
                ASSERT_EQ(MakeLogPrefix(0, 0, delta, "t"), "00000.1970.01.01_00:00:00.000(+" +
                                                               WithThreeDecimals(delta) +
                                                               ")[tid=t] ");
        }
    }
}

TEST(LogPrefixTest, LongestDeltaFits)
{
    const double delta = std::numeric_limits<double>::max();
    const std::string text = WithThreeDecimals(delta);
    for (const auto& [signedDelta, sign] : {std::pair{delta, ""}, {-delta, "-"}})
        EXPECT_EQ(MakeLogPrefix(0, 0, signedDelta, "t"),
                  "00000.1970.01.01_00:00:00.000(+" + (sign + text) + ")[tid=t] ");
}

TEST(LogPrefixTest, LineNumberHasAtLeastFiveDigits)
{
    EXPECT_EQ(MakeLogPrefix(42, 0, 0, "t").substr(0, 7), "00042.1");
    EXPECT_EQ(MakeLogPrefix(99999, 0, 0, "t").substr(0, 7), "99999.1");
    EXPECT_EQ(MakeLogPrefix(100000, 0, 0, "t").substr(0, 8), "100000.1");
    EXPECT_EQ(MakeLogPrefix(1234567, 0, 0, "t").substr(0, 9), "1234567.1");
    EXPECT_EQ(MakeLogPrefix(4294967295, 0, 0, "t").substr(0, 12), "4294967295.1");
}

TEST(LogPrefixTest, ThreadTextIsTakenAsItStands)
{
    const std::string name = "worker %s " + std::string(300, 'n');
    EXPECT_EQ(MakeLogPrefix(0, 0, 0, name),
              "00000.1970.01.01_00:00:00.000(+00.000)[tid=" + name + "] ");
}

} // namespace
} // namespace pmutil
