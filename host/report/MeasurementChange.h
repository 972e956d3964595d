// Decides whether a measurement changed between two runs. The only place that does.
#pragma once

#include <string>

#include "report/Answers.h"

namespace assay_host {

struct MeasurementRule {
    double fTolerance = 0.1;    // as a fraction of the larger value
    bool fFasterIsSame = false; // a measurement in the second report may be larger
};

struct MeasurementChange {
    bool fIsChange = false;
    std::string fNote; // of a change: by how much, such as "-51 %"; may be empty
};

// Compares two answers of a key whose Match is kNumber. Both must have a line. Any thread may call.
MeasurementChange CompareMeasurements(const Answer& before, const Answer& after,
                                      const MeasurementRule& rule);

} // namespace assay_host
