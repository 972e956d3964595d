// Lists the files that OpenGL and OpenCL would load on a Linux machine.
#pragma once

#include <vector>

#include "identity/Identity.h"
#include "identity/linux/Files.h"
#include "identity/linux/Process.h"

namespace assay_host {

// Lists the loader libraries, the lists of drivers, the drivers that these name, and the libraries
// that they need besides the C and C++ runtime. Lists no library that only a running driver knows
// of, unless it is in one of the folders of such libraries. In no particular order. Throws only
// std::bad_alloc. Any thread may call.
std::vector<DriverFile> ListDriverFiles(const Files& files, const Process& process);

} // namespace assay_host
