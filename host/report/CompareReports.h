// Compares two reports.
#pragma once

#include <vector>

#include "report/Comparison.h"
#include "report/MeasurementChange.h"
#include "report/Report.h"

namespace assay_host {

struct ComparisonOptions {
    MeasurementRule fMeasurements;
    bool fIdentity = false; // compare the machines' names and the times too
    bool fAll = false;      // keep gputag lines, and each answer after the end of a run or a device
    bool fKeepSame = false; // fill Comparison::fSame
};

// Log lines and line ends are not compared. Devices are matched by name before index. Answers that
// one run didn't reach are one difference, "report" of the group kRun; those after the failed test
// of a device are one too, "tests" of the group kTrials. The reason for a missing line isn't
// compared: it describes the run, not the machine. Any thread may call.
Comparison CompareReports(const Report& before, const Report& after,
                          const ComparisonOptions& options);

// Sorts by group, and leaves the order in a group.
void SortByGroup(std::vector<Difference>& differences);

} // namespace assay_host
