// The status check of the OpenCL measurements.
#pragma once

#include "pmutil/Requirement.h"
#include "qgf/OCLFunctionTable.h"

namespace pmutil {

// Throws std::runtime_error "Failed requirement: ciErrNum == CL_SUCCESS" unless the status is
// CL_SUCCESS.
inline void CheckCLError(cl_int ciErrNum)
{
    if (ciErrNum != CL_SUCCESS)
        RequirementFailed(kNoFile, 0, "Failed requirement: ciErrNum == CL_SUCCESS", true);
}

} // namespace pmutil
