#include "supervise/StepRules.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <iterator>

#include "support/Reports.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

StepRules MakeRules(int glCount, int clCount)
{
    return StepRules(ReadReport(Join(MakeWholeRun(glCount, clCount))), MakeOutcome(0));
}

std::vector<std::string> GetTexts(const Prediction& prediction)
{
    std::vector<std::string> texts;
    for (const ExpectedLine& line : prediction.fLines)
        texts.push_back(line.fText);
    return texts;
}

std::string GetFailure(const std::function<void()>& act)
{
    try {
        act();
    } catch (const std::runtime_error& exc) {
        return exc.what();
    }
    return "nothing thrown";
}

TEST(StepRules, CountsTheStepsOfTheReportsTable)
{
    for (unsigned gl : {0U, 1U, 2U}) {
        EXPECT_EQ(MakeRules(static_cast<int>(gl), -1).GetStepCount(), 9 + 35 * gl);
        for (unsigned cl : {0U, 1U, 2U})
            EXPECT_EQ(MakeRules(static_cast<int>(gl), static_cast<int>(cl)).GetStepCount(),
                      10 + 35 * gl + 12 * cl);
    }
}

TEST(StepRules, PredictAnUndisturbedRunAfterTheLastStep)
{
    const StepRules rules = MakeRules(2, 1);
    for (const StepFailure failure : {StepFailure::kCrash, StepFailure::kThrow}) {
        const Prediction prediction = rules.Predict(failure, rules.GetStepCount());
        EXPECT_EQ(GetTexts(prediction), Join(MakeWholeRun(2, 1)));
        EXPECT_THAT(prediction.fErrors, IsEmpty());
        EXPECT_EQ(prediction.fStatus, 0);
    }
}

TEST(StepRules, EndTheRunAtAStepOfNoDevice)
{
    const StepRules rules = MakeRules(1, -1);
    for (const StepFailure failure : {StepFailure::kCrash, StepFailure::kThrow}) {
        EXPECT_THAT(GetTexts(rules.Predict(failure, 0)), IsEmpty());
        EXPECT_THAT(GetTexts(rules.Predict(failure, 1)), ElementsAre("Tester=\"Pixmere\""));
        EXPECT_THAT(GetTexts(rules.Predict(failure, 6)), SizeIs(6));
        EXPECT_EQ(rules.Predict(failure, 6).fStatus, 2);
    }
    EXPECT_THAT(rules.Predict(StepFailure::kCrash, 0).fErrors,
                ElementsAre("exception: programmed failure"));
    EXPECT_THAT(rules.Predict(StepFailure::kThrow, 0).fErrors,
                ElementsAre("exception: Programmed throw"));
}

TEST(StepRules, LoseOneDeviceToAThrow)
{
    const StepRules rules = MakeRules(2, -1);
    const Prediction prediction = rules.Predict(StepFailure::kThrow, 10); // glgpu[1], second key
    std::vector<std::string> wanted;
    for (const auto& group : MakeWholeRun(2, -1)) {
        const bool ofSecond = !group.empty() && group.back().rfind("glgpu[1].", 0) == 0;
        const bool kept = !ofSecond || group.back().find("GLVersion") != std::string::npos ||
                          group.back().find("IsIntegratedGLGPU") != std::string::npos;
        if (kept)
            wanted.insert(wanted.end(), group.begin(), group.end());
    }
    EXPECT_EQ(GetTexts(prediction), wanted);
    EXPECT_THAT(prediction.fErrors, ElementsAre("exception: Programmed throw"));
    EXPECT_EQ(prediction.fStatus, 2);
}

