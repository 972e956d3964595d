// What a result has of its run, for outcomes that no quick run of a child has.
#include <gtest/gtest.h>

#include <utility>

#include "library/Result.h"

namespace assay_host {
namespace {

assay_host_result MakeResult(const RunOutcome& outcome)
{
    return {Report(), outcome, RunFacts()};
}

TEST(LibraryResultFields, SayWhatIsLeftBehind)
{
    RunOutcome outcome;
    outcome.fLeftBehind = true;
    const auto left = MakeResult(outcome);
    EXPECT_EQ(assay_host_result_left_behind(&left), 1);
    outcome.fLeftBehind = false;
    const auto none = MakeResult(outcome);
    EXPECT_EQ(assay_host_result_left_behind(&none), 0);
}

TEST(LibraryResultFields, HaveAnExitStatusOrATermination)
{
    RunOutcome outcome;
    outcome.fExitStatus = 7;
    outcome.fReason = "a reason";
    const auto ended = MakeResult(outcome);
    int status = -1;
    EXPECT_EQ(assay_host_result_exit_status(&ended, nullptr), 1);
    EXPECT_EQ(assay_host_result_exit_status(&ended, &status), 1);
    EXPECT_EQ(status, 7);
    EXPECT_STREQ(assay_host_result_termination(&ended), "");
    EXPECT_STREQ(assay_host_result_reason(&ended), "a reason");
    outcome.fExitStatus.reset();
    outcome.fTermination = "signal 11";
    outcome.fVerdict = Verdict::kCrashed;
    const auto crashed = MakeResult(outcome);
    EXPECT_EQ(assay_host_result_exit_status(&crashed, &status), 0);
    EXPECT_EQ(status, 7) << "left as it was";
    EXPECT_STREQ(assay_host_result_termination(&crashed), "signal 11");
    EXPECT_EQ(assay_host_result_verdict(&crashed), ASSAY_HOST_CRASHED);
}

} // namespace
} // namespace assay_host
