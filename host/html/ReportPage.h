// The HTML form of a run: one page for browsers, screens of all sizes and printers.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Writes the page. It needs nothing but itself: no script to be read, nothing from a network. Its
// content security policy allows its own style, and the one script that copies the JSON document.
// Texts of the driver are escaped. Doesn't check the stream for failures.
void WriteReportPage(std::ostream& out, const Report& report, const RunOutcome& outcome,
                     const RunFacts& facts);

} // namespace assay_host
