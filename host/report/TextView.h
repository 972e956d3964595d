// A run for people: warnings first, then one table a device, then the verdict.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunOutcome.h"

namespace assay_host {

// `width`: columns of the terminal; longer values are wrapped.
void PrintText(std::ostream& out, const Report& report, const RunOutcome& outcome, int width);

} // namespace assay_host
