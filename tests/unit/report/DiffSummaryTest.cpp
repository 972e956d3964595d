#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/CompareRuns.h"
#include "report/DiffSummary.h"

namespace assay_host {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

StoredRun MakeRun(Sample sample, Verdict verdict = Verdict::kComplete)
{
    StoredRun run;
    run.fReport = ReadReport(sample.GetText());
    run.fOutcome.fVerdict = verdict;
    return run;
}

std::string GetHeadline(const StoredRun& before, const StoredRun& after)
{
    return GetDiffHeadline(CompareRuns(before, after, {}));
}

std::vector<std::string> GetSteps(const StoredRun& before, const StoredRun& after)
{
    return GetDiffSteps(CompareRuns(before, after, {}), after);
}

const Sample kGood(1, 1);
const char* const kLinkKey = "glgpu[0].CanCompileProgramGLSL";

TEST(DiffSummary, OfTheSame)
{
    EXPECT_EQ(GetHeadline(MakeRun(kGood), MakeRun(kGood)), "The reports do not differ.");
    EXPECT_THAT(GetSteps(MakeRun(kGood), MakeRun(kGood)), IsEmpty());
}

TEST(DiffSummary, SaysFirstWhatCanBeUsed)
{
    const StoredRun broken = MakeRun(Sample(1, 1).Set(kLinkKey, "0"));
    EXPECT_EQ(GetHeadline(MakeRun(kGood), broken),
              "OpenGL: hardware in the first report, broken in the second.");
    const StoredRun crashed =
        MakeRun(Sample(1, 1).EndAfter("glgpu[0].GLVersion"), Verdict::kCrashed);
    EXPECT_EQ(GetHeadline(MakeRun(kGood), crashed),
              "OpenGL: hardware in the first report, broken in the second; "
              "OpenCL: hardware in the first report, unknown in the second.");
    EXPECT_EQ(GetHeadline(broken, MakeRun(Sample(1, 1).Set("glgpu[0].GLFrameBufferOK", "0"))),
              "OpenGL: broken (shader-trial-failed) in the first report, "
              "broken (framebuffer-trial-failed) in the second.");
}

TEST(DiffSummary, SaysHowTheRunEndedOrCounts)
{
    const StoredRun failed = MakeRun(kGood, Verdict::kFailedTests);
    EXPECT_EQ(GetHeadline(MakeRun(kGood), failed),
              "Verdict: complete in the first report, failed-tests in the second.");
    EXPECT_EQ(GetHeadline(MakeRun(kGood), MakeRun(Sample(1, 1).Set("clgpu[0].CLCompute", "99"))),
              "1 measurement differs.");
    EXPECT_EQ(GetHeadline(MakeRun(kGood), MakeRun(Sample(1, 1)
                                                      .Set("clgpu[0].CLCompute", "99")
                                                      .Set("clgpu[0].CLName", "\"B\"")
                                                      .Set("glgpu[0].GLMemoryMB", "1")
                                                      .Set("QGFCoreInitialized", "0"))),
              "1 trial, 2 facts and 1 measurement differ.");
}

TEST(DiffSummary, SaysWhatToDoIfTheSecondIsWorse)
{
    const StoredRun good = MakeRun(kGood);
    const StoredRun broken =
        MakeRun(Sample(1, 1).Set(kLinkKey, "0").Set("glgpu[0].GLDriverVersion", "\"32.0\""));
    EXPECT_THAT(
        GetSteps(good, broken).front(),
        "The OpenGL driver is another one (32.0 instead of 31.0.15.2802). Install that of "
        "the first report again, and compare once more: this shows whether it is the cause.");
    EXPECT_THAT(GetSteps(good, broken), Contains(HasSubstr("Update the graphics driver")));
    // Of the other interface, and without a failure.
    EXPECT_THAT(
        GetSteps(good,
                 MakeRun(Sample(1, 1).Set(kLinkKey, "0").Set("clgpu[0].CLDriverVersion", "\"2\""))),
        Not(Contains(HasSubstr("driver is another one"))));
    EXPECT_THAT(GetSteps(broken, good), IsEmpty());
    EXPECT_THAT(GetSteps(good, MakeRun(Sample(1, 1).Fail("clgpu[0]", "CLName"))),
                Contains(HasSubstr("Update the graphics driver")));
}

TEST(DiffSummary, SaysWhatToDoWithoutADeviceOrItsSpeed)
{
    EXPECT_THAT(
        GetSteps(MakeRun(Sample(2, 0)), MakeRun(Sample(1, 0))),
        ElementsAre("Check that glgpu[1] \"Accelerator 4000\" is still in the machine, that "
                    "its driver is installed, and that this user may open it."));
    EXPECT_THAT(GetSteps(MakeRun(Sample(1, 0)), MakeRun(Sample(2, 0))), IsEmpty());
    const auto withSpeed = [](const char* speed) {
        return MakeRun(Sample(0, 1).Set("clgpu[0].CLBandwidth", speed));
    };
    EXPECT_THAT(GetSteps(withSpeed("2e11"), withSpeed("1e11")),
                ElementsAre(HasSubstr("One run can be slow by chance")));
    EXPECT_THAT(GetSteps(withSpeed("1e11"), withSpeed("2e11")), IsEmpty());
    // No measurement.
    EXPECT_THAT(GetSteps(withSpeed("1e30"), withSpeed("1e11")), IsEmpty());
}

} // namespace
} // namespace assay_host
