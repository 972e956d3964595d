// Compares two stored runs: their reports, how they ended, and what can be used.
#pragma once

#include "report/CompareReports.h"
#include "report/StoredRun.h"

namespace assay_host {

// Compares the reports, and whether OpenGL and OpenCL can be used, judged by what both files have.
// How a run ended is only compared if both files have it. Measurements of two series are compared
// by a test of their samples; their reports must have the medians. The comparison points into the
// reports. Any thread may call.
Comparison CompareRuns(const StoredRun& before, const StoredRun& after,
                       const ComparisonOptions& options);

} // namespace assay_host
