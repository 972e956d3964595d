// When a series ends, and how long it may still take. Any thread may call.
#pragma once

#include <cstddef>
#include <optional>
#include <string>

#include "series/Series.h"

namespace assay_host {

// Whether another run starts after `runs` of at least one, `seconds` after the first launch.
bool IsOver(const SeriesPlan& plan, std::size_t runs, double seconds);

// Estimates the seconds until the end of the series in its run number `runs` + 1: from the mean
// time of the runs that have ended, or from the plan's time. `seconds`: since the first launch;
// `runSeconds`: since that of this run. Returns nothing while there is no estimate: in a first run
// without a time.
std::optional<double> EstimateSecondsLeft(const SeriesPlan& plan, std::size_t runs, double seconds,
                                          double runSeconds);

// Returns "run 4 of 10", or "run 4" without a number of runs; with the time left if it can be
// estimated: "run 4 of 10, about 12 s left".
std::string GetProgressText(const SeriesPlan& plan, std::size_t runs, double seconds,
                            double runSeconds);

} // namespace assay_host
