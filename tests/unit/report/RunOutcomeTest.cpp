#include <gtest/gtest.h>

#include "report/RunOutcome.h"

namespace assay_host {
namespace {

TEST(RunOutcome, HasANameAndAStatusForEachVerdict)
{
    struct Row {
        Verdict fVerdict;
        const char* fName;
        int fStatus;
    };
    constexpr Row kRows[] = {
        {Verdict::kComplete, "complete", 0},
        {Verdict::kFailedTests, "failed-tests", 1},
        {Verdict::kUsageError, "usage-error", 2},
        {Verdict::kCrashed, "crashed", 3},
        {Verdict::kHung, "hung", 4},
        {Verdict::kNeverStarted, "never-started", 5},
        {Verdict::kInterrupted, "interrupted", 6},
    };
    for (const Row& row : kRows) {
        EXPECT_STREQ(GetVerdictName(row.fVerdict), row.fName);
        EXPECT_EQ(GetVerdictStatus(row.fVerdict), row.fStatus);
    }
}

} // namespace
} // namespace assay_host
