// Holds the answers of a report, or what is remembered of a machine, to requirements. Any thread
// may call.
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

// What is remembered of an interface.
struct RememberedInterface {
    Usability fUsability = Usability::kUnknown;
    std::string fText; // a sentence on it, safe to write to a terminal
};

// The same of what is remembered. It has no keys and no devices, so no requirement on them is met.
std::string FindUnmetInMemory(const Requirement& requirement, const RememberedInterface& opengl,
                              const RememberedInterface& opencl);

} // namespace assay_host
