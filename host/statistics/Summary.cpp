#include "statistics/Summary.h"

#include <algorithm>
#include <cmath>

namespace assay_host {

namespace {

constexpr double kFenceFactor = 1.5;

} // namespace

double GetQuantile(const std::vector<double>& sorted, double fraction)
{
    const double place = static_cast<double>(sorted.size() - 1) * fraction;
    const double below = std::floor(place);
    const auto index = static_cast<std::size_t>(below);
    const double lower = sorted[index];
    const double upper = sorted[std::min(index + 1, sorted.size() - 1)];
    return lower + (place - below) * (upper - lower);
}

Summary Summarize(std::vector<double> samples)
{
    std::sort(samples.begin(), samples.end());
    Summary summary;
    summary.fMinimum = samples.front();
    summary.fLowerQuartile = GetQuantile(samples, 0.25);
    summary.fMedian = GetQuantile(samples, 0.5);
    summary.fUpperQuartile = GetQuantile(samples, 0.75);
    summary.fMaximum = samples.back();
    summary.fLowerFence = summary.fLowerQuartile - kFenceFactor * summary.GetSpread();
    summary.fUpperFence = summary.fUpperQuartile + kFenceFactor * summary.GetSpread();
    return summary;
}

} // namespace assay_host