TEST(StepRules, LoseAllDevicesToACrashAndEndAtTheNextOtherStep)
{
    // The example of docs/report-format.md: one device, -crashAfter=8.
    const Prediction one = MakeRules(1, 0).Predict(StepFailure::kCrash, 8);
    EXPECT_EQ(GetTexts(one).back(), "NumCLGPUs=0");
    EXPECT_EQ(GetTexts(one)[7], "glgpu[0].IsIntegratedGLGPU=0");
    EXPECT_THAT(GetTexts(one), SizeIs(9));
    EXPECT_EQ(GetTexts(MakeRules(1, -1).Predict(StepFailure::kCrash, 8)).back().substr(0, 8),
              "assayEnd");

    const Prediction two = MakeRules(2, -1).Predict(StepFailure::kCrash, 8);
    EXPECT_THAT(GetTexts(two), SizeIs(6 + 3 + 1)); // both GLVersion, one IsIntegratedGLGPU, end
    EXPECT_THAT(two.fErrors,
                ElementsAre("exception: programmed failure", "exception: programmed failure",
                            "exception: programmed failure"));
}

TEST(StepRules, ShiftLaterStepsWhenADeviceIsLost)
{
    // Device 0 is lost at step 7. Step 8 is then still glgpu[1]'s first key: only later steps move.
    const StepRules rules = MakeRules(2, -1);
    EXPECT_THAT(rules.Predict(StepFailure::kThrow, 7).fErrors, SizeIs(1));
    EXPECT_THAT(GetTexts(rules.Predict(StepFailure::kThrow, 7)), SizeIs(6 + 1 + 15 + 43 + 1));
}

TEST(StepRules, TakeTheStepOfASilentCudaVersion)
{
    const StepRules rules = MakeRules(0, 1);
    const Prediction prediction = rules.Predict(StepFailure::kThrow, 8 + 9);
    EXPECT_EQ(GetTexts(prediction)[GetTexts(prediction).size() - 2], "clgpu[0].CUDASupported=0");
    EXPECT_THAT(prediction.fErrors, ElementsAre("exception: Programmed throw"));
}

TEST(StepRules, TakeASilentCudaVersionForPassedBeforeAFailure)
{
    std::vector<std::string> lines;
    for (const std::string& line : Join(MakeWholeRun(0, 1)))
        if (line.find("CLBandwidth") == std::string::npos &&
            line.find("CLCompute") == std::string::npos)
            lines.push_back(line);
    const StepRules rules(ReadReport(lines), MakeOutcome(2, {"exception: x"}));
    EXPECT_EQ(rules.GetStepCount(), 10U + 10);
    EXPECT_EQ(GetTexts(rules.Predict(StepFailure::kCrash, rules.GetStepCount())), lines);

    // The step of CUDAVersion is the last one of the device: its failure is the only one then.
    const Prediction silent = rules.Predict(StepFailure::kThrow, 8 + 9);
    EXPECT_EQ(GetTexts(silent), lines);
    EXPECT_THAT(silent.fErrors, ElementsAre("exception: Programmed throw"));
}

TEST(StepRules, KeepTheOutputOfOptionsBeforeTheReport)
{
    std::vector<std::string> lines = Join(MakeWholeRun(0, -1));
    lines.insert(lines.begin(), "a=b");
    lines.insert(lines.begin() + 1, "# a comment");
    lines.insert(lines.begin() + 2, "neither");
    const StepRules rules(ReadReport(lines), MakeOutcome(7));
    EXPECT_THAT(GetTexts(rules.Predict(StepFailure::kThrow, 0)), ElementsAre("a=b", "neither"));
    EXPECT_EQ(rules.Predict(StepFailure::kThrow, 9).fStatus, 7);
}

class FailingDevice : public testing::TestWithParam<std::size_t> {};

