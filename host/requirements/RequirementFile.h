// Files of requirements.
#pragma once

#include <istream>
#include <string>
#include <vector>

#include "requirements/Requirement.h"

namespace assay_host {

// Reads a JSON object with the member "require", an array of at least one requirement. Other
// members are left for the file's owner. Throws std::runtime_error that says what is wrong.
std::vector<Requirement> ReadRequirements(std::istream& text);

// Reads the file at this path, in UTF-8. Throws std::runtime_error with the text "PATH: REASON".
std::vector<Requirement> LoadRequirements(const std::string& path);

} // namespace assay_host
