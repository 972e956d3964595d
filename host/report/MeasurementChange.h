// Decides whether a measurement changed between two runs. The only place that does.
#pragma once

#include <functional>
#include <optional>
#include <string>

#include "report/Answers.h"

namespace assay_host {

struct MeasurementChange {
    bool fIsChange = false;
    // Of a change: by how much, such as "-51 %". Of none: why it counts as none. May be empty.
    std::string fNote;
};

struct MeasurementRule {
    double fTolerance = 0.1;    // as a fraction of the larger value
    bool fFasterIsSame = false; // a measurement in the second report may be larger

    // Of two series; nothing if the test of their samples decides alone.
    std::optional<double> fSeriesTolerance{};

    // Decides instead of the other rules, if it is there and returns something. `key`: without the
    // device's tag.
    std::function<std::optional<MeasurementChange>(
        const DeviceAnswers& before, const DeviceAnswers& after, const std::string& key)>
        fTest{};
};

// Compares two answers of a key whose Match is kNumber. Both must have a line. Any thread may call.
MeasurementChange CompareMeasurements(const Answer& before, const Answer& after,
                                      const MeasurementRule& rule);

} // namespace assay_host
