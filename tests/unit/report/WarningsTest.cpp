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

std::vector<Warning> GetAll(const std::string& text, const RunOutcome& outcome = {})
{
    const Report report = ReadReport(text);
    return GetWarnings(GetAnswers(report), outcome);
}

std::vector<std::string> Warn(const std::string& text, const RunOutcome& outcome = {})
{
    std::vector<std::string> texts;
    for (const Warning& warning : GetAll(text, outcome))
        texts.push_back(GetWarningText(warning));
    return texts;
}

std::vector<std::string> GetCodes(const std::string& text, const RunOutcome& outcome = {})
{
    std::vector<std::string> codes;
    for (const Warning& warning : GetAll(text, outcome))
        codes.emplace_back(warning.fCode);
    return codes;
}

TEST(Warnings, HaveACodeAndTheirDevice)
{
    const std::vector<Warning> all = GetAll(Sample(2, 1)
                                                .Set("glgpu[1].GLRenderer", "\"softpipe\"")
                                                .Set("glgpu[1].GLVendorID", "0")
                                                .Set("glgpu[1].CanCompileProgramGLSL", "0")
                                                .Set("glgpu[1].GLFrameBufferOK", "0")
                                                .GetText());
    ASSERT_EQ(all.size(), 4U);
    EXPECT_EQ(all[0].fTag, "glgpu[1]");
    EXPECT_STREQ(all[0].fCode, "software");
    EXPECT_EQ(all[0].fText, "software renderer, no graphics hardware: softpipe");
    EXPECT_STREQ(all[1].fCode, "shader-trial-failed");
    EXPECT_STREQ(all[2].fCode, "framebuffer-trial-failed");
    EXPECT_STREQ(all[3].fCode, "no-adapter");
    EXPECT_THAT(GetCodes(Sample(0, 1)
                             .Set("QGFCoreInitialized", "0")
                             .Set("QGFOGLInitialized", "0")
                             .Set("OGLContextCreated", "0")
                             .Set("clgpu[0].CLBandwidth", "0")
                             .Set("clgpu[0].CLCompute", "-1")
                             .GetText()),
                ElementsAre("no-core-library", "no-opengl", "no-default-context",
                            "no-opengl-device", "no-measurement", "implausible-measurement"));
    RunOutcome outcome;
    outcome.fLeftBehind = true;
    outcome.fLostOutputBytes = 1;
    outcome.fLostErrorBytes = 1;
    EXPECT_THAT(GetCodes("glgpu[256].X=1\n", outcome),
                ElementsAre("left-behind", "output-lost", "error-output-lost", "devices-left-out"));
    EXPECT_THAT(GetCodes(Sample(1, 0).Fail("glgpu[0]", "GLName").GetText()),
                ElementsAre("device-failed"));
}

TEST(Warnings, AreNoneForAGoodMachine)
{
    EXPECT_THAT(Warn(Sample(2, 2).GetText()), IsEmpty());
    EXPECT_THAT(Warn(Sample(1, -1).GetText()), IsEmpty());
    EXPECT_THAT(Warn(""), IsEmpty());
}

TEST(Warnings, NameTheirCause)
{
    RunOutcome outcome;
    outcome.fCauses = {{"OGLContextCreated", "eglGetError is missing\x1B"},
                       {"glgpu[0].CanCompileProgramGLSL", "no"},
                       {"glgpu[0].glGetIntegerv[GL_MAX_DRAW_BUFFERS]", "returns 1282"}};
    EXPECT_THAT(Warn(Sample(1, 0)
                         .Set("OGLContextCreated", "0")
                         .Set("glgpu[0].CanCompileProgramGLSL", "0")
                         .Fail("glgpu[0]", "glGetIntegerv[GL_MAX_DRAW_BUFFERS]")
                         .GetText(),
                     outcome),
                ElementsAre("No OpenGL context could be created on the first display device: "
                            "eglGetError is missing\\x1B",
                            "glgpu[0]: a realistic pair of shaders does not compile and link: no",
                            "glgpu[0]: a test failed: no answer from "
                            "glGetIntegerv[GL_MAX_DRAW_BUFFERS] on: returns 1282"));
}

TEST(Warnings, NameEachSoftwareRenderer)
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

TEST(Warnings, NameAFailedTrial)
{
    EXPECT_THAT(Warn(Sample(2, 0)
                         .Set("glgpu[1].CanCompileProgramGLSL", "0")
                         .Set("glgpu[1].GLFrameBufferOK", "0")
                         .GetText()),
                ElementsAre("glgpu[1]: a realistic pair of shaders does not compile and link",
                            "glgpu[1]: no complete framebuffer object could be created and drawn "
                            "to"));
}

