#include "report/SequenceReader.h"

#include <gtest/gtest.h>

#include "support/Reports.h"

namespace assay_host {
namespace {

std::string GetKey(const std::string& line)
{
    return line.substr(0, line.find('='));
}

void Feed(SequenceReader& reader, const std::vector<std::string>& lines)
{
    const Report report = ReadReport(lines);
    for (const ReportLine& line : report.GetLines())
        reader.Add(line);
}

TEST(SequenceReader, NamesTheNextKeyThroughoutARun)
{
    SequenceReader reader;
    EXPECT_EQ(reader.GetNextKey(), "Tester");
    EXPECT_EQ(reader.GetSteps(), 0U);
    for (const std::string& line : Join(MakeWholeRun(2, 2))) {
        EXPECT_EQ(reader.GetNextKey(), GetKey(line));
        Feed(reader, {line});
    }
    EXPECT_EQ(reader.GetNextKey(), "");
    EXPECT_EQ(reader.GetSteps(), 9 + 1 + 2 * 35 + 2 * 12 - 1U); // the last one shows no line
}

TEST(SequenceReader, NamesTheNextAnswerThroughoutARun)
{
    SequenceReader reader;
    const std::vector<std::string> lines = Join(MakeWholeRun(2, 2));
    std::size_t tagLines = 0;
    for (std::size_t index = 0; index < lines.size(); ++index) {
        std::size_t answer = index;
        while (lines[answer].rfind("gputag.", 0) == 0)
            ++answer;
        tagLines += answer - index;
        EXPECT_EQ(reader.GetNextAnswerKey(), GetKey(lines[answer]));
        Feed(reader, {lines[index]});
    }
    EXPECT_GT(tagLines, 0U);
    EXPECT_EQ(reader.GetNextAnswerKey(), "");
}

TEST(SequenceReader, SkipsADeviceThatFailed)
{
    SequenceReader reader;
    auto run = MakeWholeRun(2, -1);
    for (std::size_t index = 0; index < 9; ++index)
        Feed(reader, run[index]); // both GLVersion
    Feed(reader, run[10]);        // glgpu[1].IsIntegratedGLGPU
    EXPECT_EQ(reader.GetNextKey(), "glgpu[1].GLMemoryMB");
}

TEST(SequenceReader, TakesAFailureFromTheLog)
{
    SequenceReader reader;
    Feed(reader, {"NumGLGPUs=2", "glgpu[0].GLVersion=\"4.1\"", "glgpu[1].GLVersion=\"4.1\"",
                  "# 00009.x Testing terminated for glgpu[0]"});
    EXPECT_TRUE(reader.HasFailed({DeviceKind::kOpenGL, 0}));
    EXPECT_EQ(reader.GetNextKey(), "glgpu[1].IsIntegratedGLGPU");
    Feed(reader, {"Testing terminated for glgpu[1]", "# Testing terminated for glgpu[1] soon"});
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenGL, 1}));
    EXPECT_EQ(reader.GetNextKey(), "glgpu[1].IsIntegratedGLGPU");
}

TEST(SequenceReader, IgnoresALogLineThatNamesMoreThanADevice)
{
    SequenceReader reader;
    Feed(reader, {"NumGLGPUs=2", "# Testing terminated for glgpu[0].GLName",
                  "# Testing terminated for glgpu[1].", "# Testing terminated for "});
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenGL, 0}));
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenGL, 1}));
    EXPECT_EQ(reader.GetNextKey(), "glgpu[0].GLVersion");
}

TEST(SequenceReader, CorrectsAFailureWhenTheDeviceGoesOn)
{
    SequenceReader reader;
    Feed(reader, {"NumGLGPUs=2", "glgpu[0].GLVersion=\"4.1\"", "glgpu[1].GLVersion=\"4.1\"",
                  "glgpu[1].IsIntegratedGLGPU=0"});
    EXPECT_TRUE(reader.HasFailed({DeviceKind::kOpenGL, 0}));
    Feed(reader, {"glgpu[0].GLMemoryMB=1"});
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenGL, 0}));
    EXPECT_EQ(reader.GetNextKey(), "glgpu[1].GLMemoryMB");
    EXPECT_EQ(reader.GetSteps(), 1 + 6 + 2 + 2 + 1U); // that of the lost line too
}

TEST(SequenceReader, FindsDevicesWithoutACount)
{
    SequenceReader reader;
    Feed(reader, {"Tester=\"x\"", "glgpu[0].GLVersion=\"4.1\"", "glgpu[2].GLVersion=\"4.1\""});
    EXPECT_EQ(reader.GetNextKey(), "glgpu[0].IsIntegratedGLGPU");
    Feed(reader, {"NumCLGPUs=1", "clgpu[0].CUDASupported=0"});
    EXPECT_EQ(reader.GetNextKey(), "clgpu[0].CLBandwidth");
}

