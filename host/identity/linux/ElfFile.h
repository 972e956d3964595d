// Reads what a shared library tells the dynamic loader.
#pragma once

#include <string>
#include <vector>

namespace assay_host {

struct ElfFile {
    std::string fBuildId;              // in lower-case hexadecimal; empty if there is none
    std::vector<std::string> fNeeded;  // the names of the libraries that it needs
    std::vector<std::string> fRunPath; // folders to search; $ORIGIN is its own folder
    // The folders are those of DT_RPATH, which come before LD_LIBRARY_PATH.
    bool fIsRunPathFirst = false;
};

// Reads a file whose path is `realPath`. `folder` replaces $ORIGIN. Everything is empty if the file
// can't be read, isn't an ELF file of this machine's word size and byte order, or is damaged. Reads
// at most 256 names. Throws only std::bad_alloc. Any thread may call.
ElfFile ReadElfFile(const std::string& realPath, const std::string& folder);

} // namespace assay_host
