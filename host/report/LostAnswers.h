// The questions about a device that have no answer, as people read them. Any thread may call.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"

namespace assay_host {

// Returns the answer's name for people: its label, or its key if the table of keys doesn't have it.
// Safe to write to a terminal.
std::string GetLabel(const Answer& answer);

// Whether an answer that the device should have given is missing.
bool IsLost(const Answer& answer);

struct LostAnswers {
    Missing fMissing;
    std::string fLabels; // separated by commas; "all limits", "all extensions" for whole groups
};

// Returns the lost answers by reason, in a fixed order of reasons.
std::vector<LostAnswers> ListLost(const DeviceAnswers& device);

} // namespace assay_host
