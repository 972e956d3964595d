// The warnings that the text form begins with.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Returns one sentence for each warning, safe to write to a terminal: of the run, then of each
// device. Any thread may call.
std::vector<std::string> GetWarnings(const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
