#include "all/LogPrefix.h"

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
        {0, "1970.01.01_00:00:00.000"},          {1, "1970.01.01_00:00:01.000"},
        {951782400, "2000.02.29_00:00:00.000"},  {951868799, "2000.02.29_23:59:59.000"},
        {1709251199, "2024.02.29_23:59:59.000"}, {1709251200, "2024.03.01_00:00:00.000"},
        {1735689599, "2024.12.31_23:59:59.000"}, {1735689600, "2025.01.01_00:00:00.000"},
        {2147483648, "2038.01.19_03:14:08.000"}, {4107542400, "2100.03.01_00:00:00.000"},
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
        {0, "(+00.000)"},       {0.0004, "(+00.000)"},
        {0.0006, "(+00.001)"},  {1.5, "(+01.500)"},
        {59.9996, "(+60.000)"}, {123.4567, "(+123.457)"},
        {-0.25, "(+-0.250)"},   {-12.5, "(+-12.500)"},
        {0.0625, "(+00.062)"},  {86400.125, "(+86400.125)"},
    };
    for (const auto& test : kCases)
        EXPECT_EQ(MakeLogPrefix(0, 0, test.delta, "t").substr(29),
                  std::string(test.text) + "[tid=t] ");
}

TEST(LogPrefixTest, LineNumberHasAtLeastFiveDigits)
{
    EXPECT_EQ(MakeLogPrefix(42, 0, 0, "t").substr(0, 7), "00042.1");
    EXPECT_EQ(MakeLogPrefix(99999, 0, 0, "t").substr(0, 7), "99999.1");
    EXPECT_EQ(MakeLogPrefix(1234567, 0, 0, "t").substr(0, 9), "1234567.1");
}

TEST(LogPrefixTest, ThreadTextIsTakenAsItStands)
{
    const std::string name = "worker %s " + std::string(300, 'n');
    EXPECT_EQ(MakeLogPrefix(0, 0, 0, name),
              "00000.1970.01.01_00:00:00.000(+00.000)[tid=" + name + "] ");
}

} // namespace
} // namespace pmutil
