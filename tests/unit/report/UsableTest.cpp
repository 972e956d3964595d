#include <gtest/gtest.h>

#include <iterator>
#include <ostream>
#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/Usable.h"

namespace assay_host {
namespace {

// Returns "STATE reason device".
std::string Show(const Usable& usable)
{
    return std::string(GetUsabilityName(usable.fUsability)) + " " + usable.fReason +
           (usable.fTag.empty() ? "" : " " + usable.fTag);
}

struct Both {
    std::string fGL;
    std::string fCL;
};

bool operator==(const Both& a, const Both& b)
{
    return a.fGL == b.fGL && a.fCL == b.fCL;
}

std::ostream& operator<<(std::ostream& out, const Both& both)
{
    return out << "OpenGL: " << both.fGL << "; OpenCL: " << both.fCL;
}

Both Judge(const std::string& text, const RunOutcome& outcome)
{
    const Report report = ReadReport(text);
    const Answers answers = GetAnswers(report);
    Both both;
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        const Usable usable = JudgeUsable(kind, answers, outcome);
        EXPECT_FALSE(usable.fText.empty());
        EXPECT_EQ(usable.fText.back(), '.') << usable.fText;
        (kind == DeviceKind::kOpenGL ? both.fGL : both.fCL) = Show(usable);
    }
    return both;
}

Both Judge(Sample sample, Verdict verdict = Verdict::kComplete)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    return Judge(sample.GetText(), outcome);
}

const std::string kGood = "hardware trials-passed glgpu[0]";
const std::string kGoodCL = "hardware trials-passed clgpu[0]";

TEST(Usable, IsHardwareWhereADevicePassedItsTrials)
{
    EXPECT_EQ(Judge(Sample(1, 1)), (Both{kGood, kGoodCL}));
    EXPECT_EQ(Judge(Sample(2, 2).Set("glgpu[0].GLRenderer", "\"llvmpipe\"")),
              (Both{"hardware trials-passed glgpu[1]", kGoodCL}));
    EXPECT_EQ(Judge(Sample(2, 2).Fail("glgpu[0]", "GLVendor").Fail("clgpu[0]", "CLCompute"),
                    Verdict::kFailedTests),
              (Both{"hardware trials-passed glgpu[1]", "hardware trials-passed clgpu[1]"}));
}

TEST(Usable, IsHardwareWhereADeviceFailsOnlyAfterItsTrials)
{
    EXPECT_EQ(Judge(Sample(1, 0).Fail("glgpu[0]", "glGetIntegerv[GL_MAX_DRAW_BUFFERS]"),
                    Verdict::kFailedTests)
                  .fGL,
              kGood);
}

TEST(Usable, IsSoftwareWhereOnlySoftwareWorks)
{
    EXPECT_EQ(Judge(Sample(1, 1)
                        .Set("glgpu[0].GLRenderer", "\"softpipe\"")
                        .Set("clgpu[0].CLDeviceVersion", "\"3.0 PoCL HSTR: cpu-x\"")),
              (Both{"software only-software glgpu[0]", "software only-software clgpu[0]"}));
    EXPECT_EQ(Judge(Sample(2, 0)
                        .Set("glgpu[1].GLRenderer", "\"softpipe\"")
                        .Set("glgpu[0].CanCompileProgramGLSL", "0"))
                  .fGL,
              "software others-failed glgpu[1]");
}

TEST(Usable, IsBrokenWhereEachDeviceFailsATrial)
{
    EXPECT_EQ(Judge(Sample(1, 1).Set("glgpu[0].CanCompileProgramGLSL", "0")),
              (Both{"broken shader-trial-failed glgpu[0]", kGoodCL}));
    EXPECT_EQ(Judge(Sample(1, 1).Set("glgpu[0].GLFrameBufferOK", "0")),
              (Both{"broken framebuffer-trial-failed glgpu[0]", kGoodCL}));
    EXPECT_EQ(Judge(Sample(1, 1).Fail("glgpu[0]", "GLVendor").Fail("clgpu[0]", "CLBandwidth"),
                    Verdict::kFailedTests),
              (Both{"broken device-failed glgpu[0]", "broken device-failed clgpu[0]"}));
    EXPECT_EQ(Judge(Sample(1, 0)
                        .Set("glgpu[0].GLRenderer", "\"GDI Generic\"")
                        .Set("glgpu[0].CanCompileProgramGLSL", "0"))
                  .fGL,
              "broken shader-trial-failed glgpu[0]");
}

TEST(Usable, IsBrokenWhereNoContextCouldBeCreated)
{
    RunOutcome outcome;
    outcome.fErrorLines = {"ContextOffscreen exception caught and ignored."};
    EXPECT_EQ(Judge(Sample(0, 0).Set("OGLContextCreated", "0").GetText(), outcome),
              (Both{"broken context-failed", "absent no-device"}));
    EXPECT_EQ(Judge(Sample(1, 0).GetText(), outcome).fGL, kGood);
}

