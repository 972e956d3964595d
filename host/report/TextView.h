// The text form of a run: the warnings, a table for each device, and the verdict.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Prints the run. `width`: columns of the terminal, to which values are wrapped; at least 40 are
// used. Doesn't check the stream for failures.
void PrintText(std::ostream& out, const Report& report, const RunOutcome& outcome, int width);

} // namespace assay_host
