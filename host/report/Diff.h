// Compares two reports.
#pragma once

#include <ostream>

#include "report/Report.h"

namespace assay_host {

struct DiffOptions {
    double fTolerance = 0.1;    // of measurements, as a fraction of the larger value
    bool fFasterIsSame = false; // a measurement in the second report may be larger
    bool fStamps = false;       // compare the time stamps too
};

// Prints one line for each difference and returns whether there is one. Log lines,
// line ends and the outcome of the run are not compared. Devices are matched by name before index,
// so that a different order of the same devices is reported as such. Doesn't check the stream for
// failures.
bool PrintDiff(std::ostream& out, const Report& before, const Report& after,
               const DiffOptions& options);

} // namespace assay_host
