// The report of a series for the forms that have one value of each measurement.
#pragma once

#include "report/Report.h"
#include "report/StoredRun.h"
#include "series/Series.h"

namespace assay_host {

// Returns the report of the run that is shown, in which each measurement of the series has its
// typical value, as GetTypicalValue() has it. Other lines, and a measurement of which no run is
// known, are unchanged. Any thread may call.
Report MakeMedianReport(const Report& shown, const Series& series);

// Returns that of a run with a series, and otherwise the run's own report. Any thread may call.
Report GetTypicalReport(const StoredRun& run);

} // namespace assay_host
