// What a reader of a run must be warned of: one list for every form.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

struct Warning {
    const char* fCode;    // a stable word for programs; docs/assay-host.md has the list
    std::string fTag;     // of the device; empty for a warning of the run
    std::string fText;    // for people, safe to write to a terminal
    std::string fCause{}; // what the child logged of it, as safe; empty for nothing
};

// The text with the device's tag in front and its cause after it.
std::string GetWarningText(const Warning& warning);

// The warnings of the run, then those of each device. Any thread may call.
std::vector<Warning> GetWarnings(const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
