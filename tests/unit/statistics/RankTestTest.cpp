#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "References.h"
#include "statistics/RankTest.h"

namespace assay_host {
namespace {

TEST(RankTest, IsThatOfAnotherProgram)
{
    for (const Reference& reference : GetReferences()) {
        const RankTest test = TestRanks(reference.fFirst, reference.fSecond);
        EXPECT_EQ(test.fU, reference.fU);
        ExpectClose(test.fP, reference.fP);
        EXPECT_EQ(test.fIsExact, reference.fIsExact);
    }
}

TEST(RankTest, TheOtherOrderHasTheSameP)
{
    for (const Reference& reference : GetReferences()) {
        const RankTest test = TestRanks(reference.fFirst, reference.fSecond);
        const RankTest swapped = TestRanks(reference.fSecond, reference.fFirst);
        EXPECT_EQ(test.fU + swapped.fU,
                  static_cast<double>(reference.fFirst.size() * reference.fSecond.size()));
        ExpectClose(swapped.fP, test.fP);
    }
}

// The 20 ways to place three values among six: one has a U of 0, one of 1, two of 2.
TEST(RankTest, CountsByHand)
{
    ExpectClose(TestRanks({1, 2, 3}, {4, 5, 6}).fP, 2.0 / 20);
    ExpectClose(TestRanks({1, 2, 4}, {3, 5, 6}).fP, 4.0 / 20);
    ExpectClose(TestRanks({1, 2, 5}, {3, 4, 6}).fP, 8.0 / 20);
    EXPECT_EQ(TestRanks({1, 2, 5}, {3, 4, 6}).fU, 2);
}

TEST(RankTest, EqualValuesCountAsAHalf)
{
    EXPECT_EQ(TestRanks({1, 2}, {2, 3}).fU, 0.5);
    EXPECT_FALSE(TestRanks({1, 2}, {2, 3}).fIsExact);
}

// The U at the mean, and those half a step and a step beside it.
TEST(RankTest, NearTheMeanThePIsOne)
{
    EXPECT_EQ(TestRanks({1, 4}, {2, 3}).fP, 1);
    EXPECT_EQ(TestRanks({1, 2}, {1, 2}).fP, 1);
    EXPECT_EQ(TestRanks({1}, {1, 2}).fP, 1);
    EXPECT_LT(TestRanks({1, 2}, {2, 3}).fP, 1);
}

TEST(RankTest, EqualValuesOnlyHaveNoVariance)
{
    for (const std::size_t size : {1U, 2U, 100U, 3000U}) {
        const std::vector<double> same(size, 0.1);
        EXPECT_EQ(TestRanks(same, {0.1}).fP, 1) << size;
        EXPECT_EQ(TestRanks(same, same).fP, 1) << size;
    }
}

// One of four values is apart: U is 3 of 3, the variance 3/12 * (5 - 24/12), the distance 1.
TEST(RankTest, AVarianceBelowOne)
{
    ExpectClose(TestRanks({2}, {1, 1, 1}).fP, std::erfc(1 / std::sqrt(0.75) / std::sqrt(2.0)));
    ExpectClose(TestRanks({1, 1, 1}, {2}).fP, std::erfc(1 / std::sqrt(0.75) / std::sqrt(2.0)));
}

TEST(RankTest, BeforeATestNothingIsKnown)
{
    const RankTest test;
    EXPECT_EQ(test.fU, 0);
    EXPECT_EQ(test.fP, 1);
    EXPECT_FALSE(test.fIsExact);
}

TEST(RankTest, IsExactUpToALimit)
{
    std::vector<double> first;
    std::vector<double> second;
    for (int value = 0; value < 50; ++value) {
        first.push_back(2 * value);
        second.push_back(2 * value + 1);
    }
    EXPECT_TRUE(TestRanks(first, second).fIsExact);
    second.push_back(1000);
    EXPECT_FALSE(TestRanks(first, second).fIsExact);
}

TEST(RankTest, TheSmallestPIsThatOfSamplesApart)
{
    ExpectClose(GetSmallestP(3, 3), 2.0 / 20);
    ExpectClose(GetSmallestP(2, 4), 2.0 / 15);
    ExpectClose(GetSmallestP(5, 4), TestRanks({1, 2, 3, 4, 5}, {6, 7, 8, 9}).fP);
    EXPECT_EQ(GetSmallestP(1, 1), 1);
    ExpectClose(GetSmallestP(1, 2), 2.0 / 3);
    ExpectClose(GetSmallestP(2, 2), 2.0 / 6);
    EXPECT_EQ(GetSmallestP(0, 9), 1);
    EXPECT_EQ(GetSmallestP(100000, 100000), 0);
}

} // namespace
} // namespace assay_host