// The second of two devices fails by itself at its k-th test.
TEST_P(FailingDevice, IsFoundWithItsMessages)
{
    const std::size_t failing = GetParam();
    std::vector<std::string> lines;
    std::size_t asked = 0;
    for (const auto& group : MakeWholeRun(2, -1)) {
        if (group.empty() || group.back().rfind("glgpu[1].", 0) != 0) {
            lines.insert(lines.end(), group.begin(), group.end());
            continue;
        }
        if (asked < failing)
            lines.insert(lines.end(), group.begin(), group.end());
        const bool queriesFirst = group.back().find("glGetIntegerv") != std::string::npos;
        if (asked == failing && !queriesFirst)
            lines.insert(lines.end(), group.begin(), group.end() - 1);
        ++asked;
    }
    const StepRules rules(ReadReport(lines),
                          MakeOutcome(2, {"a driver's words", "Failed requirement: x",
                                          "exception: Failed requirement: x"}));
    const std::size_t stepless = failing > 15 ? 1 : 0; // glGetString takes none
    EXPECT_EQ(rules.GetStepCount(), 9 + 35 + failing - stepless);
    const Prediction whole = rules.Predict(StepFailure::kCrash, rules.GetStepCount());
    EXPECT_EQ(GetTexts(whole), lines);
    EXPECT_THAT(whole.fErrors,
                ElementsAre("Failed requirement: x", "exception: Failed requirement: x"));
    EXPECT_EQ(whole.fStatus, 2);

    // With the first device lost to a throw, the second one still fails by itself.
    const Prediction both = rules.Predict(StepFailure::kThrow, 7);
    EXPECT_THAT(both.fErrors, SizeIs(3));
    EXPECT_EQ(both.fErrors.front(), "exception: Programmed throw");
}

INSTANTIATE_TEST_SUITE_P(AtEachQuestion, FailingDevice, testing::Range<std::size_t>(0, 36));

TEST(StepRules, ExpectMessagesOfTheEnumerationOnlyAfterIt)
{
    const std::string text = "ContextOffscreen exception caught and ignored.";
    const StepRules rules(ReadReport(Join(MakeWholeRun(1, -1))), MakeOutcome(0, {text}));
    EXPECT_THAT(rules.Predict(StepFailure::kThrow, 5).fErrors,
                ElementsAre("exception: Programmed throw"));
    EXPECT_THAT(rules.Predict(StepFailure::kThrow, 6).fErrors,
                ElementsAre(text, "exception: Programmed throw"));
}

TEST(StepRules, RejectOtherRuns)
{
    const std::vector<std::string> whole = Join(MakeWholeRun(1, 0));
    auto broken = whole;
    broken.pop_back();
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(broken), MakeOutcome(2)); }),
                HasSubstr("did not complete"));
    broken = whole;
    broken.erase(broken.begin() + 3);
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(broken), MakeOutcome(0)); }),
                HasSubstr("no line for QGFOGLInitialized"));
    broken = whole;
    std::swap(broken[7], broken[8]);
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(broken), MakeOutcome(0)); }),
                HasSubstr("does not follow the rules"));
    broken = whole;
    broken.insert(broken.begin() + 9, "glgpu[0].GLNews=1");
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(broken), MakeOutcome(0)); }),
                HasSubstr("+ glgpu[0].GLNews=1"));
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(whole), MakeOutcome(0, {"exception: x"})); }),
                HasSubstr("a failure that no device had: exception: x"));
    broken = whole;
    broken.erase(broken.begin() + 20);
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(broken), MakeOutcome(2)); }),
                HasSubstr("no line for"));
}

TEST(StepRules, RejectAFailureThatIsNotNamed)
{
    std::vector<std::string> lines = Join(MakeWholeRun(0, 1));
    lines.erase(std::prev(lines.end(), 2)); // CLCompute
    EXPECT_EQ(GetFailure([&] { StepRules(ReadReport(lines), MakeOutcome(2)); }),
              "clgpu[0] has lines missing, and standard error names no failure");
}

TEST(StepRules, RejectMoreDevicesThanAReportMayHave)
{
    std::vector<std::string> lines = Join(MakeWholeRun(0, -1));
    const auto count = std::find(lines.begin(), lines.end(), "NumGLGPUs=0");
    ASSERT_NE(count, lines.end());
    *count = "NumGLGPUs=" + std::to_string(kMaxDevices + 1);
    EXPECT_EQ(GetFailure([&] { StepRules(ReadReport(lines), MakeOutcome(2)); }),
              "the report counts " + std::to_string(kMaxDevices + 1) + " devices");
}

