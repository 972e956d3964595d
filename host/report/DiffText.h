// The text form of a comparison: a line for each difference.
#pragma once

#include <ostream>

#include "report/Comparison.h"

namespace assay_host {

// Prints nothing if there is no difference, and nothing was found not to be one. Doesn't check the
// stream for failures. Any thread may call.
void PrintDiff(std::ostream& out, const Comparison& comparison);

} // namespace assay_host
