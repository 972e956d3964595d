// The Mann-Whitney U test: whether the values of one sample tend to be larger than those of
// another.
#pragma once

#include <cstddef>
#include <vector>

namespace assay_host {

struct RankTest {
    // The pairs of a value of each sample in which that of the first is larger. A pair of equal
    // values counts as a half.
    double fU = 0;

    // The two-sided p value: how likely a U at least as far from its mean is for two samples of the
    // same distribution.
    double fP = 1;

    // Whether the p value is that of the exact distribution of U. Otherwise it is that of the
    // normal distribution, with the corrections for ties and for continuity.
    bool fIsExact = false;
};

// The exact distribution is used for samples without equal values whose sizes have at most this
// product.
constexpr std::size_t kMaxExactPairs = 2500;

// Tests two samples of at least one value each. All must be finite. Any thread may call.
RankTest TestRanks(const std::vector<double>& first, const std::vector<double>& second);

// Returns the smallest p value that samples of these sizes, without equal values, can have: 1 if
// one is empty. Any thread may call.
double GetSmallestP(std::size_t first, std::size_t second);

} // namespace assay_host
