#include <gtest/gtest.h>

#include <regex>
#include <string>

#include "facts/Environment.h"
#include "facts/OsRelease.h"
#include "facts/TimeText.h"

namespace assay_host {
namespace {

TEST(TimeText, IsUtc)
{
    EXPECT_EQ(MakeUtcText(0), "1970-01-01T00:00:00Z");
    EXPECT_EQ(MakeUtcText(951782399), "2000-02-28T23:59:59Z");
    EXPECT_EQ(MakeUtcText(951782400), "2000-02-29T00:00:00Z");
    EXPECT_EQ(MakeUtcText(4294967296), "2106-02-07T06:28:16Z");
    EXPECT_EQ(MakeUtcText(-1), "1970-01-01T00:00:00Z");
    EXPECT_EQ(MakeUtcText(INT64_MAX), "9999-12-31T23:59:59Z");
}

TEST(TimeText, IsReadAgain)
{
    for (const std::int64_t time : {std::int64_t{0}, std::int64_t{951782399},
                                    std::int64_t{951782400}, std::int64_t{4294967296}})
        EXPECT_EQ(ReadUtcText(MakeUtcText(time)), time);
    for (const char* text :
         {"", "2026-11-22", "2026-11-22 01:26:02Z", "2026-11-22T01:26:02", "2026-11-22T01:26:02Z ",
          "2026-13-22T01:26:02Z", "2026-02-30T01:26:02Z", "2026-11-22T24:00:00Z",
          "2026-11-22T01:60:02Z", "2026-11-22T01:26:60Z", "1969-12-31T23:59:59Z",
          "+026-11-22T01:26:02Z", "2026-11-22T01:26:-2Z", "0000-01-01T00:00:00Z"})
        EXPECT_FALSE(ReadUtcText(text)) << text;
}

TEST(TimeText, HasOffsets)
{
    EXPECT_EQ(MakeOffsetText(0), "+00:00");
    EXPECT_EQ(MakeOffsetText(60), "+01:00");
    EXPECT_EQ(MakeOffsetText(345), "+05:45");
    EXPECT_EQ(MakeOffsetText(-570), "-09:30");
    EXPECT_EQ(MakeOffsetText(-1), "-00:01");
    EXPECT_EQ(MakeOffsetText(100000), "+23:59");
}

TEST(OsRelease, GivesAVariable)
{
    const char* const text = "# x\nNAME=Plain\nPRETTY_NAME=\"A \\\"good\\\" one\"  \nID='it\\s'\r\n"
                             "XNAME=no\nEMPTY=\nTWICE=1\nTWICE=2";
    EXPECT_EQ(FindOsRelease(text, "NAME"), "Plain");
    EXPECT_EQ(FindOsRelease(text, "PRETTY_NAME"), "A \"good\" one");
    EXPECT_EQ(FindOsRelease(text, "ID"), "it\\s");
    EXPECT_EQ(FindOsRelease(text, "EMPTY"), "");
    EXPECT_EQ(FindOsRelease(text, "TWICE"), "2");
    EXPECT_EQ(FindOsRelease(text, "PRETTY"), "");
    EXPECT_EQ(FindOsRelease("", "NAME"), "");
    EXPECT_EQ(FindOsRelease("NAME=\"", "NAME"), "\"");
    EXPECT_EQ(FindOsRelease("NAME=a\\\nX", "NAME"), "a\\") << "nothing follows the backslash";
    EXPECT_EQ(FindOsRelease("NAME=\"a\\\"", "NAME"), "a\\");
    EXPECT_EQ(FindOsRelease("NAME=''", "NAME"), "");
    EXPECT_EQ(FindOsRelease("NAME='a\"", "NAME"), "'a\"") << "no quotes of one kind";
    EXPECT_EQ(FindOsRelease("NAME='\\n'", "NAME"), "\\n");
    EXPECT_EQ(FindOsRelease("NAME=a b \t\r\n", "NAME"), "a b");
}

TEST(Environment, DescribesThisMachine)
{
    const Environment environment = GetEnvironment(false);
    EXPECT_TRUE(
        std::regex_match(environment.fTime, std::regex(R"(\d{4}-\d\d-\d\dT\d\d:\d\d:\d\dZ)")));
    EXPECT_TRUE(std::regex_match(environment.fOffset, std::regex(R"([+-]\d\d:\d\d)")));
    for (const Fact* fact : {&environment.fSystem, &environment.fBuild, &environment.fKernel,
                             &environment.fArchitecture})
        EXPECT_NE(fact->fValue.empty(), fact->fReason.empty());
    EXPECT_TRUE(environment.fKernel.IsKnown());
    EXPECT_TRUE(environment.fArchitecture.IsKnown());
}

TEST(Environment, NamesTheMachineOnlyOnRequest)
{
    EXPECT_FALSE(GetEnvironment(false).fHost.IsKnown());
    EXPECT_EQ(GetEnvironment(false).fHost.fValue, "");
    EXPECT_NE(GetEnvironment(true).fHost.fValue, "");
}

} // namespace
} // namespace assay_host
