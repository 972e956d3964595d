// The warnings of a run, in all its forms.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

struct Warning {
    const char* fCode;    // a stable identifier for programs; docs/assay-host.md has the list
    std::string fTag;     // of the device; empty for a warning of the run
    std::string fText;    // for the user, safe to write to a terminal
    std::string fCause{}; // from the child's log, safe to write to a terminal; may be empty
};

// Returns the text with the device's tag before it and its cause after it.
std::string GetWarningText(const Warning& warning);

// Returns the warnings of the run, then those of each device. Any thread may call.
std::vector<Warning> GetWarnings(const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