// The child's line may come after bytes of the driver, or be lost among them.
TEST(Usable, IsBrokenWithoutAContextThoughTheDriverWritesToStandardErrorToo)
{
    const std::string report = Sample(0, 0).Set("OGLContextCreated", "0").GetText();
    RunOutcome outcome;
    outcome.fErrorLines = {"warnContextOffscreen exception caught and ignored."};
    EXPECT_EQ(Judge(report, outcome).fGL, "broken context-failed");
    outcome.fErrorLines = {"ContextOffscreen exception caught and ignored. No"};
    EXPECT_EQ(Judge(report, outcome).fGL, "absent no-device");
    outcome.fCauses = {{"OGLContextCreated", "out of memory"}};
    EXPECT_EQ(Judge(report, outcome).fGL, "broken context-failed");
    const std::string without =
        Sample(0, 0).Set("QGFOGLInitialized", "0").Set("OGLContextCreated", "0").GetText();
    EXPECT_EQ(Judge(without, outcome).fGL, "absent no-device");
}

// A child that ended as it should says that no test failed, so that missing lines are lost ones.
TEST(Usable, IsUnknownWhereLinesOfTheTrialsAreLost)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kComplete;
    outcome.fExitStatus = 0;
    const std::string unreadable = "unknown unreadable";
    const std::string lost =
        Sample(1, 1).Fail("glgpu[0]", "GLVendor").Fail("clgpu[0]", "CLBandwidth").GetText();
    EXPECT_EQ(Judge(lost, outcome), (Both{unreadable, unreadable}));
    EXPECT_EQ(Judge(Sample(1, 0).Set("glgpu[0].GLFrameBufferOK", "").GetText(), outcome).fGL,
              unreadable);
    EXPECT_EQ(Judge(Sample(1, 0).Set("glgpu[0].CanCompileProgramGLSL", "").GetText(), outcome).fGL,
              unreadable);
    EXPECT_EQ(Judge(Sample(2, 0).Fail("glgpu[0]", "GLVendor").GetText(), outcome).fGL,
              "hardware trials-passed glgpu[1]");
    Sample software =
        Sample(2, 0).Set("glgpu[1].GLRenderer", "\"softpipe\"").Fail("glgpu[0]", "GLVendor");
    EXPECT_EQ(Judge(software.GetText(), outcome).fGL, unreadable);
    outcome.fExitStatus.reset(); // as after the end of a stored report
    EXPECT_EQ(Judge(lost, outcome),
              (Both{"broken device-failed glgpu[0]", "broken device-failed clgpu[0]"}));
    outcome.fVerdict = Verdict::kFailedTests;
    outcome.fExitStatus = 2;
    EXPECT_EQ(Judge(lost, outcome),
              (Both{"broken device-failed glgpu[0]", "broken device-failed clgpu[0]"}));
}

// The report of a child that ended by itself stops where the limit of its output was reached.
TEST(Usable, IsUnknownWhereTheReportWasDropped)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kFailedTests;
    outcome.fExitStatus = 0;
    const std::string text = Sample(1, 1).EndAfter("glgpu[0].GLVendor").GetText();
    EXPECT_EQ(Judge(text, outcome).fGL, "broken ended glgpu[0]");
    outcome.fLostOutputBytes = 1;
    EXPECT_EQ(Judge(text, outcome), (Both{"unknown unreadable", "unknown ended-before"}));
    outcome.fVerdict = Verdict::kCrashed;
    outcome.fExitStatus.reset();
    EXPECT_EQ(Judge(text, outcome).fGL, "broken crashed glgpu[0]");
}

TEST(Usable, IsAbsentWithoutALibraryOrADevice)
{
    EXPECT_EQ(Judge(Sample(0, 0)), (Both{"absent no-device", "absent no-device"}));
    EXPECT_EQ(Judge(Sample(0, -1)), (Both{"absent no-device", "absent no-library"}));
    const auto judge = [](const char* cause) {
        RunOutcome outcome;
        outcome.fCauses = {{"QGFOGLInitialized", cause}};
        return Judge(Sample(0, 0).Set("QGFOGLInitialized", "0").GetText(), outcome).fGL;
    };
    EXPECT_EQ(Judge(Sample(0, 0).Set("QGFOGLInitialized", "")).fGL, "absent no-device");
    RunOutcome other;
    other.fCauses = {{"QGFOGLInitialized", "libEGL.so.1 can't be opened"}};
    EXPECT_EQ(Judge(Sample(0, 0).GetText(), other).fGL, "absent no-device");
    EXPECT_EQ(judge("libEGL.so.1 can't be opened (x)"), "absent no-library");
    EXPECT_EQ(judge("OpenGL has no display device on this machine"), "absent no-device");
    EXPECT_EQ(judge("eglGetError is not offered by this EGL library"), "broken library-failed");
}

