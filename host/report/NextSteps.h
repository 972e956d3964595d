// What a user can do after a run that found trouble, in one place for every form of a run.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Returns sentences, the most promising first, safe to write to a terminal; none if OpenGL works on
// graphics hardware and the run found no trouble with OpenCL. Any thread may call.
std::vector<std::string> GetNextSteps(const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
