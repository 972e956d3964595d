#include <gtest/gtest.h>

#include <string>

#include "Lines.h"
#include "report/ValueText.h"

namespace assay_host {
namespace {

// Returns the value of the line of a device's key as it is shown.
std::string Show(const std::string& line)
{
    const Report report = ReadReport(line + "\n");
    const Answers answers = GetAnswers(report);
    for (const Answer& answer : answers.fDevices.at(0).fAnswers)
        if (answer.fLine)
            return GetValueText(answer);
    return "no value";
}

TEST(ValueText, HasUnits)
{
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB=0"), "not known (no source has it)");
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB=512"), "512 MiB");
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB=1023"), "1023 MiB");
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB=1024"), "1 GiB");
    EXPECT_EQ(Show("clgpu[0].CLMemoryMB=1536"), "1.5 GiB");
    EXPECT_EQ(Show("clgpu[0].CLMemoryMB=24564"), "23.99 GiB");
    EXPECT_EQ(Show("clgpu[0].CLMemoryMB=81920"), "80 GiB");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=999"), "999 B/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=1000"), "1 kB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=1e+06"), "1 MB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=1e+09"), "1 GB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=1e+12"), "1 TB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=1500"), "1.5 kB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=2.5e+06"), "2.5 MB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=8.34512e+11"), "834.5 GB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=3.2e+12"), "3.2 TB/s");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=1e+13"), "10 TB/s");
    EXPECT_EQ(Show("clgpu[0].CLCompute=1234.56"), "1234.56 (no unit; more is better)");
    EXPECT_EQ(Show("glgpu[0].GLRectTextureSize=16384"), "16384 x 16384 texels");
    EXPECT_EQ(Show("glgpu[0].GLRectTextureSize=0"), "none");
    EXPECT_EQ(Show("glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]=[8]"), "8");
    EXPECT_EQ(Show("glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]=[8, 4]"), "[8, 4]");
}

TEST(ValueText, ShowsNoSpeedByAWrongClock)
{
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=0"),
              "not known (the device's clock reported no elapsed time: 0)");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=3.35544e+16"),
              "not known (the device's clock is unreliable: 3.35544e+16)");
    EXPECT_EQ(Show("clgpu[0].CLBandwidth=inf"),
              "not known (the device's clock is unreliable: inf)");
    EXPECT_EQ(Show("clgpu[0].CLCompute=0"),
              "not known (the device's clock reported no elapsed time: 0)");
    EXPECT_EQ(Show("clgpu[0].CLCompute=-1"), "not known (the device's clock is unreliable: -1)");
    EXPECT_EQ(Show("clgpu[0].CLCompute=8e+09"),
              "not known (the device's clock is unreliable: 8e+09)");
}

// Returns the copy bandwidth as it is shown beside a bound by the host's clock.
std::string ShowSpeed(const std::string& value, double bound)
{
    RunOutcome outcome;
    outcome.fLowerBounds = {{"clgpu[0].CLBandwidth", bound}};
    const Report report = ReadReport("clgpu[0].CLBandwidth=" + value + "\n");
    return GetValueText(GetAnswers(report, outcome).fDevices.at(0).fAnswers.at(10));
}

TEST(ValueText, ShowsABoundThatDiffersByMoreThanATenth)
{
    EXPECT_EQ(ShowSpeed("1e+09", 0.91e9), "1 GB/s");
    EXPECT_EQ(ShowSpeed("1e+09", 1.09e9), "1 GB/s");
    EXPECT_EQ(ShowSpeed("1e+09", 0.89e9), "1 GB/s (at least 890 MB/s by the host's clock)");
    EXPECT_EQ(ShowSpeed("1e+09", 2e9), "1 GB/s (at least 2 GB/s by the host's clock)");
    EXPECT_EQ(ShowSpeed("0", 2e9), "not known (the device's clock reported no elapsed time: 0; at "
                                   "least 2 GB/s by the host's clock)");
    EXPECT_EQ(ShowSpeed("1e+30", 2e9), "not known (the device's clock is unreliable: 1e+30; at "
                                       "least 2 GB/s by the host's clock)");
    EXPECT_EQ(ShowSpeed("1e+09", 0), "1 GB/s");
    EXPECT_EQ(ShowSpeed("1e+09", 0.9e9), "1 GB/s");
    EXPECT_EQ(ShowSpeed("1e+09", 1), "1 GB/s (at least 1 B/s by the host's clock)");
    EXPECT_EQ(ShowSpeed("1e+09", 1.23456e16), "1 GB/s (at least 12346 TB/s by the host's clock)");
}

TEST(ValueText, ShowsABoundOfASpeedOnly)
{
    RunOutcome outcome;
    outcome.fLowerBounds = {{"clgpu[0].CLCompute", 5}};
    const Report report = ReadReport("clgpu[0].CLCompute=1\n");
    EXPECT_EQ(GetValueText(GetAnswers(report, outcome).fDevices.at(0).fAnswers.at(11)),
              "1 (no unit; more is better)");
}

