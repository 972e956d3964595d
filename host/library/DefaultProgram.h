// Finds the program to run.
#pragma once

#include <string>
#include <vector>

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Returns the path, in UTF-8, of the assay in the first of these folders that has one. If none has
// one, the path in the first of them, for the error message.
std::string FindProgramIn(const std::vector<boost::filesystem::path>& folders);

// The same for the folder of GetOwnFile() and the folder of programs of the same installation.
std::string FindDefaultProgram();

} // namespace assay_host
