// Values by which a report says that it does not know: "?", an empty text, a 0. Each key has its
// own way, and every form of a run decides here which value is one of these.
#pragma once

#include "report/KnownKeys.h"
#include "report/ReportLine.h"

namespace assay_host {

enum class Unknown {
    kNot,
    kCut,         // only the beginning of the line came
    kEmpty,       // the driver gave an empty text
    kNoAdapter,   // no adapter of the system matches the device
    kNotListed,   // the system's adapter lists do not have it
    kNoFigure,    // a size or an id of 0
    kNoTime,      // a measurement of 0: the device's clock reported no elapsed time
    kImplausible, // a measurement that no device reaches: its clock is unreliable
};

// A sentence part in English; empty for kNot.
const char* GetUnknownText(Unknown unknown);

// Whether the line's value stands for "not known", and why. `known` is its key, null for one that
// is not known; `hasAdapter` is false for a line of a device that no adapter matches.
Unknown JudgeUnknown(const ReportLine& line, const KnownKey* known, bool hasAdapter);

} // namespace assay_host
