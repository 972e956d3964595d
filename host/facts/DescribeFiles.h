// Reads the versions and build ids of the files that a child has loaded.
#pragma once

#include <vector>

#include "report/LoadedFiles.h"

namespace assay_host {

// Sets the version and the build id of each file, or why it isn't known. Runs nothing of the files.
//
// On Linux the path becomes the one without symbolic links, the version is that in the file's name
// and the build id is that of its GNU note. On Windows the version is that of the version resource,
// and there is no build id. Throws only std::bad_alloc. Any thread may call.
void DescribeFiles(std::vector<LoadedFile>& files);

} // namespace assay_host
