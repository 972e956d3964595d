#include <gtest/gtest.h>

#include <vector>

#include "References.h"
#include "statistics/Summary.h"

namespace assay_host {
namespace {

TEST(Summary, IsThatOfTheExactValues)
{
    for (const Reference& reference : GetReferences()) {
        const Summary summary = Summarize(reference.fFirst);
        const std::vector<double> found = {
            summary.fMinimum, summary.fLowerQuartile, summary.fMedian,     summary.fUpperQuartile,
            summary.fMaximum, summary.fLowerFence,    summary.fUpperFence,
        };
        ASSERT_EQ(found.size(), reference.fSummary.size());
        for (std::size_t index = 0; index < found.size(); ++index)
            ExpectClose(found[index], reference.fSummary[index]);
    }
}

TEST(Summary, OfSamplesInAnyOrder)
{
    // Worked out by hand: places 0.75, 1.5 and 2.25 of 1, 2, 4, 8.
    const Summary summary = Summarize({8, 1, 4, 2});
    EXPECT_EQ(summary.fMinimum, 1);
    EXPECT_EQ(summary.fLowerQuartile, 1.75);
    EXPECT_EQ(summary.fMedian, 3);
    EXPECT_EQ(summary.fUpperQuartile, 5);
    EXPECT_EQ(summary.fMaximum, 8);
    EXPECT_EQ(summary.GetSpread(), 3.25);
    EXPECT_EQ(summary.GetRelativeSpread(), 3.25 / 3);
    EXPECT_EQ(summary.fLowerFence, 1.75 - 4.875);
    EXPECT_EQ(summary.fUpperFence, 5 + 4.875);
}

TEST(Summary, OutliersAreBeyondTheFences)
{
    const Summary summary = Summarize({8, 1, 4, 2});
    EXPECT_FALSE(summary.IsOutlier(summary.fLowerFence));
    EXPECT_FALSE(summary.IsOutlier(summary.fUpperFence));
    EXPECT_TRUE(summary.IsOutlier(summary.fLowerFence - 1e-9));
    EXPECT_TRUE(summary.IsOutlier(summary.fUpperFence + 1e-9));
}

TEST(Summary, AnOutlierIsNotLeftOut)
{
    const Summary summary = Summarize({1, 1, 1, 1, 100});
    EXPECT_EQ(summary.fMaximum, 100);
    EXPECT_TRUE(summary.IsOutlier(100));
    EXPECT_EQ(summary.GetSpread(), 0);
}

TEST(Summary, OfOneSample)
{
    const Summary summary = Summarize({7});
    EXPECT_EQ(summary.fLowerQuartile, 7);
    EXPECT_EQ(summary.fMedian, 7);
    EXPECT_EQ(summary.fUpperQuartile, 7);
    EXPECT_FALSE(summary.IsOutlier(7));
}

TEST(Summary, OfNothingIsZero)
{
    const Summary summary;
    for (const double value :
         {summary.fMinimum, summary.fLowerQuartile, summary.fMedian, summary.fUpperQuartile,
          summary.fMaximum, summary.fLowerFence, summary.fUpperFence})
        EXPECT_EQ(value, 0);
}

TEST(Summary, ARelativeSpreadNeedsAMedian)
{
    EXPECT_EQ(Summarize({-4, 0, 0, 4, 4}).GetSpread(), 4);
    EXPECT_EQ(Summarize({-4, 0, 0, 4, 4}).GetRelativeSpread(), 0);
    EXPECT_EQ(Summarize({1, 1, 1, 3, 3}).GetRelativeSpread(), 2);
    EXPECT_EQ(Summarize({0, 0, 0}).GetRelativeSpread(), 0);
}

TEST(Quantile, EndsAreTheSmallestAndTheLargest)
{
    EXPECT_EQ(GetQuantile({1, 2, 9}, 0), 1);
    EXPECT_EQ(GetQuantile({1, 2, 9}, 1), 9);
}

} // namespace
} // namespace assay_host
