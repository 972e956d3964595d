// The tables of one comparison on a page.
#pragma once

#include "html/Markup.h"
#include "report/Comparison.h"

namespace assay_host {

// Adds a table for each group that has differences, charts of measurements, and what is the same
// folded. `heading`: the element of the tables' headings.
void AddDiffTables(Markup& page, const Comparison& comparison, const char* heading);

} // namespace assay_host
