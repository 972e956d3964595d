// Reads the version in a program's file, without running the program.
#pragma once

#include <string>

#include "report/RunFacts.h"

namespace assay_host {

// Returns the version of a program: on Linux the one in assay's ELF note, on Windows the version
// resource. Unknown if the file can't be read or has none. Never throws. The path is UTF-8. Any
// thread may call.
Fact GetFileVersion(const std::string& path);

} // namespace assay_host
