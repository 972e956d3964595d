// The limits and defaults by their numbers, which the other tests name. Users read them in the
// documentation.
#include <gtest/gtest.h>

#include "memory/Adviser.h"
#include "memory/Attempt.h"
#include "memory/Envelope.h"
#include "memory/Machine.h"
#include "memory/Policy.h"
#include "memory/Store.h"

namespace assay_host {
namespace {

TEST(MemoryLimits, AreThese)
{
    EXPECT_EQ(kMaxStateBytes, 262144U);
    EXPECT_EQ(kMaxIdentities, 32U);
    EXPECT_EQ(kMaxAttempts, 16U);
    EXPECT_EQ(kLastTime, 253402300799) << "the end of the year 9999";
    EXPECT_EQ(kClockTolerance, 300);
}

TEST(MemoryPolicy, HasTheseDefaults)
{
    const AdviceRequest request;
    EXPECT_TRUE(request.fNeedsOpenGL);
    EXPECT_FALSE(request.fNeedsOpenCL);
    EXPECT_FALSE(request.fFresh);
    EXPECT_EQ(request.fWaitSeconds, 10);
    const Policy& policy = request.fPolicy;
    EXPECT_EQ(policy.fMaxAge, 2592000);
    EXPECT_EQ(policy.fAbsentKept, 600);
    EXPECT_EQ(policy.fUnknownKept, 60);
    EXPECT_EQ(policy.fFirstPause, 60);
    EXPECT_EQ(policy.fPauseGrowth, 60);
    EXPECT_EQ(policy.fRetries, 2U);
    EXPECT_EQ(policy.fForgiven, 604800);
    EXPECT_EQ(policy.fFreezeForgiven, 2592000);
    EXPECT_EQ(policy.fMaxUnclear, 3U);
    EXPECT_EQ(policy.fUnclearPause, 600);
}

// What nobody has set is nothing.
TEST(MemoryRecords, BeginEmpty)
{
    const Attempt attempt;
    EXPECT_EQ(attempt.fStarted, 0);
    EXPECT_EQ(attempt.fEnded, 0);
    EXPECT_EQ(attempt.fHost.fProcess, 0U);
    EXPECT_EQ(attempt.fHost.fStart, 0U);
    EXPECT_EQ(Knowledge().fCount, 0U);
    const Advice advice;
    EXPECT_EQ(advice.fTime, 0);
    EXPECT_EQ(advice.fCount, 0U);
    EXPECT_FALSE(advice.fTried);
    EXPECT_FALSE(advice.fStopped);
    EXPECT_FALSE(advice.fIsOpen);
    EXPECT_FALSE(advice.fOpenGL.fIsLast);
    EXPECT_EQ(Outlook().fFailures, 0U);
    EXPECT_EQ(StoredKnowledge().fTime, 0);
}

} // namespace
} // namespace assay_host
