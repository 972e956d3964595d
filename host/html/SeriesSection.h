// The part of a page about a series of runs.
#pragma once

#include "html/Markup.h"
#include "series/Series.h"

namespace assay_host {

// Adds the findings, and a box plot and the statistics of each measurement.
void AddSeriesSection(Markup& page, const Series& series);

} // namespace assay_host
