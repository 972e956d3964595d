// What a person should know before anything else of a run.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

// One sentence each, ready for a terminal: of the run first, then of each device.
std::vector<std::string> GetWarnings(const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
