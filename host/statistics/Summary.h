// Describes the distribution of samples. docs/repeat.md has the definitions for users.
#pragma once

#include <cstddef>
#include <vector>

namespace assay_host {

// All values are in the unit of the samples.
struct Summary {
    double fMinimum = 0;
    double fLowerQuartile = 0;
    double fMedian = 0;
    double fUpperQuartile = 0;
    double fMaximum = 0;

    // Tukey's fences: a quartile, and 1.5 times the interquartile range beyond it.
    double fLowerFence = 0;
    double fUpperFence = 0;

    // The interquartile range.
    double GetSpread() const { return fUpperQuartile - fLowerQuartile; }

    // The same as a fraction of the median; 0 for a median of 0.
    double GetRelativeSpread() const { return fMedian == 0 ? 0 : GetSpread() / fMedian; }

    bool IsOutlier(double sample) const { return sample < fLowerFence || sample > fUpperFence; }
};

// Summarizes at least one sample; all must be finite. No sample is left out, whether it is an
// outlier or not. Any thread may call.
Summary Summarize(std::vector<double> samples);

// Returns a quantile of at least one sample in ascending order, by linear interpolation between the
// two samples around the place (count - 1) * fraction: type 7 of Hyndman and Fan, as numpy's
// "linear" and Python's "inclusive". `fraction`: 0 to 1. Any thread may call.
double GetQuantile(const std::vector<double>& sorted, double fraction);

} // namespace assay_host
