// Turns OpenCL status codes into exceptions.
#pragma once

#include <string>

#include "qgf/OCLFunctionTable.h"

namespace QGF {
namespace OCL {

// Returns the code's name in the OpenCL header; "unknown status" for any other code.
const char* StatusName(cl_int status);

// Throws LogicalException "CALL failed: NAME (CODE)" unless the status is CL_SUCCESS.
void CheckStatus(const char* call, cl_int status);

// Throws LogicalException "CALL: REASON". For a call that succeeds with an unusable result.
[[noreturn]] void ThrowBadAnswer(const char* call, const std::string& reason);

} // namespace OCL
} // namespace QGF
