// The version that a program's file carries, read without running it.
#pragma once

#include <string>

#include "report/RunFacts.h"

namespace assay_host {

// Of assay's own file: on Linux the version in its ELF note, on Windows the version resource of any
// program. Unknown if the file can't be read or has none; never throws. The path is UTF-8. Any
// thread may call.
Fact GetFileVersion(const std::string& path);

} // namespace assay_host
