// Finds the program to run.
#pragma once

#include <string>

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Returns the file that this code is in: the shared library, or the program that it is linked into.
// Empty if the system doesn't report it. Any thread may call.
boost::filesystem::path GetOwnFile();

// Returns the path of the assay beside GetOwnFile(), or in the folder of programs of the same
// installation, in UTF-8. If there is neither, the path beside it, for the error message.
std::string FindDefaultProgram();

} // namespace assay_host
