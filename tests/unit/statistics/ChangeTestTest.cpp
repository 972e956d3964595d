#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

#include "statistics/ChangeTest.h"

namespace assay_host {
namespace {

constexpr int kPairs = 10000;
constexpr double kPi = 3.14159265358979323846;

using Noise = std::mt19937_64;

double DrawUniform(Noise& noise)
{
    return (static_cast<double>(noise() >> 11) + 0.5) * 0x1p-53;
}

double DrawNormal(Noise& noise)
{
    const double radius = std::sqrt(-2 * std::log(DrawUniform(noise)));
    return radius * std::cos(2 * kPi * DrawUniform(noise));
}

// A measurement of 1 with noise of 5 %.
double Draw(Noise& noise, double shift)
{
    return 1 + shift + 0.05 * DrawNormal(noise);
}

// The same with equal values, and with every tenth one up to twice as large.
double DrawSkewed(Noise& noise, double shift)
{
    const double value = Draw(noise, shift);
    const double factor = DrawUniform(noise) < 0.1 ? 1 + DrawUniform(noise) : 1;
    return std::round(value * factor * 100) / 100;
}

int CountChanges(int size, double (&draw)(Noise&, double), double shift)
{
    Noise noise(20261122);
    int changes = 0;
    for (int pair = 0; pair < kPairs; ++pair) {
        std::vector<double> before;
        std::vector<double> after;
        for (int sample = 0; sample < size; ++sample) {
            before.push_back(draw(noise, 0));
            after.push_back(draw(noise, shift));
        }
        changes += TestChange(before, after).fChange == Change::kChange ? 1 : 0;
    }
    return changes;
}

void ExpectBetween(int count, int least, int most)
{
    EXPECT_GE(count, least);
    EXPECT_LE(count, most);
}

// The bounds are those of rates.py: one of a thousand simulations lies outside.

// 140 of 18! / (9! 9!) pairs of ranks are called different: 0.78 %, the largest share up to 1 %.
TEST(ChangeTest, SeriesOfTheSameDistributionAreSeldomCalledDifferent)
{
    ExpectBetween(CountChanges(9, Draw, 0), 48, 105);
}

TEST(ChangeTest, TheSameHoldsWithEqualValuesAndOutliers)
{
    ExpectBetween(CountChanges(29, DrawSkewed, 0), 64, 128);
}

TEST(ChangeTest, ADifferenceIsFoundAsOftenAsTheTestCan)
{
    ExpectBetween(CountChanges(9, Draw, 0.075), 5210, 5538);
    ExpectBetween(CountChanges(29, DrawSkewed, 0.025), 1205, 1427);
}

TEST(ChangeTest, TheLevelItselfIsAChange)
{
    // U is 11 of 81: the largest with a p value up to 1 %.
    const std::vector<double> before = {1, 2, 3, 4, 5, 6, 7, 8, 13.5};
    std::vector<double> after = {5.5, 6.5, 7.5, 9, 10, 11, 12, 13, 14};
    const ChangeTest test = TestChange(before, after);
    EXPECT_EQ(test.fRanks.fU, 14);
    EXPECT_EQ(test.fChange, Change::kNoise);
    after[0] = 8.5;
    EXPECT_EQ(TestChange(before, after).fRanks.fU, 11);
    EXPECT_EQ(TestChange(before, after).fChange, Change::kChange);
}

TEST(ChangeTest, TooFewSamplesShowNothing)
{
    EXPECT_EQ(TestChange({}, {1, 2, 3}).fChange, Change::kTooFew);
    EXPECT_EQ(TestChange({1, 2, 3}, {}).fChange, Change::kTooFew);
    EXPECT_EQ(TestChange({}, {}).fRanks.fP, 1);
    EXPECT_EQ(TestChange({1, 2, 3}, {4, 5}).fRanks.fP, 0.2);
    EXPECT_EQ(TestChange({1, 2, 3, 4}, {5, 6, 7, 8}).fChange, Change::kTooFew);
    EXPECT_EQ(TestChange({1, 2, 3, 4, 5}, {6, 7, 8, 9, 10}).fChange, Change::kChange);
}

TEST(ChangeTest, EqualSamplesAreNoChange)
{
    const std::vector<double> same(9, 4.5);
    const ChangeTest test = TestChange(same, same);
    EXPECT_EQ(test.fChange, Change::kNoise);
    EXPECT_EQ(test.fRanks.fP, 1);
}

TEST(ChangeTest, AConstantThatMovesIsAChange)
{
    EXPECT_EQ(TestChange(std::vector<double>(9, 4.5), std::vector<double>(9, 4.4)).fChange,
              Change::kChange);
}

} // namespace
} // namespace assay_host
