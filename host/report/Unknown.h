// Values of a report that mean "not known": "?", an empty text, a 0. They depend on the key. This
// is the only place that decides about them.
#pragma once

#include "report/KnownKeys.h"
#include "report/ReportLine.h"

namespace assay_host {

enum class Unknown {
    kNot,
    kCut,         // only the beginning of the line came
    kEmpty,       // the driver returned an empty text
    kNoAdapter,   // no adapter of the system matches the device
    kNotListed,   // the system's adapter lists do not have it
    kNoFigure,    // a size or an id of 0
    kNoTime,      // a measurement of 0: the device's clock reported no elapsed time
    kImplausible, // a measurement that no device reaches: its clock is unreliable
};

// Returns a phrase in English; empty for kNot.
const char* GetUnknownText(Unknown unknown);

// Returns why the line's value is not known, or kNot. `known`: its key, or null if that isn't in
// the table. `hasAdapter`: false for a line of a device that no adapter matches. Any thread may
// call.
Unknown JudgeUnknown(const ReportLine& line, const KnownKey* known, bool hasAdapter);

} // namespace assay_host
