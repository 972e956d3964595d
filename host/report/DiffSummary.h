// What a comparison shows in a sentence, and what to do. Any thread may call.
#pragma once

#include <string>
#include <vector>

#include "report/Comparison.h"
#include "report/StoredRun.h"

namespace assay_host {

// Returns a sentence about what matters most, safe to write to a terminal.
std::string GetDiffHeadline(const Comparison& comparison);

// Returns sentences, the most promising first, safe to write to a terminal; none if the second run
// is not worse than the first. `after`: the second run.
std::vector<std::string> GetDiffSteps(const Comparison& comparison, const StoredRun& after);

} // namespace assay_host
