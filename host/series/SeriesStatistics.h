// The statistics of a measurement in a series. The first run is kept apart: drivers fill their
// caches in it. Any thread may call.
#pragma once

#include <optional>
#include <vector>

#include "series/Series.h"
#include "statistics/Summary.h"

namespace assay_host {

struct SeriesStatistics {
    std::optional<double> fFirst;        // of the first run, if it is known
    std::vector<double> fLater;          // the known ones of the later runs
    std::optional<Summary> fSummary;     // of fLater; nothing if that is empty
    std::vector<SeriesSample> fOutliers; // of the later runs; fSummary counts them
    std::vector<SeriesSample> fUnknown;  // of all runs; not part of the numbers
};

SeriesStatistics GetStatistics(const Measurement& measurement);

// Returns the median of the later runs; of a series without any, the first run's value. Nothing if
// neither is known.
std::optional<double> GetTypicalValue(const Measurement& measurement);

} // namespace assay_host
