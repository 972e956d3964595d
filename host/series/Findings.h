// Makes the findings of a series: what differed between its runs. Any thread may call.
#pragma once

#include <cstddef>
#include <string>

#include "report/RunOutcome.h"
#include "series/DeviceList.h"
#include "series/FactLog.h"
#include "series/Series.h"

namespace assay_host {

// `total` is always the number of runs of which these could be a part.

// Of runs that had another verdict than others. `reason`: the outcome's; may be empty.
SeriesFinding MakeVerdictFinding(Verdict verdict, const std::string& reason, const RunList& runs,
                                 std::size_t total);

// Of a fact. `device`: null for one without a device.
SeriesFinding MakeFactFinding(const ChangedFact& fact, const KnownDevice* device);

// Of a device's tag.
SeriesFinding MakeTagFinding(const ChangedFact& fact, const KnownDevice& device);

// Of an interface. The fact's values are names of a Usability.
SeriesFinding MakeUsableFinding(const ChangedFact& fact, DeviceKind kind);

// Of a device that some runs don't have.
SeriesFinding MakeAbsenceFinding(const KnownDevice& device, const RunList& absent,
                                 std::size_t total);

// Of a measurement that some runs don't know.
SeriesFinding MakeUnknownFinding(const Measurement& measurement, const std::string& reason,
                                 const RunList& runs, std::size_t total);

} // namespace assay_host
