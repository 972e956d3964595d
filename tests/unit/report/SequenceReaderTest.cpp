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
}

} // namespace
} // namespace assay_host
