// The text exposition of a run, for the textfile collector of node_exporter. docs/fleet.md has the
// metrics. Any thread may call.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Writes each metric that has a series, with its help and type, and without timestamps. A value
// that isn't known has no series. A run has at most 23 series, and each device at most 7. Doesn't
// check the stream for failures.
void WritePrometheusText(std::ostream& out, const Report& report, const RunOutcome& outcome,
                         const RunFacts& facts);

} // namespace assay_host
