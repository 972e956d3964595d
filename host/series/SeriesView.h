// The text form of a series, after that of the run that is shown.
#pragma once

#include <ostream>

#include "series/Series.h"

namespace assay_host {

// Prints the findings, and a plot and the statistics of each measurement. `width`: columns of the
// terminal, of which at least 40 are used. Doesn't check the stream for failures. Any thread may
// call.
void PrintSeries(std::ostream& out, const Series& series, int width);

} // namespace assay_host
