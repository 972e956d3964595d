// What a reader of a run must be warned of: one list for every form.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

struct Warning {
    const char* fCode; // a stable word for programs; docs/assay-host.md has the list
    std::string fTag;  // of the device; empty for a warning of the run
    std::string fText; // for people, safe to write to a terminal
};

// The text with the device's tag in front: "glgpu[0]: a test failed".
std::string GetWarningText(const Warning& warning);

// The warnings of the run, then those of each device. Any thread may call.
std::vector<Warning> GetWarnings(const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
