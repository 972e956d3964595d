#include "series/SeriesStatistics.h"

namespace assay_host {

SeriesStatistics GetStatistics(const Measurement& measurement)
{
    SeriesStatistics statistics;
    for (const SeriesSample& sample : measurement.fSamples)
        if (!sample.IsKnown())
            statistics.fUnknown.push_back(sample);
        else if (sample.fRun == 1)
            statistics.fFirst = sample.fValue;
        else
            statistics.fLater.push_back(sample.fValue);
    if (statistics.fLater.empty())
        return statistics;
    statistics.fSummary = Summarize(statistics.fLater);
    for (const SeriesSample& sample : measurement.fSamples)
        if (sample.IsKnown() && sample.fRun != 1 && statistics.fSummary->IsOutlier(sample.fValue))
            statistics.fOutliers.push_back(sample);
    return statistics;
}

std::optional<double> GetTypicalValue(const Measurement& measurement)
{
    const SeriesStatistics statistics = GetStatistics(measurement);
    return statistics.fSummary ? statistics.fSummary->fMedian : statistics.fFirst;
}

} // namespace assay_host
