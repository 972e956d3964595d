// Finds the program to run.
#pragma once

#include <string>

#include "app/CommandLine.h"
#include "supervise/ChildRun.h"

namespace assay_host {

// Returns the path of the assay beside this program, otherwise of the one on the PATH, in UTF-8. If
// there is neither, the path beside this program, for the error message.
std::string FindAssay();

// Makes the options of a run, with FindAssay() if no program is named.
ChildOptions MakeChildOptions(const ChildChoice& choice);

} // namespace assay_host