TEST(StepRules, TakeAsManyDevicesAsAReportMayHave)
{
    std::vector<std::string> lines = Join(MakeWholeRun(0, -1));
    const auto count = std::find(lines.begin(), lines.end(), "NumGLGPUs=0");
    ASSERT_NE(count, lines.end());
    *count = "NumGLGPUs=" + std::to_string(kMaxDevices);
    EXPECT_THAT(GetFailure([&] { StepRules(ReadReport(lines), MakeOutcome(2)); }),
                testing::Not(HasSubstr("the report counts")));
}

TEST(ExpectedLine, MatchesByItsKind)
{
    const ExpectedLine exact{"a=1", Match::kExact};
    EXPECT_TRUE(exact.Matches("a=1"));
    EXPECT_FALSE(exact.Matches("a=2"));
    const ExpectedLine memory{"a=1", Match::kInteger};
    EXPECT_TRUE(memory.Matches("a=4096"));
    EXPECT_FALSE(memory.Matches("a="));
    EXPECT_FALSE(memory.Matches("a=-1"));
    EXPECT_FALSE(memory.Matches("b=1"));
    const ExpectedLine number{"a=1", Match::kNumber};
    for (const char* text : {"a=0", "a=3.35544e+16", "a=0.125", "a=1e-05"})
        EXPECT_TRUE(number.Matches(text)) << text;
    for (const char* text : {"a=", "a=nan", "a=1.", "a=1 ", "a=\"1\""})
        EXPECT_FALSE(number.Matches(text)) << text;
    const ExpectedLine stamp{"a=\"2026-11-21_12:35:39\"", Match::kStamp};
    EXPECT_TRUE(stamp.Matches("a=\"1999-01-02_03:04:05\""));
    EXPECT_FALSE(stamp.Matches("a=\"1999-01-02 03:04:05\""));
    EXPECT_FALSE(stamp.Matches("a=1999-01-02_03:04:05"));
}

TEST(ShowDifference, ShowsEachKind)
{
    Prediction expected;
    expected.fLines = {{"a=1", Match::kExact}, {"b=2", Match::kExact}};
    EXPECT_EQ(ShowDifference(expected, ReadReport("# x\na=1\nb=2\n"), MakeOutcome(0, {"noise"})),
              "");
    EXPECT_EQ(ShowDifference(expected, ReadReport("a=1\nc=2\n"), MakeOutcome(0)),
              "  report (- predicted, + found):\n      a=1\n    - b=2\n    - (the end)\n"
              "    + c=2\n    + (the end)\n");
    EXPECT_EQ(ShowDifference(expected, ReadReport("a=1\n"), MakeOutcome(0)),
              "  report (- predicted, + found):\n      a=1\n    - b=2\n    - (the end)\n"
              "    + (the end)\n");
    EXPECT_EQ(ShowDifference(expected, ReadReport("a=1\nb=2\n"), MakeOutcome(2, {"exception: x"})),
              "  standard error (- predicted, + found):\n    - (the end)\n    + exception: x\n"
              "    + (the end)\n  exit status: predicted 0, found 2\n");
    RunOutcome died;
    died.fReason = "The child crashed.";
    EXPECT_EQ(ShowDifference(expected, ReadReport("a=1\nb=2\n"), died),
              "  exit status: predicted 0, found none: The child crashed.\n");
}

TEST(ExpectedLine, RejectsAValueTooLongForAnyNumber)
{
    const ExpectedLine line{"a=1", Match::kInteger};
    EXPECT_TRUE(line.Matches("a=23"));
    EXPECT_FALSE(line.Matches("a=" + std::string(std::size_t{1} << 16, '1')));
    EXPECT_FALSE(line.Matches("a"));
    EXPECT_FALSE(line.Matches(""));
}

} // namespace
} // namespace assay_host
