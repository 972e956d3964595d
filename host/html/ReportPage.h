// The HTML form of a run: one page for browsers, screens of all sizes and printers.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"
#include "series/Series.h"

namespace assay_host {

// Writes the page. It needs nothing but itself: no script to be read, nothing from a network. Its
// content security policy allows its own style, and the one script that copies the JSON document.
// Texts of the driver are escaped. `series`: that of which the run is shown, whose medians the page
// has; null for a run that wasn't repeated. Doesn't check the stream for failures.
void WriteReportPage(std::ostream& out, const Report& report, const RunOutcome& outcome,
                     const RunFacts& facts, const Series* series = nullptr);

} // namespace assay_host
