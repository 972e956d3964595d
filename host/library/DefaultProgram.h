// Finds the program to run.
#pragma once

#include <string>

namespace assay_host {

// Returns the path of the assay beside GetOwnFile(), or in the folder of programs of the same
// installation, in UTF-8. If there is neither, the path beside it, for the error message.
std::string FindDefaultProgram();

} // namespace assay_host
