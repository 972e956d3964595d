// Whether a measurement changed between two series.
#pragma once

#include <optional>
#include <string>

#include "report/Answers.h"
#include "report/MeasurementChange.h"
#include "series/Series.h"

namespace assay_host {

// Tests the samples of a measurement, without those of the first runs, by TestChange(). With a
// tolerance, a change also has to be larger than that fraction of the larger median. The note is
// there without a change too. Returns nothing if a series doesn't have the measurement, or no
// sample of it is known. `key`: without the device's tag. Any thread may call.
std::optional<MeasurementChange> CompareSeries(const Series& before, const Series& after,
                                               const DeviceAnswers& deviceBefore,
                                               const DeviceAnswers& deviceAfter,
                                               const std::string& key,
                                               std::optional<double> tolerance);

} // namespace assay_host
