#include <gtest/gtest.h>

#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/RunText.h"

namespace assay_host {
namespace {

RunOutcome MakeOutcome(Verdict verdict, const std::string& termination = {})
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fTermination = termination;
    return outcome;
}

const Report& Whole()
{
    static const Report report = ReadReport("assayStart=\"x\"\nassayEnd=\"y\"\n");
    return report;
}

TEST(RunText, OfEachVerdict)
{
    EXPECT_EQ(GetRunText(Whole(), MakeOutcome(Verdict::kComplete)), "all tests ran");
    EXPECT_EQ(GetRunText(Whole(), MakeOutcome(Verdict::kFailedTests)), "ended with a failure");
    EXPECT_EQ(GetRunText({}, MakeOutcome(Verdict::kFailedTests)), "ended early");
    EXPECT_EQ(GetRunText({}, MakeOutcome(Verdict::kUsageError)), "options rejected");
    EXPECT_EQ(GetRunText({}, MakeOutcome(Verdict::kCrashed)), "crashed");
    EXPECT_EQ(GetRunText({}, MakeOutcome(Verdict::kHung)), "did not end");
    EXPECT_EQ(GetRunText({}, MakeOutcome(Verdict::kNeverStarted)), "did not start");
    EXPECT_EQ(GetRunText({}, MakeOutcome(Verdict::kInterrupted)), "interrupted");
}

TEST(RunText, NamesAssayHostAfterItsOwnKill)
{
    const std::string killed = "signal 9 (Killed)";
    EXPECT_EQ(GetEndText(MakeOutcome(Verdict::kHung, killed)), "assay-host, at the time limit");
    EXPECT_EQ(GetEndText(MakeOutcome(Verdict::kInterrupted, killed)),
              "the interruption of the run");
    EXPECT_EQ(GetEndText(MakeOutcome(Verdict::kCrashed, killed)), killed);
    EXPECT_EQ(GetEndText(MakeOutcome(Verdict::kComplete)), "");
    EXPECT_EQ(GetEndText(MakeOutcome(Verdict::kHung)), "");
}

std::string CountDevices(const std::string& text)
{
    const Report report = ReadReport(text);
    return GetCountText(GetAnswers(report));
}

TEST(RunText, CountsDevices)
{
    EXPECT_EQ(CountDevices(Sample(2, 1).GetText()), "2 OpenGL, 1 OpenCL");
    EXPECT_EQ(CountDevices(Sample(0, 0).GetText()), "no OpenGL device, no OpenCL graphics device");
    EXPECT_EQ(CountDevices(Sample(1, -1).GetText()), "1 OpenGL, no OpenCL");
    EXPECT_EQ(CountDevices(Sample(1, 1).EndAfter("NumGLGPUs").GetText()),
              "1 OpenGL, OpenCL not reached");
    EXPECT_EQ(CountDevices(Sample(0, 0).Set("NumGLGPUs", "").GetText()),
              "OpenGL not known, no OpenCL graphics device");
    EXPECT_EQ(CountDevices(Sample(1, 1).Set("NumGLGPUs", "").Set("NumCLGPUs", "").GetText()),
              "1 OpenGL, 1 OpenCL");
}

TEST(RunText, HasTheTimeAndItsLimit)
{
    RunOutcome outcome;
    outcome.fSeconds = 1.234;
    EXPECT_EQ(GetTimeText(outcome), "1.23 s");
    outcome.fTimeoutSeconds = 0.5;
    EXPECT_EQ(GetTimeText(outcome), "1.23 s (limit 0.5 s)");
}

TEST(RunText, HasTheOtherLinesThatAreNotEmpty)
{
    EXPECT_EQ(GetRawLines(ReadReport("x\n\n# c\na=1\ny\n")), (std::vector<std::string>{"x", "y"}));
}

} // namespace
} // namespace assay_host
