#include <gtest/gtest.h>

#include <string>

#include "Lines.h"
#include "report/Report.h"

namespace assay_host {
namespace {

constexpr const char* kText = "Tester=\"Pixmere\"\n"
                              "assayStart=\"2026-11-21_10:49:35\"\n"
                              "NumGLGPUs=2\n"
                              "glgpu[0].GLName=\"One\"\n"
                              "glgpu[1].GLName=\"Two\"\n"
                              "# a comment\n"
                              "glgpu[0].GLMemoryMB=4096\n"
                              "clgpu[0].CLName=\"One\"\n"
                              "assayEnd=\"2026-11-21_10:49:36\"\n";

std::string Value(const ReportLine* line)
{
    return line ? line->fValue : "(none)";
}

TEST(Report, FindsValuesOfKeysWithoutATag)
{
    const Report report = ReadReport(kText);
    EXPECT_EQ(Value(report.Find("Tester")), "Pixmere");
    EXPECT_EQ(Value(report.Find("NumGLGPUs")), "2");
    EXPECT_EQ(report.Find("NumCLGPUs"), nullptr);
    EXPECT_EQ(report.Find(""), nullptr);
}

TEST(Report, ListsDevicesAndTheirKeysInOrder)
{
    const Report report = ReadReport(kText);
    ASSERT_EQ(report.GetDevices().size(), 3U);
    const Device& first = report.GetDevices()[0];
    EXPECT_EQ(first.fTag, "glgpu[0]");
    ASSERT_EQ(first.fKeys.size(), 2U);
    EXPECT_EQ(first.fKeys[0].first, "GLName");
    EXPECT_EQ(first.fKeys[0].second, 3U);
    EXPECT_EQ(first.fKeys[1].first, "GLMemoryMB");
    EXPECT_EQ(first.fKeys[1].second, 6U);
    EXPECT_EQ(report.GetDevices()[1].fTag, "glgpu[1]");
    EXPECT_EQ(report.GetDevices()[2].fTag, "clgpu[0]");
    EXPECT_EQ(Value(report.Find(first, "GLMemoryMB")), "4096");
    EXPECT_EQ(report.Find(report.GetDevices()[1], "GLMemoryMB"), nullptr);
    EXPECT_EQ(Value(report.Find(report.GetDevices()[2], "CLName")), "One");
}

TEST(Report, TakesTheLastLineOfARepeatedKey)
{
    const Report report = ReadReport("K=1\nglgpu[0].A=1\nglgpu[0].B=2\nglgpu[0].A=3\nK=4\n");
    EXPECT_EQ(Value(report.Find("K")), "4");
    const Device& device = report.GetDevices().at(0);
    EXPECT_EQ(Value(report.Find(device, "A")), "3");
    ASSERT_EQ(device.fKeys.size(), 2U);
    EXPECT_EQ(device.fKeys[0].second, 3U);
}

TEST(Report, RejectsMalformedTags)
{
    const Report report =
        ReadReport("gputag.GL_X=3\nglgpu[].A=1\nglgpu[x].A=1\nglgpu[1]A=1\nxglgpu[1].A=1\n"
                   "glgpu[1234567890].A=1\nglgpu[-1].A=1\nglgpu[01].A=1\nclgpu[12].A=1\n");
    ASSERT_EQ(report.GetDevices().size(), 1U);
    EXPECT_EQ(report.GetDevices()[0].fTag, "clgpu[12]");
    EXPECT_EQ(Value(report.Find("gputag.GL_X")), "3");
    EXPECT_EQ(Value(report.Find("glgpu[x].A")), "1");
}

TEST(Report, IsWholeWithBothItsStamps)
{
    EXPECT_TRUE(ReadReport(kText).IsWhole());
    EXPECT_FALSE(ReadReport("assayStart=\"x\"\n").IsWhole());
    EXPECT_FALSE(ReadReport("assayEnd=\"x\"\n").IsWhole());
    EXPECT_FALSE(ReadReport("").IsWhole());
    for (const char* end : {"", "=", "=\n", "=\"2026", "=\"x\"", "=x\n", "=\"x\n"})
        EXPECT_FALSE(ReadReport(std::string("assayStart=\"x\"\nassayEnd") + end).IsWhole()) << end;
    EXPECT_FALSE(ReadReport("assayStart=\nassayEnd=\"x\"\n").IsWhole());
    EXPECT_TRUE(ReadReport("assayStart=\"x\"\r\nassayEnd=\"x\"\r\n").IsWhole());
    EXPECT_FALSE(ReadReport("# assayEnd=\"x\"\nassayStart=\"x\"\n").IsWhole());
}

TEST(Report, RestoresItsText)
{
    EXPECT_EQ(ReadReport(kText).ToText(), kText);
    EXPECT_EQ(ReadReport("a=\"b\r\nc\"\r\nbroken off").ToText(), "a=\"b\r\nc\"\r\nbroken off");
}

TEST(Report, HoldsManyDevicesAndKeys)
{
    std::string text;
    for (int index = 0; index < 10000; ++index) {
        text += "glgpu[" + std::to_string(index) + "].K=1\n";
        text += "clgpu[0].K" + std::to_string(index) + "=1\n";
    }
    const Report report = ReadReport(text);
    ASSERT_EQ(report.GetDevices().size(), 10001U);
    EXPECT_EQ(report.GetDevices()[1].fKeys.size(), 10000U);
}

} // namespace
} // namespace assay_host
