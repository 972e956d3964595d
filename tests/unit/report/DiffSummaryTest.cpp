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
    StoredRun other = MakeRun(kGood);
    other.fOutcome.fExitStatus = 9;
    EXPECT_EQ(GetHeadline(MakeRun(kGood), other),
              "Verdict: complete in the first report, complete: exit status 9 in the second.");
    EXPECT_EQ(GetHeadline(MakeRun(kGood), MakeRun(Sample(1, 1).Set("clgpu[0].CLCompute", "99"))),
              "1 measurement differs.");
    EXPECT_EQ(GetHeadline(MakeRun(kGood), MakeRun(Sample(1, 1)
                                                      .Set("clgpu[0].CLCompute", "99")
                                                      .Set("clgpu[0].CLName", "\"B\"")
                                                      .Set("glgpu[0].GLMemoryMB", "1")
                                                      .Set("QGFCoreInitialized", "0"))),
              "1 trial, 2 facts and 1 measurement differ.");
}

// One and two differences of each group.
TEST(DiffSummary, NamesWhatItCounts)
{
    const struct {
        DiffGroup fGroup;
        const char* fOne;
        const char* fTwo;
    } rows[] = {
        {DiffGroup::kRun, "1 end of the run differs.", "2 ends of the run differ."},
        {DiffGroup::kTrials, "1 trial differs.", "2 trials differ."},
        {DiffGroup::kDevices, "1 entry of the device list differs.",
         "2 entries of the device list differ."},
        {DiffGroup::kFacts, "1 fact differs.", "2 facts differ."},
        {DiffGroup::kMeasurements, "1 measurement differs.", "2 measurements differ."},
        {DiffGroup::kIdentity, "1 name or time differs.", "2 names or times differ."},
        {DiffGroup::kOthers, "1 other line differs.", "2 other lines differ."},
    };
    for (const auto& row : rows) {
        Comparison comparison;
        Difference difference;
        difference.fGroup = row.fGroup;
        difference.fKey = "report";
        comparison.fDifferences.push_back(difference);
        EXPECT_EQ(GetDiffHeadline(comparison), row.fOne);
        comparison.fDifferences.push_back(difference);
        EXPECT_EQ(GetDiffHeadline(comparison), row.fTwo);
    }
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

// A second device hides the failure of the first one from what can be used.
TEST(DiffSummary, SaysWhatToDoIfADeviceIsWorse)
{
    const StoredRun good = MakeRun(Sample(2, 2));
    const char* const update = "Update the graphics driver, or reinstall it.";
    const StoredRun failed = MakeRun(Sample(2, 2)
                                         .Fail("clgpu[1]", "CLCompute")
                                         .Set("glgpu[1].GLDriverVersion", "\"32.0\"")
                                         .Set("clgpu[1].CLDriverVersion", "\"600\""));
    EXPECT_THAT(GetSteps(good, failed),
                ElementsAre("The OpenCL driver is another one (600 instead of 528.02). Install "
                            "that of the first report again, and compare once more: this shows "
                            "whether it is the cause."));
    EXPECT_THAT(GetSteps(failed, good), IsEmpty());
    const auto withTrial = [](const char* value, const char* driver) {
        return MakeRun(Sample(2, 0)
                           .Set("glgpu[1].GLFrameBufferOK", value)
                           .Set("glgpu[1].GLDriverVersion", driver));
    };
    EXPECT_THAT(GetSteps(withTrial("1", "\"1\""), withTrial("0", "\"2\"")),
                Contains(HasSubstr("another one (2 instead of 1)")));
    EXPECT_THAT(GetSteps(withTrial("0", "\"1\""), withTrial("1", "\"2\"")), IsEmpty());
    // The value or a version isn't known.
    EXPECT_THAT(GetSteps(withTrial("1", "\"1\""), withTrial("", "\"2\"")), IsEmpty());
    EXPECT_THAT(GetSteps(withTrial("", "\"1\""), withTrial("0", "\"2\"")), IsEmpty());
    EXPECT_THAT(GetSteps(withTrial("1", "\"1\""), withTrial("0", "\"?\"")), IsEmpty());
    EXPECT_THAT(GetSteps(withTrial("1", "\"?\""), withTrial("0", "\"2\"")), IsEmpty());
    // What isn't a trial.
    EXPECT_THAT(GetSteps(good, MakeRun(Sample(2, 2)
                                           .Set("glgpu[0].HasGLNPOTSupport", "0")
                                           .Set("glgpu[1].GLMemoryMB", "1")
                                           .Set("glgpu[1].GLDriverVersion", "\"32.0\""))),
                IsEmpty());
    // What was as bad before.
    EXPECT_THAT(GetSteps(MakeRun(Sample(1, 0).Set(kLinkKey, "0")),
                         MakeRun(Sample(1, 0).Set(kLinkKey, "0").Set("glgpu[0].GLMemoryMB", "1"))),
                IsEmpty());
    const Sample ended = Sample(1, 0).EndAfter("glgpu[0].GLVersion");
    EXPECT_EQ(GetHeadline(MakeRun(ended, Verdict::kCrashed), MakeRun(ended, Verdict::kHung)),
              "OpenGL: broken (crashed) in the first report, broken (hung) in the second.");
    EXPECT_THAT(GetSteps(MakeRun(ended, Verdict::kCrashed), MakeRun(ended, Verdict::kHung)),
                IsEmpty());
    EXPECT_THAT(GetSteps(MakeRun(Sample(1, 0)), MakeRun(Sample(1, 0).Set(kLinkKey, "0"))),
                Contains(update));
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
                ElementsAre("One run can be slow by chance: end other programs, and run and "
                            "compare again before you call a device slower."));
    EXPECT_THAT(GetSteps(withSpeed("1e11"), withSpeed("2e11")), IsEmpty());
    // No measurement.
    EXPECT_THAT(GetSteps(withSpeed("1e30"), withSpeed("1e11")), IsEmpty());
    EXPECT_THAT(GetSteps(withSpeed("1e11"), withSpeed("0")), IsEmpty());
    EXPECT_THAT(GetSteps(withSpeed("1e11"), withSpeed("")), IsEmpty());
    EXPECT_THAT(GetSteps(withSpeed(""), withSpeed("1e11")), IsEmpty());
}

} // namespace
} // namespace assay_host
