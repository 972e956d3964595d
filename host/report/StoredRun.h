// A run as a file has it.
#pragma once

#include <optional>

#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"
#include "series/Series.h"

namespace assay_host {

// What a file has of how the run ended.
enum class OutcomeExtent {
    kNone,     // nothing: the outcome is that of MakeOutcomeOfReport()
    kNoCauses, // all but RunOutcome::fCauses, as the first schema
    kAll
};

struct StoredRun {
    Report fReport;
    RunOutcome fOutcome;
    RunFacts fFacts;
    OutcomeExtent fExtent = OutcomeExtent::kAll;
    std::optional<Series> fSeries{}; // of which the others are the run that is shown
};

// Makes the outcome of a run of which only the report is stored: complete if it is whole, and
// failed-tests otherwise. The reason says that the child's end isn't known.
RunOutcome MakeOutcomeOfReport(const Report& report);

} // namespace assay_host
