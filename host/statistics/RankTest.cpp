#include "statistics/RankTest.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include <boost/math/distributions/normal.hpp>

namespace assay_host {

namespace {

struct Ranked {
    double fU;    // of the first sample
    double fTies; // the sum of t^3 - t over all groups of t equal values
};

// Ranks the values of both samples together; equal ones share the mean of their ranks.
Ranked Rank(const std::vector<double>& first, const std::vector<double>& second)
{
    std::vector<std::pair<double, bool>> all; // whether it is of the first sample
    all.reserve(first.size() + second.size());
    for (const double value : first)
        all.emplace_back(value, true);
    for (const double value : second)
        all.emplace_back(value, false);
    std::sort(all.begin(), all.end());
    double rankSum = 0; // of the first sample
    double ties = 0;
    for (std::size_t begin = 0; begin < all.size();) {
        std::size_t end = begin;
        std::size_t ofFirst = 0;
        for (; end < all.size() && all[end].first == all[begin].first; ++end)
            ofFirst += static_cast<std::size_t>(all[end].second);
        const auto count = static_cast<double>(end - begin);
        const double rank = (static_cast<double>(begin + end) + 1) / 2;
        rankSum += static_cast<double>(ofFirst) * rank;
        ties += count * count * count - count;
        begin = end;
    }
    const auto size = static_cast<double>(first.size());
    return {rankSum - size * (size + 1) / 2, ties};
}

// Returns the probability of a U of at most `limit` for samples of these sizes without ties. The
// largest of all values belongs to either sample in proportion to its size, and then adds the size
// of the other one to U, or nothing. All terms are positive, so that no digits are lost.
double GetTail(std::size_t first, std::size_t second, std::size_t limit)
{
    const std::size_t outer = std::max(first, second);
    const std::size_t inner = std::min(first, second);
    // The probabilities of each U for one outer size and all inner ones.
    std::vector<std::vector<double>> rows(inner + 1, std::vector<double>(limit + 1, 0.0));
    for (std::vector<double>& row : rows)
        row[0] = 1;
    for (std::size_t m = 1; m <= outer; ++m) {
        for (std::size_t n = 1; n <= inner; ++n) {
            const double share = static_cast<double>(m) / static_cast<double>(m + n);
            std::vector<double>& row = rows[n];
            for (std::size_t u = limit + 1; u-- > 0;)
                row[u] = share * (u >= n ? row[u - n] : 0.0) + (1 - share) * rows[n - 1][u];
        }
    }
    double tail = 0;
    for (const double probability : rows[inner])
        tail += probability;
    return tail;
}

double GetExactP(std::size_t first, std::size_t second, double u)
{
    const auto pairs = static_cast<double>(first) * static_cast<double>(second);
    const auto limit = static_cast<std::size_t>(std::min(u, pairs - u));
    return std::min(1.0, 2 * GetTail(first, second, limit));
}

double GetNormalP(std::size_t first, std::size_t second, const Ranked& ranked)
{
    using Policy = boost::math::policies::policy<boost::math::policies::promote_double<false>>;
    const boost::math::normal_distribution<double, Policy> normal;
    const auto pairs = static_cast<double>(first) * static_cast<double>(second);
    const auto size = static_cast<double>(first + second);
    const double variance = pairs / 12 * (size + 1 - ranked.fTies / (size * (size - 1)));
    // A step of U is one, or a half with ties; the continuity correction is half of one.
    const double distance = std::abs(ranked.fU - pairs / 2) - 0.5;
    // Without a variance, as of equal values only, the distance is negative.
    const double deviations = distance / std::sqrt(std::max(variance, 0.0));
    return std::min(1.0, 2 * boost::math::cdf(boost::math::complement(normal, deviations)));
}

} // namespace

RankTest TestRanks(const std::vector<double>& first, const std::vector<double>& second)
{
    const Ranked ranked = Rank(first, second);
    RankTest test;
    test.fU = ranked.fU;
    test.fIsExact = ranked.fTies == 0 && first.size() <= kMaxExactPairs / second.size();
    test.fP = test.fIsExact ? GetExactP(first.size(), second.size(), ranked.fU)
                            : GetNormalP(first.size(), second.size(), ranked);
    return test;
}

double GetSmallestP(std::size_t first, std::size_t second)
{
    const std::size_t small = std::min(first, second);
    const std::size_t large = std::max(first, second);
    double p = 2; // both ends, each of one in all the ways to choose the ranks of a sample
    for (std::size_t rank = 1; rank <= small; ++rank)
        p *= static_cast<double>(rank) / static_cast<double>(large + rank);
    return std::min(1.0, p);
}

} // namespace assay_host
