#include "app/MakeAdviceRequest.h"

#include <gtest/gtest.h>

#include <limits>

namespace assay_host {
namespace {

TEST(MakeAdviceRequest, HasEachOptionInItsUnit)
{
    AdviseChoice choice;
    choice.fFresh = true;
    choice.fWaitSeconds = 2.5;
    choice.fMaxAgeDays = 3;
    choice.fPauseSeconds = 4;
    choice.fRetries = 5;
    choice.fForgiveDays = 0.5;
    choice.fKeepAbsentSeconds = 7;
    choice.fKeepUnknownSeconds = 8;
    choice.fPauseGrowth = 9;
    choice.fForgiveFreezeDays = 10;
    choice.fUnclear = 11;
    choice.fUnclearPauseSeconds = 12;
    const AdviceRequest request = MakeAdviceRequest(choice);
    EXPECT_TRUE(request.fFresh);
    EXPECT_EQ(request.fWaitSeconds, 2.5);
    EXPECT_EQ(request.fPolicy.fMaxAge, 3 * 86400);
    EXPECT_EQ(request.fPolicy.fFirstPause, 4);
    EXPECT_EQ(request.fPolicy.fRetries, 5U);
    EXPECT_EQ(request.fPolicy.fForgiven, 43200);
    EXPECT_EQ(request.fPolicy.fAbsentKept, 7);
    EXPECT_EQ(request.fPolicy.fUnknownKept, 8);
    EXPECT_EQ(request.fPolicy.fPauseGrowth, 9);
    EXPECT_EQ(request.fPolicy.fFreezeForgiven, 864000);
    EXPECT_EQ(request.fPolicy.fMaxUnclear, 11U);
    EXPECT_EQ(request.fPolicy.fUnclearPause, 12);
}

TEST(MakeAdviceRequest, NeedsWhatIsAskedFor)
{
    const auto needs = [](Need need, DeviceKind kind) {
        AdviseChoice choice;
        choice.fNeed = need;
        return MakeAdviceRequest(choice).Needs(kind);
    };
    EXPECT_TRUE(needs(Need::kOpenGL, DeviceKind::kOpenGL));
    EXPECT_FALSE(needs(Need::kOpenGL, DeviceKind::kOpenCL));
    EXPECT_FALSE(needs(Need::kOpenCL, DeviceKind::kOpenGL));
    EXPECT_TRUE(needs(Need::kOpenCL, DeviceKind::kOpenCL));
    EXPECT_TRUE(needs(Need::kBoth, DeviceKind::kOpenGL));
    EXPECT_TRUE(needs(Need::kBoth, DeviceKind::kOpenCL));
}

TEST(MakeAdviceRequest, HasNoTimeAbove100Years)
{
    constexpr std::int64_t kCentury = 100LL * 365 * 86400;
    AdviseChoice choice;
    choice.fMaxAgeDays = 36500;
    choice.fForgiveDays = 36501;
    choice.fPauseSeconds = std::numeric_limits<double>::max();
    choice.fKeepAbsentSeconds = static_cast<double>(kCentury - 1);
    const Policy policy = MakeAdviceRequest(choice).fPolicy;
    EXPECT_EQ(policy.fMaxAge, kCentury);
    EXPECT_EQ(policy.fForgiven, kCentury);
    EXPECT_EQ(policy.fFirstPause, kCentury);
    EXPECT_EQ(policy.fAbsentKept, kCentury - 1);
}

} // namespace
} // namespace assay_host
