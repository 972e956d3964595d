// What changed between two reports.
#pragma once

#include <ostream>

#include "report/Report.h"

namespace assay_host {

struct DiffOptions {
    double fTolerance = 0.1; // of measured numbers, as a part of the larger one
};

// Prints one line a difference, and tells whether there was one. Stamps and log lines don't count;
// devices are matched by name first, so that another order of the same devices is told as such.
bool PrintDiff(std::ostream& out, const Report& before, const Report& after,
               const DiffOptions& options);

} // namespace assay_host
