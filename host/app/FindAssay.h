// Which program is run where none is named.
#pragma once

#include <string>

#include "app/CommandLine.h"
#include "supervise/ChildRun.h"

namespace assay_host {

// The one beside this program, else the one on the PATH; if there is none, the path beside this
// program all the same, so that it can be named.
std::string FindAssay();

ChildOptions MakeChildOptions(const ChildChoice& choice);

} // namespace assay_host
