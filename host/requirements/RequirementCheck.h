// Holds the answers of a report to requirements. Any thread may call.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/RunOutcome.h"
#include "requirements/Requirement.h"

namespace assay_host {

// Returns why the requirement isn't met, with the values found, safe to write to a terminal; empty
// if it is met. A missing answer and one that isn't known meet no requirement, whatever its
// relation.
std::string FindUnmet(const Requirement& requirement, const Answers& answers,
                      const RunOutcome& outcome);

} // namespace assay_host
