// A run as a local fact of Ansible: one small JSON object. docs/fleet.md has the members. Any
// thread may call.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Writes the object and a line end. A value that isn't known has no member. Doesn't check the
// stream for failures.
void WriteAnsibleFacts(std::ostream& out, const Report& report, const RunOutcome& outcome,
                       const RunFacts& facts);

} // namespace assay_host
