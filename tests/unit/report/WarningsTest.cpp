#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "report/Warnings.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string> Warn(const std::string& text, const RunOutcome& outcome = {})
{
    const Report report = ReadReport(text);
    return GetWarnings(GetAnswers(report), outcome);
}

TEST(Warnings, AreNoneOfAGoodMachine)
{
    EXPECT_THAT(Warn(Sample(2, 2).GetText()), IsEmpty());
    EXPECT_THAT(Warn(Sample(1, -1).GetText()), IsEmpty());
    EXPECT_THAT(Warn(""), IsEmpty());
}

TEST(Warnings, TellEachSoftwareRenderer)
{
    for (const char* name :
         {"llvmpipe (LLVM 15.0.6, 256 bits)", "softpipe", "Google SwiftShader", "GDI Generic",
          "Software Rasterizer", "Microsoft Basic Render Driver", "LLVMPIPE"}) {
        const std::string value = "\"" + std::string(name) + "\"";
        EXPECT_THAT(
            Warn(Sample(1, 0).Set("glgpu[0].GLRenderer", value).GetText()),
            ElementsAre("glgpu[0]: software renderer, no graphics hardware: " + std::string(name)));
        EXPECT_THAT(
            Warn(Sample(1, 1).Set("clgpu[0].CLName", value).GetText()),
            ElementsAre("clgpu[0]: software renderer, no graphics hardware: " + std::string(name)));
    }
    EXPECT_THAT(Warn(Sample(1, 0).Set("glgpu[0].GLName", "\"softpipe\x1B\"").GetText()),
                ElementsAre("glgpu[0]: software renderer, no graphics hardware: softpipe\\x1B"));
}

TEST(Warnings, TellAFailedTrial)
{
    EXPECT_THAT(Warn(Sample(2, 0)
                         .Set("glgpu[1].CanCompileProgramGLSL", "0")
                         .Set("glgpu[1].GLFrameBufferOK", "0")
                         .GetText()),
                ElementsAre("glgpu[1]: a realistic pair of shaders doesn't compile and link",
                            "glgpu[1]: a framebuffer object can't be made, drawn to and found "
                            "complete"));
}

TEST(Warnings, TellADeviceThatNoAdapterMatches)
{
    EXPECT_THAT(Warn(Sample(1, 0).Set("glgpu[0].GLName", "\"\"").GetText()),
                ElementsAre("glgpu[0]: no adapter of the system matches it (no name)"));
    EXPECT_THAT(Warn(Sample(1, 0).Set("glgpu[0].GLVendorID", "0").GetText()),
                ElementsAre("glgpu[0]: no adapter of the system matches it (no vendor id)"));
    EXPECT_THAT(
        Warn(Sample(1, 0).Set("glgpu[0].GLVendorID", "0").Set("glgpu[0].GLName", "\"\"").GetText()),
        ElementsAre("glgpu[0]: no adapter of the system matches it (no name and no vendor id)"));
    EXPECT_THAT(Warn(Sample(1, 1).Set("clgpu[0].CLVendorID", "0").GetText()), IsEmpty());
}

TEST(Warnings, TellAFailedTest)
{
    EXPECT_THAT(Warn(Sample(1, 1)
                         .Fail("glgpu[0]", "GLRenderer")
                         .Fail("clgpu[0]", "CLPlatformVersion")
                         .GetText()),
                ElementsAre("glgpu[0]: a test failed: no answer from GLRenderer on",
                            "clgpu[0]: a test failed: no answer from CLPlatformVersion on"));
    EXPECT_THAT(Warn(Sample(1, 0).GetText() + "# x Testing terminated for glgpu[0]\n"),
                ElementsAre("glgpu[0]: a test failed"));
    EXPECT_THAT(Warn(Sample(1, 0).EndBehind("glgpu[0].GLName").GetText()), IsEmpty());
}

TEST(Warnings, TellAMeasurementThatIsNone)
{
    const auto warn = [](const char* bandwidth, const char* compute) {
        return Warn(Sample(1, 1)
                        .Set("clgpu[0].CLBandwidth", bandwidth)
                        .Set("clgpu[0].CLCompute", compute)
                        .GetText());
    };
    EXPECT_THAT(warn("0", "0"),
                ElementsAre("clgpu[0]: the copy bandwidth could not be measured: the device's "
                            "clock shows no time",
                            "clgpu[0]: the compute score could not be measured: the device's clock "
                            "shows no time"));
    EXPECT_THAT(warn("3.35544e+16", "8e+09"),
                ElementsAre("clgpu[0]: the copy bandwidth is implausible (3.35544e+16): the "
                            "device's clock can't be trusted",
                            "clgpu[0]: the compute score is implausible (8e+09): the device's "
                            "clock can't be trusted"));
    EXPECT_THAT(warn("inf", "-1"),
                ElementsAre("clgpu[0]: the copy bandwidth is implausible (inf): the device's clock "
                            "can't be trusted",
                            "clgpu[0]: the compute score is implausible (-1): the device's clock "
                            "can't be trusted"));
    EXPECT_THAT(warn("1e+13", "1e+08"), IsEmpty());
}

TEST(Warnings, TellFailedChecksOfTheReport)
{
    EXPECT_THAT(Warn(Sample(0, 0)
                         .Set("QGFCoreInitialized", "0")
                         .Set("QGFOGLInitialized", "0")
                         .Set("OGLContextCreated", "0")
                         .GetText()),
                ElementsAre("The graphics library doesn't start.",
                            "There is no OpenGL binding with a display device.",
                            "No OpenGL context can be made on the first display device.",
                            "No OpenGL device was found."));
}

TEST(Warnings, TellWhatWasLostAndLeft)
{
    RunOutcome outcome;
    outcome.fLostOutputBytes = 5;
    outcome.fLostErrorBytes = 6;
    outcome.fLeftBehind = true;
    std::string text;
    for (int index = 0; index < 258; ++index)
        text += "glgpu[" + std::to_string(index) + "].X=1\n";
    EXPECT_THAT(Warn(text, outcome),
                ElementsAre("A process of the child couldn't be ended and may still run.",
                            "The child's output was too much: 5 bytes of it were cut.",
                            "The child's standard error was too much: 6 bytes of it were cut.",
                            "2 more devices are left out."));
}

} // namespace
} // namespace assay_host
