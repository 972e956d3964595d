// Texts about a series that the forms for people share. All are safe to write to a terminal. Any
// thread may call.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "series/Series.h"
#include "series/SeriesStatistics.h"

namespace assay_host {

// Labels and values.
using SeriesRows = std::vector<std::pair<std::string, std::string>>;

// Returns a title such as "Series: 10 runs".
std::string GetSeriesTitle(const Series& series);

// Returns the facts of the series itself: the runs by verdict, which run is shown, the time.
SeriesRows GetSeriesRows(const Series& series);

// Returns a finding with the tag of its device.
std::string GetFindingText(const SeriesFinding& finding);

// Returns a title such as "Copy bandwidth of clgpu[0]: Accelerator 4000".
std::string GetMeasurementTitle(const Measurement& measurement);

// Returns a value of the measurement with its unit.
std::string GetMeasuredText(const Measurement& measurement, double value);

// Returns the statistics: median, quartiles, range, spread, the first run, outliers, and the
// samples that aren't known.
SeriesRows GetStatisticsRows(const Measurement& measurement, const SeriesStatistics& statistics);

} // namespace assay_host
