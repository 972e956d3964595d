// The limits and defaults of a run by their numbers, which the other tests name or replace.
#include <gtest/gtest.h>

#include <chrono>

#include "supervise/ChildRun.h"
#include "supervise/ErrorLines.h"
#include "supervise/RunTimes.h"

namespace assay_host {
namespace {

using std::chrono::milliseconds;

TEST(RunLimits, AreThese)
{
    EXPECT_EQ(ErrorLines::kMaxBytes, 1048576U);
    EXPECT_EQ(ErrorLines::kMaxLineBytes, 65536U);
    EXPECT_EQ(ErrorLines::kMaxLines, 10000U);
    const ChildOptions options;
    EXPECT_EQ(options.fTimeoutSeconds, 60);
    EXPECT_FALSE(options.fKeepCauses);
}

TEST(RunTimes, HaveTheseDefaults)
{
    const RunTimes times;
    EXPECT_EQ(times.fTick, milliseconds(100));
    EXPECT_EQ(times.fKillGrace, milliseconds(700));
    EXPECT_EQ(times.fStreamGrace, milliseconds(200));
    EXPECT_EQ(times.fLastStreamGrace, milliseconds(200));
    EXPECT_EQ(times.fTreeSeconds, 0.2);
    EXPECT_EQ(times.fJoinSeconds, 0.3);
    EXPECT_EQ(times.fReaderPatience, milliseconds(1000));
    const auto before = RunTimes::Clock::now();
    EXPECT_GE(times.fNow(), before);
}

} // namespace
} // namespace assay_host
