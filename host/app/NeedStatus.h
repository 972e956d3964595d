// The exit status by what a caller needs.
#pragma once

#include "app/CommandLine.h"
#include "report/Usable.h"

namespace assay_host {

// Returns GetUsabilityStatus() of the interface that is needed; of both, the worse one's. The need
// must not be kNothing.
int GetNeedStatus(Need need, Usability opengl, Usability opencl);

} // namespace assay_host
