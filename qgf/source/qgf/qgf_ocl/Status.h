// OpenCL's status codes as failures of the library.
#pragma once

#include <string>

#include "qgf/OCLFunctionTable.h"

namespace QGF {
namespace OCL {

// The code's name in the OpenCL header; "unknown status" for one that it doesn't have.
const char* StatusName(cl_int status);

// Throws LogicalException "CALL failed: NAME (CODE)" unless the status is CL_SUCCESS.
void CheckStatus(const char* call, cl_int status);

// Throws LogicalException "CALL: COMPLAINT", for an answer that can't be used.
[[noreturn]] void RefuseAnswer(const char* call, const std::string& complaint);

} // namespace OCL
} // namespace QGF
