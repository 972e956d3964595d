#include <gtest/gtest.h>

#include "series/SeriesPlanning.h"

namespace assay_host {
namespace {

TEST(SeriesPlanning, EndsAtTheFirstLimit)
{
    EXPECT_FALSE(IsOver({3, 0}, 2, 1e9));
    EXPECT_TRUE(IsOver({3, 0}, 3, 0));
    EXPECT_FALSE(IsOver({0, 2.5}, 100, 2.4));
    EXPECT_TRUE(IsOver({0, 2.5}, 1, 2.5));
    EXPECT_TRUE(IsOver({3, 2.5}, 3, 0));
    EXPECT_TRUE(IsOver({3, 2.5}, 1, 3));
    EXPECT_FALSE(IsOver({3, 2.5}, 1, 2));
}

TEST(SeriesPlanning, EstimatesFromTheRunsThatHaveEnded)
{
    EXPECT_FALSE(EstimateSecondsLeft({10, 0}, 0, 3, 3));
    // Four runs of 2 s; the fifth has taken 0.5 s, and five more follow.
    EXPECT_EQ(EstimateSecondsLeft({10, 0}, 4, 8.5, 0.5), 11.5);
    // A run that takes longer than the others is about to end.
    EXPECT_EQ(EstimateSecondsLeft({10, 0}, 4, 11, 3), 10);
    EXPECT_EQ(EstimateSecondsLeft({0, 60}, 0, 12, 12), 48);
    EXPECT_EQ(EstimateSecondsLeft({0, 60}, 3, 61, 2), 0);
    EXPECT_EQ(EstimateSecondsLeft({10, 9}, 4, 8.5, 0.5), 0.5);
    EXPECT_EQ(EstimateSecondsLeft({10, 60}, 4, 8.5, 0.5), 11.5);
}

TEST(SeriesPlanning, ShowsTheTimeLeft)
{
    EXPECT_EQ(GetProgressText({10, 0}, 0, 3, 3), "run 1 of 10");
    EXPECT_EQ(GetProgressText({10, 0}, 4, 8.5, 0.5), "run 5 of 10, about 12 s left");
    EXPECT_EQ(GetProgressText({0, 600}, 4, 8.5, 0.5), "run 5, about 10 min left");
    EXPECT_EQ(GetProgressText({0, 6000}, 4, 0, 0.5), "run 5, about 1.7 h left");
}

} // namespace
} // namespace assay_host
