// The sentences about what can be used, to the letter.
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "report/Usable.h"

namespace assay_host {
namespace {

RunOutcome MakeOutcome(Verdict verdict, std::vector<Cause> causes = {})
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fCauses = std::move(causes);
    return outcome;
}

std::string GetText(DeviceKind kind, Sample sample, const RunOutcome& outcome)
{
    const Report report = ReadReport(sample.GetText());
    return JudgeUsable(kind, GetAnswers(report), outcome).fText;
}

std::string GetText(DeviceKind kind, const Sample& sample, Verdict verdict = Verdict::kComplete)
{
    return GetText(kind, sample, MakeOutcome(verdict));
}

constexpr DeviceKind kGL = DeviceKind::kOpenGL;
constexpr DeviceKind kCL = DeviceKind::kOpenCL;

TEST(UsableText, OfWhatWorks)
{
    EXPECT_EQ(GetText(kGL, Sample(1, 1)), "OpenGL works on graphics hardware.");
    EXPECT_EQ(GetText(kCL, Sample(1, 1)), "OpenCL works on graphics hardware.");
    Sample software = Sample(2, 0).Set("glgpu[0].GLRenderer", "\"softpipe\"");
    EXPECT_EQ(GetText(kGL, Sample(1, 0).Set("glgpu[0].GLRenderer", "\"softpipe\"")),
              "OpenGL works in software alone.");
    EXPECT_EQ(GetText(kGL, software.Set("glgpu[1].GLFrameBufferOK", "0")),
              "OpenGL works in software alone: glgpu[1] does not work.");
}

TEST(UsableText, OfAFailedTrialAndItsCause)
{
    const struct {
        const char* fKey;
        const char* fText;
    } rows[] = {
        {"glgpu[0].CanCompileProgramGLSL", "a realistic pair of shaders does not compile and link"},
        {"glgpu[0].GLFrameBufferOK",
         "no complete framebuffer object could be created and drawn to"}};
    for (const auto& row : rows) {
        const Sample failed = Sample(1, 0).Set(row.fKey, "0");
        EXPECT_EQ(GetText(kGL, failed),
                  std::string("OpenGL does not work: glgpu[0]: ") + row.fText + ".");
        EXPECT_EQ(
            GetText(kGL, failed, MakeOutcome(Verdict::kComplete, {{row.fKey, "a \x1B cause"}})),
            std::string("OpenGL does not work: glgpu[0]: ") + row.fText + ": a \\x1B cause.");
    }
}

TEST(UsableText, OfADeviceWithoutItsTrials)
{
    EXPECT_EQ(GetText(kGL, Sample(1, 0).Fail("glgpu[0]", "GLVendor"),
                      MakeOutcome(Verdict::kFailedTests, {{"glgpu[0].GLVendor", "x"}})),
              "OpenGL does not work: glgpu[0]: a test failed: x.");
    EXPECT_EQ(GetText(kCL, Sample(0, 1).Fail("clgpu[0]", "CLName"),
                      MakeOutcome(Verdict::kFailedTests, {{"clgpu[0].CLName", "y"}})),
              "OpenCL does not work: clgpu[0]: a test failed: y.");
    EXPECT_EQ(GetText(kGL, Sample(1, 0).Set("glgpu[0].GLFrameBufferOK", "")),
              "OpenGL does not work: glgpu[0]: its trials have no answer.");
    const Report report = ReadReport(Sample(1, 0).Set("glgpu[0].GLFrameBufferOK", "").GetText());
    EXPECT_STREQ(JudgeUsable(kGL, GetAnswers(report), MakeOutcome(Verdict::kComplete)).fReason,
                 "no-trial");
}

TEST(UsableText, OfAnEndBefore)
{
    EXPECT_EQ(GetText(kGL, Sample(0, 0).EndAfter("Tester"), Verdict::kNeverStarted),
              "assay could not be started.");
    EXPECT_EQ(GetText(kCL, Sample(0, 0).EndAfter("Tester"), Verdict::kUsageError),
              "assay rejected its command line.");
    const Sample early = Sample(1, 1).EndAfter("assayStart");
    EXPECT_EQ(GetText(kGL, early, Verdict::kInterrupted),
              "The run was interrupted before OpenGL was tried.");
    EXPECT_EQ(GetText(kCL, early, Verdict::kInterrupted),
              "The run was interrupted before OpenCL was tried.");
    EXPECT_EQ(GetText(kGL, early, Verdict::kCrashed), "The run ended before OpenGL was tried.");
    EXPECT_EQ(GetText(kCL, early, Verdict::kHung), "The run ended before OpenCL was tried.");
    EXPECT_EQ(GetText(kGL, Sample(1, 1).Set("NumGLGPUs", "")),
              "Lines of the report about OpenGL are missing or garbled.");
}

TEST(UsableText, OfAnEndDuringAnInterface)
{
    const std::pair<Verdict, const char*> rows[] = {
        {Verdict::kCrashed, "crashed"}, {Verdict::kHung, "hung"}, {Verdict::kFailedTests, "ended"}};
    for (const auto& [verdict, word] : rows) {
        EXPECT_EQ(GetText(kGL, Sample(1, 1).EndAfter("OGLContextCreated"), verdict),
                  std::string("assay ") + word +
                      " in OpenGL, while creating an OpenGL context on each display device "
                      "(NumGLGPUs).");
        EXPECT_EQ(GetText(kCL, Sample(0, 1).EndAfter("clgpu[0].CLBandwidth"), verdict),
                  std::string("assay ") + word +
                      " in OpenCL, while measuring the compute speed (clgpu[0].CLCompute).");
    }
}

TEST(UsableText, OfAMachineWithout)
{
    EXPECT_EQ(GetText(kGL, Sample(0, 0)), "OpenGL has no device.");
    EXPECT_EQ(GetText(kCL, Sample(0, 0)),
              "There is an OpenCL library, but it has no graphics device.");
    EXPECT_EQ(GetText(kCL, Sample(0, -1)), "There is no OpenCL library that can be used.");
    const auto getWith = [](const char* cause) {
        return GetText(kGL, Sample(0, 0).Set("QGFOGLInitialized", "0"),
                       MakeOutcome(Verdict::kComplete, {{"QGFOGLInitialized", cause}}));
    };
    EXPECT_EQ(getWith("libEGL.so.1 can't be opened (x)"), "There is no OpenGL library.");
    EXPECT_EQ(getWith("OpenGL has no display device on this machine"), "OpenGL has no device.");
    EXPECT_EQ(getWith("odd \x1B"), "The OpenGL library does not work: odd \\x1B.");
}

TEST(UsableText, OfNoContext)
{
    RunOutcome outcome = MakeOutcome(Verdict::kComplete);
    outcome.fErrorLines = {"before", "ContextOffscreen exception caught and ignored."};
    EXPECT_EQ(GetText(kGL, Sample(0, 0), outcome),
              "No OpenGL context could be created on any display device.");
    outcome.fCauses = {{"OGLContextCreated", "out of \xFF"}};
    EXPECT_EQ(GetText(kGL, Sample(0, 0), outcome),
              "No OpenGL context could be created on any display device: out of \\xFF.");
}

} // namespace
} // namespace assay_host
