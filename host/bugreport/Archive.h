// Makes a zip archive in memory. Every system opens a zip without further programs. The files are
// stored without compression, so that no library is needed; those of a bug report are small.
#pragma once

#include <string>
#include <vector>

namespace assay_host {

struct ArchiveFile {
    std::string fName; // UTF-8, with "/" after a folder
    std::string fText; // less than 4 GiB
};

// Returns the archive. `time`: of all its files, as MakeUtcText() returns it; 1980 if it has
// another form. Any thread may call.
std::string MakeArchive(const std::vector<ArchiveFile>& files, const std::string& time);

} // namespace assay_host
