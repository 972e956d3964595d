#include "series/TextPlot.h"

#include <algorithm>
#include <cmath>

#include "statistics/Summary.h"

namespace assay_host {

std::string MakeTextPlot(const std::vector<double>& samples, std::size_t width)
{
    const Summary summary = Summarize(samples);
    const double range = summary.fMaximum - summary.fMinimum;
    const auto getColumn = [&](double value) {
        const double share = range > 0 ? (value - summary.fMinimum) / range : 0.0;
        return static_cast<std::size_t>(std::lround(share * static_cast<double>(width - 1)));
    };
    // At least half of the samples are between the fences.
    double low = summary.fMaximum;
    double high = summary.fMinimum;
    for (const double sample : samples) {
        if (!summary.IsOutlier(sample)) {
            low = std::min(low, sample);
            high = std::max(high, sample);
        }
    }
    std::string plot(width, ' ');
    const auto fill = [&](double from, double to, char character) {
        std::fill(plot.begin() + static_cast<std::ptrdiff_t>(getColumn(from)),
                  plot.begin() + static_cast<std::ptrdiff_t>(getColumn(to)) + 1, character);
    };
    fill(low, high, '-');
    fill(summary.fLowerQuartile, summary.fUpperQuartile, '=');
    for (const double sample : samples)
        if (summary.IsOutlier(sample))
            plot[getColumn(sample)] = 'o';
    plot[getColumn(low)] = '|';
    plot[getColumn(high)] = '|';
    plot[getColumn(summary.fLowerQuartile)] = '[';
    plot[getColumn(summary.fUpperQuartile)] = ']';
    plot[getColumn(summary.fMedian)] = '#';
    plot.erase(plot.find_last_not_of(' ') + 1);
    return plot;
}

} // namespace assay_host