TEST(Warnings, NameADeviceThatMatchesNoAdapter)
{
    EXPECT_THAT(Warn(Sample(1, 0).Set("glgpu[0].GLName", "\"\"").GetText()),
                ElementsAre("glgpu[0]: matches no adapter of the system (no name)"));
    EXPECT_THAT(Warn(Sample(1, 0).Set("glgpu[0].GLVendorID", "0").GetText()),
                ElementsAre("glgpu[0]: matches no adapter of the system (no vendor id)"));
    EXPECT_THAT(
        Warn(Sample(1, 0).Set("glgpu[0].GLVendorID", "0").Set("glgpu[0].GLName", "\"\"").GetText()),
        ElementsAre("glgpu[0]: matches no adapter of the system (no name and no vendor id)"));
    EXPECT_THAT(Warn(Sample(1, 1).Set("clgpu[0].CLVendorID", "0").GetText()), IsEmpty());
}

TEST(Warnings, NameADeviceWithAFailedTest)
{
    EXPECT_THAT(Warn(Sample(1, 1)
                         .Fail("glgpu[0]", "GLRenderer")
                         .Fail("clgpu[0]", "CLPlatformVersion")
                         .GetText()),
                ElementsAre("glgpu[0]: a test failed: no answer from GLRenderer on",
                            "clgpu[0]: a test failed: no answer from CLPlatformVersion on"));
    EXPECT_THAT(Warn(Sample(1, 0).GetText() + "# x Testing terminated for glgpu[0]\n"),
                ElementsAre("glgpu[0]: a test failed"));
    EXPECT_THAT(Warn(Sample(1, 0).EndAfter("glgpu[0].GLName").GetText()), IsEmpty());
}

TEST(Warnings, NameAnImpossibleMeasurement)
{
    const auto warn = [](const char* bandwidth, const char* compute) {
        return Warn(Sample(1, 1)
                        .Set("clgpu[0].CLBandwidth", bandwidth)
                        .Set("clgpu[0].CLCompute", compute)
                        .GetText());
    };
    EXPECT_THAT(warn("0", "0"),
                ElementsAre("clgpu[0]: the copy bandwidth could not be measured: the device's "
                            "clock reported no elapsed time",
                            "clgpu[0]: the compute score could not be measured: the device's clock "
                            "reported no elapsed time"));
    EXPECT_THAT(warn("3.35544e+16", "8e+09"),
                ElementsAre("clgpu[0]: the copy bandwidth is implausible (3.35544e+16): the "
                            "device's clock is unreliable",
                            "clgpu[0]: the compute score is implausible (8e+09): the device's "
                            "clock is unreliable"));
    EXPECT_THAT(warn("inf", "-1"),
                ElementsAre("clgpu[0]: the copy bandwidth is implausible (inf): the device's clock "
                            "is unreliable",
                            "clgpu[0]: the compute score is implausible (-1): the device's clock "
                            "is unreliable"));
    EXPECT_THAT(warn("1e+13", "1e+08"), IsEmpty());
}

TEST(Warnings, NameFailedChecksOfTheReport)
{
    EXPECT_THAT(Warn(Sample(0, 0)
                         .Set("QGFCoreInitialized", "0")
                         .Set("QGFOGLInitialized", "0")
                         .Set("OGLContextCreated", "0")
                         .GetText()),
                ElementsAre("The graphics library could not be initialized.",
                            "OpenGL could not be initialized on any display device.",
                            "No OpenGL context could be created on the first display device.",
                            "There is no OpenGL device on which a context can be created."));
}

TEST(Warnings, NameLostBytesAndProcessesLeftBehind)
{
    RunOutcome outcome;
    outcome.fLostOutputBytes = 5;
    outcome.fLostErrorBytes = 6;
    outcome.fLeftBehind = true;
    std::string text;
    for (int index = 0; index < 258; ++index)
        text += "glgpu[" + std::to_string(index) + "].X=1\n";
    EXPECT_THAT(Warn(text, outcome),
                ElementsAre("A process of assay could not be killed and may still run.",
                            "assay wrote too much output: 5 bytes were dropped.",
                            "assay wrote too much to standard error: 6 bytes were dropped.",
                            "2 more devices are left out."));
}

} // namespace
} // namespace assay_host