TEST(ValueText, SaysThatTheNewestVersionStandsForLaterOnes)
{
    EXPECT_EQ(Show("glgpu[0].GLVersion=\"4.1\""), "4.1 or later");
    EXPECT_EQ(Show("glgpu[0].GLVersion=\"4.0\""), "4.0");
    EXPECT_EQ(Show("clgpu[0].CLDeviceVersion=\"4.1\""), "4.1");
}

TEST(ValueText, ShowsIdsInHexadecimal)
{
    EXPECT_EQ(Show("glgpu[0].GLVendorID=4318"), "0x10DE (4318)");
    EXPECT_EQ(Show("glgpu[0].GLRendererID=1"), "0x0001 (1)");
    EXPECT_EQ(Show("clgpu[0].CLVendorID=65541"), "0x10005 (65541)");
    EXPECT_EQ(Show("glgpu[0].GLVendorID=0"), "not known (no adapter of the system matches)");
}

TEST(ValueText, HasWordsForFlagsAndUnknownValues)
{
    EXPECT_EQ(Show("glgpu[0].GLFrameBufferOK=1"), "yes");
    EXPECT_EQ(Show("glgpu[0].GLFrameBufferOK=0"), "no");
    EXPECT_EQ(Show("glgpu[0].GLDriver=\"?\""), "not known (not in the adapter lists)");
    EXPECT_EQ(Show("glgpu[0].GLDriver=\"\""), "not known (the text is empty)");
    EXPECT_EQ(Show("glgpu[0].GLDriver=\"  \""), "(empty)");
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB="), "(empty)");
    EXPECT_EQ(Show("glgpu[0].GLName=\"\""), "none (no adapter of the system matches)");
    EXPECT_EQ(Show("glgpu[0].GLDriverDate=\"?\""), "not known (not in the adapter lists)");
    EXPECT_EQ(Show("glgpu[0].GLDriverDate=\"20210315000000.000000-000\""), "2021-03-15");
    EXPECT_EQ(Show("glgpu[0].GLDriverDate=\"20191231235959.999999-000\""), "2019-12-31");
    for (const std::string text :
         {"March 2021", "20210315000000,000000-000", "2021031500000x.000000-000",
          "20210315000000.000000-00", "20210315000000.000000-0000", "2021031500000.0000000-000"})
        EXPECT_EQ(Show("glgpu[0].GLDriverDate=\"" + text + "\""), text);
    // A date is shown as one only where there is a date.
    for (const std::string key : {"GLName", "GLVendor"})
        EXPECT_EQ(Show("glgpu[0]." + key + "=\"20210315000000.000000-000\""),
                  "20210315000000.000000-000");
}

TEST(ValueText, ShowsOtherFormsUnchanged)
{
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB=much"), "much");
    EXPECT_EQ(Show("glgpu[0].GLMemoryMB=-1"), "-1");
    EXPECT_EQ(Show("glgpu[0].GLVendorID=0x10DE"), "0x10DE");
    EXPECT_EQ(Show("glgpu[0].GLFrameBufferOK=2"), "2");
    EXPECT_EQ(Show("glgpu[0].GLFrameBufferOK="), "(empty)");
    EXPECT_EQ(Show("glgpu[0].GLRectTextureSize=big"), "big");
    EXPECT_EQ(Show("glgpu[0].Extra=\"a\tb\x80\""), "a\\tb\\x80");
    EXPECT_EQ(Show("glgpu[0].GLRenderer=\"3.0  \""), "3.0");
}

TEST(ValueText, MarksCutAndMissingValues)
{
    ReportReader::Limits limits;
    limits.fMaxLineBytes = 28;
    Report report;
    report.Add(ReadLines("glgpu[0].GLRenderer=\"0123456789\"\n", 100, limits));
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(GetValueText(answers.fDevices.at(0).fAnswers.at(8)), "0123456... (cut)");
    EXPECT_EQ(GetValueText(answers.fDevices.at(0).fAnswers.at(9)), "- (run ended before)");
}

TEST(ValueText, ACutValueHasNoNote)
{
    const Report report = ReadReport("clgpu[0].CLCompute=12");
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(GetValueText(answers.fDevices.at(0).fAnswers.at(11)), "12... (cut)");
}

TEST(ValueText, NamesADevice)
{
    const Report report = ReadReport("glgpu[0].GLName=\"A\"\nglgpu[0].GLRenderer=\"B\"\n"
                                     "glgpu[1].GLName=\"\"\nglgpu[1].GLRenderer=\"C\"\n"
                                     "glgpu[2].GLVendor=\"D\"\nclgpu[0].CLName=\"E\"\n");
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(GetDeviceName(answers.fDevices.at(0)), "A");
    EXPECT_EQ(GetDeviceName(answers.fDevices.at(1)), "C");
    EXPECT_EQ(GetDeviceName(answers.fDevices.at(2)), "");
    EXPECT_EQ(GetDeviceName(answers.fDevices.at(3)), "E");
}

} // namespace
} // namespace assay_host