TEST(SequenceReader, TakesNoFailureFromAKeyThatMayBeSilent)
{
    SequenceReader reader;
    Feed(reader, {"NumCLGPUs=2", "clgpu[0].CUDASupported=1", "clgpu[1].CUDASupported=1"});
    EXPECT_EQ(reader.GetNextKey(), "clgpu[0].CUDAVersion");
    Feed(reader, {"clgpu[0].CLBandwidth=1"});
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenCL, 1}));
    EXPECT_EQ(reader.GetNextKey(), "clgpu[1].CLBandwidth");
}

TEST(SequenceReader, TakesTheLastCount)
{
    SequenceReader reader;
    Feed(reader, {"NumGLGPUs=1", "NumGLGPUs=2", "glgpu[0].GLVersion=\"4.1\""});
    EXPECT_EQ(reader.GetNextKey(), "glgpu[1].GLVersion");
    SequenceReader none;
    Feed(none, {"NumGLGPUs=some"});
    EXPECT_EQ(none.GetNextKey(), "NumCLGPUs");
}

// A gputag line that comes again is of the next device.
TEST(SequenceReader, FindsTheDeviceOfAGputagLine)
{
    const auto run = MakeWholeRun(2, -1);
    const std::string tag = "gputag.GL_SHADING_LANGUAGE_VERSION=35724";
    SequenceReader again;
    SequenceReader failed;
    for (std::size_t index = 0; index < 7 + 2 * 15; ++index) {
        Feed(again, run[index]);
        Feed(failed, run[index]);
    }
    Feed(again, {tag});
    EXPECT_EQ(again.GetNextKey(), "glgpu[0].glGetString[GL_SHADING_LANGUAGE_VERSION]");
    Feed(again, {tag});
    EXPECT_EQ(again.GetNextKey(), "glgpu[1].glGetString[GL_SHADING_LANGUAGE_VERSION]");
    Feed(failed, {"# x Testing terminated for glgpu[0]", tag});
    EXPECT_EQ(failed.GetNextKey(), "glgpu[1].glGetString[GL_SHADING_LANGUAGE_VERSION]");
}

TEST(SequenceReader, KnowsNoDeviceBeyondTheCountOrTheLimit)
{
    SequenceReader reader;
    Feed(reader, Join(MakeWholeRun(2, -1)));
    Feed(reader, {"# Testing terminated for clgpu[255]", "# Testing terminated for clgpu[256]"});
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenGL, 2}));
    EXPECT_TRUE(reader.HasFailed({DeviceKind::kOpenCL, 255}));
    EXPECT_FALSE(reader.HasFailed({DeviceKind::kOpenCL, 256}));
}

// The count is a step if OpenCL is there, whether its line was lost or not.
TEST(SequenceReader, CountsTheStepsOfOpenCL)
{
    const auto count = [](int devices, bool isLost) {
        SequenceReader reader;
        for (const std::string& line : Join(MakeWholeRun(0, devices)))
            if (!isLost || GetKey(line) != "NumCLGPUs")
                Feed(reader, {line});
        return reader.GetSteps();
    };
    EXPECT_EQ(count(-1, false), 1 + 7U);
    EXPECT_EQ(count(0, false), 1 + 8U);
    EXPECT_EQ(count(1, false), 1 + 8 + 12U);
    EXPECT_EQ(count(1, true), 1 + 8 + 12U);
}

TEST(SequenceReader, IgnoresForgedAndUnknownLines)
{
    SequenceReader reader;
    Feed(reader, {"Tester=\"x\"", "NumGLGPUs=99999999999", "# Tester=", "glgpu[7].GLNews=1",
                  "Tester=\"again\""});
    EXPECT_EQ(reader.GetNextKey(), "glgpu[0].GLVersion");
    Feed(reader, {"assayEnd=\"x\""});
    EXPECT_EQ(reader.GetNextKey(), "");
    SequenceReader second;
    Feed(second, {"NumGLGPUs=1", "glgpu[1].GLFrameBufferOK=1"});
    EXPECT_EQ(second.GetNextKey(), "glgpu[0].GLVersion");
    SequenceReader third;
    Feed(third, {"glgpu[256].GLVersion=\"4.1\""});
    EXPECT_EQ(third.GetNextKey(), "Tester");
    Feed(third, {"assayEnd=1"});
    EXPECT_EQ(third.GetNextKey(), "assayEnd");
}

} // namespace
} // namespace assay_host