TEST(Usable, BlamesTheInterfaceThatTheChildWasAt)
{
    struct Row {
        const char* fLastKey;
        Both fExpected; // after a crash
    };
    const Row rows[] = {
        {"assayStart", {"unknown ended-before", "unknown ended-before"}},
        {"QGFCoreInitialized", {"broken crashed", "unknown ended-before"}},
        {"QGFOGLInitialized", {"broken crashed", "unknown ended-before"}},
        {"OGLContextCreated", {"broken crashed", "unknown ended-before"}},
        {"NumGLGPUs", {"broken crashed glgpu[0]", "unknown ended-before"}},
        {"glgpu[0].GLVersion", {"broken crashed glgpu[1]", "unknown ended-before"}},
        {"glgpu[1].CanCompileProgramGLSL", {"broken crashed glgpu[0]", "unknown ended-before"}},
        {"glgpu[1].GLFrameBufferOK", {"broken crashed", "unknown ended-before"}},
        {"glgpu[1].extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]", {kGood, "broken crashed"}},
        {"NumCLGPUs", {kGood, "broken crashed clgpu[0]"}},
        {"clgpu[1].CLPlatformVersion", {kGood, "broken crashed clgpu[0]"}},
        {"clgpu[0].CLCompute", {kGood, "broken crashed clgpu[1]"}},
        {"clgpu[1].CLCompute", {kGood, kGoodCL}},
        {"assayEnd", {kGood, kGoodCL}},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(Judge(Sample(2, 2).EndAfter(row.fLastKey), Verdict::kCrashed), row.fExpected)
            << row.fLastKey;
    }
    EXPECT_EQ(Judge(Sample(1, 1).EndAfter("NumGLGPUs"), Verdict::kHung).fGL,
              "broken hung glgpu[0]");
    EXPECT_EQ(Judge(Sample(1, 1).EndAfter("NumGLGPUs"), Verdict::kFailedTests).fGL,
              "broken ended glgpu[0]");
}

TEST(Usable, BlamesTheInterfaceOfADeviceThatIsGivenBack)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kCrashed;
    outcome.fLastLogLine = "# 00013.x[tid=1] Testing terminated for glgpu[0]";
    const std::string text =
        Sample(1, 1).Fail("glgpu[0]", "GLVendor").EndAfter("glgpu[0].GLName").GetText();
    EXPECT_EQ(Judge(text + "# x Testing terminated for glgpu[0]\n", outcome),
              (Both{"broken crashed", "unknown ended-before"}));
    outcome.fLastLogLine = "# 00013.x[tid=1] Testing terminated for clgpu[0]";
    EXPECT_EQ(Judge(Sample(1, 1).EndAfter("clgpu[0].CLBandwidth").GetText() +
                        "# x Testing terminated for clgpu[0]\n",
                    outcome),
              (Both{kGood, "broken crashed"}));
}

TEST(Usable, IsUnknownWhereTheRunSaysNothing)
{
    EXPECT_EQ(Judge("", {}), (Both{"unknown never-started", "unknown never-started"}));
    EXPECT_EQ(Judge(Sample(0, 0).EndAfter("Tester"), Verdict::kUsageError),
              (Both{"unknown usage-error", "unknown usage-error"}));
    EXPECT_EQ(Judge(Sample(1, 1).EndAfter("NumGLGPUs"), Verdict::kInterrupted),
              (Both{"unknown interrupted", "unknown interrupted"}));
    EXPECT_EQ(Judge(Sample(1, 1).EndAfter("NumCLGPUs"), Verdict::kInterrupted),
              (Both{kGood, "unknown interrupted"}));
    EXPECT_EQ(Judge(Sample(1, 1).Set("NumGLGPUs", ""), Verdict::kComplete),
              (Both{"unknown unreadable", kGoodCL}));
    RunOutcome ended;
    ended.fVerdict = Verdict::kFailedTests;
    EXPECT_EQ(Judge("words\n", ended), (Both{"unknown ended-before", "unknown ended-before"}));
}

TEST(GetUsabilityStatus, IsOneForEachState)
{
    EXPECT_EQ(GetUsabilityStatus(Usability::kHardware), 0);
    EXPECT_EQ(GetUsabilityStatus(Usability::kSoftware), 20);
    EXPECT_EQ(GetUsabilityStatus(Usability::kBroken), 21);
    EXPECT_EQ(GetUsabilityStatus(Usability::kAbsent), 22);
    EXPECT_EQ(GetUsabilityStatus(Usability::kUnknown), 23);
}

TEST(GetLesser, OrdersTheStates)
{
    const Usability order[] = {Usability::kBroken, Usability::kAbsent, Usability::kUnknown,
                               Usability::kSoftware, Usability::kHardware};
    for (auto less = std::begin(order); less != std::end(order); ++less) {
        for (auto other = less; other != std::end(order); ++other) {
            EXPECT_EQ(GetLesser(*less, *other), *less);
            EXPECT_EQ(GetLesser(*other, *less), *less);
        }
    }
}

TEST(Usable, SaysWhichDeviceIsMeant)
{
    const Report report = ReadReport(Sample(2, 0)
                                         .Set("glgpu[0].CanCompileProgramGLSL", "0")
                                         .Set("glgpu[1].CanCompileProgramGLSL", "0")
                                         .GetText());
    EXPECT_EQ(
        JudgeUsable(DeviceKind::kOpenGL, GetAnswers(report), {}).fText,
        "OpenGL does not work: glgpu[0]: a realistic pair of shaders does not compile and link.");
}

} // namespace
} // namespace assay_host
