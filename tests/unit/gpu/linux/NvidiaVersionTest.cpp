#include "linux/gpu/NvidiaVersion.h"

#include <gtest/gtest.h>

namespace pmutil {
namespace {

TEST(NvidiaVersionTest, TheClosedModule)
{
    const NvidiaVersion found = ParseNvidiaVersion(
        "NVRM version: NVIDIA UNIX x86_64 Kernel Module  535.104.05  Sat Aug 19 01:15:15 UTC 2023\n"
        "GCC version:  gcc version 12.2.0 (Debian 12.2.0-14)\n");
    EXPECT_EQ(found.version, "535.104.05");
    EXPECT_EQ(found.date, "20230819011515.000000+000");
}

TEST(NvidiaVersionTest, TheOpenModule)
{
    const NvidiaVersion found = ParseNvidiaVersion(
        "NVRM version: NVIDIA UNIX Open Kernel Module for x86_64  550.54.15  Release Build  "
        "(builder@host)  Tue Mar  5 22:15:33 UTC 2024\n");
    EXPECT_EQ(found.version, "550.54.15");
    EXPECT_EQ(found.date, "20240305221533.000000+000");
}

TEST(NvidiaVersionTest, AnOldModulesZoneIsAnOffsetInMinutes)
{
    EXPECT_EQ(ParseNvidiaVersion("NVRM version: NVIDIA UNIX x86_64 Kernel Module  390.87  "
                                 "Tue Aug 21 12:33:05 PDT 2018\n")
                  .date,
              "20180821123305.000000-420");
    EXPECT_EQ(ParseNvidiaVersion("NVRM version: x  304.137  Thu Jan 14 18:50:41 PST 2018\n").date,
              "20180114185041.000000-480");
    EXPECT_EQ(ParseNvidiaVersion("NVRM version: x  304.137  Thu Jan 14 18:50:41 GMT 2018\n").date,
              "20180114185041.000000+000");
}

TEST(NvidiaVersionTest, EveryMonthHasItsNumber)
{
    int number = 1;
    for (const std::string month :
         {"Jan", "Feb", "Mar", "Apr", "May", "Jun", "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"}) {
        char date[] = "20230019011515.000000+000";
        date[4] = static_cast<char>('0' + number / 10);
        date[5] = static_cast<char>('0' + number % 10);
        EXPECT_EQ(
            ParseNvidiaVersion("NVRM version: x  1.2  Sat " + month + " 19 01:15:15 UTC 2023\n")
                .date,
            date);
        ++number;
    }
}

TEST(NvidiaVersionTest, AnUnknownZoneIsRejected)
{
    const NvidiaVersion found =
        ParseNvidiaVersion("NVRM version: x  1.2  Sat Aug 19 01:15:15 XYZ 2023\n");
    EXPECT_EQ(found.version, "1.2");
    EXPECT_EQ(found.date, "");
}

TEST(NvidiaVersionTest, AModuleWithoutADate)
{
    const NvidiaVersion found = ParseNvidiaVersion("NVRM version: x  535.113.01  Release Build\n");
    EXPECT_EQ(found.version, "535.113.01");
    EXPECT_EQ(found.date, "");
}

TEST(NvidiaVersionTest, ADateOutOfRangeIsRejected)
{
    for (const char* date :
         {"Aug 0 01:15:15 UTC 2023", "Aug 32 01:15:15 UTC 2023", "Aug 19 24:15:15 UTC 2023",
          "Aug 19 01:60:15 UTC 2023", "Aug 19 01:15:61 UTC 2023", "Aug 19 01:15:15 UTC 1023",
          "Aug 19 01:15 UTC 2023", "Aug 19 01:15:15 UTC", "Aug x 01:15:15 UTC 2023",
          "Agu 19 01:15:15 UTC 2023", "Aug 119 01:15:15 UTC 2023", "Aug 19 01:15:15 UTC 20233"})
        EXPECT_EQ(ParseNvidiaVersion(std::string("NVRM version: 1.2 ") + date).date, "") << date;
    EXPECT_EQ(ParseNvidiaVersion("NVRM version: 1.2 Jan 1 00:00:00 UTC 1990").date,
              "19900101000000.000000+000");
    EXPECT_EQ(ParseNvidiaVersion("NVRM version: 1.2 Dec 31 23:59:59 UTC 1989").date, "");
}

TEST(NvidiaVersionTest, OtherTextsHaveNeither)
{
    for (const char* text :
         {"", "GCC version: 12.2.0\n", "NVRM version:", "NVRM version: .5 5. x\n"}) {
        const NvidiaVersion found = ParseNvidiaVersion(text);
        EXPECT_EQ(found.version, "") << text;
        EXPECT_EQ(found.date, "") << text;
    }
}

} // namespace
} // namespace pmutil
