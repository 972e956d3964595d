// Collects libraries with the libraries that they need.
#pragma once

#include <map>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "identity/Identity.h"
#include "identity/linux/ElfFile.h"
#include "identity/linux/Files.h"
#include "identity/linux/LibrarySearch.h"

namespace assay_host {

// Throws only std::bad_alloc. One thread at a time.
class LibrarySet {
public:
    // Both must outlive the set.
    LibrarySet(const Files& files, const LibrarySearch& search) : fFiles(files), fSearch(search) {}

    // Adds a library that `from` opens by this name or path, and what it needs, except the C and
    // C++ runtime. Of a library with several names the first one is kept. Returns the paths of the
    // library; empty if there is none.
    std::vector<std::string> Add(DeviceKind kind, const std::string& name, const ElfFile& from);

    // Adds a file that isn't a library. Of a file with several names the first one is kept.
    void AddFile(DeviceKind kind, const FileStatus& status);

    // Returns what the library at this path tells the dynamic loader. The path is one that Add()
    // returned.
    const ElfFile& GetElfFile(const std::string& path);

    const std::vector<DriverFile>& Get() const { return fDriverFiles; }

private:
    using Node = decltype(FileStatus::fNode);

    void AddLibrary(DeviceKind kind, const FileStatus& status);

    const Files& fFiles;
    const LibrarySearch& fSearch;
    std::map<std::string, ElfFile> fElfFiles;            // by path
    std::set<std::pair<DeviceKind, Node>> fNodes;        // of fDriverFiles
    std::set<std::pair<DeviceKind, std::string>> fNames; // that were looked up
    std::vector<DriverFile> fDriverFiles;
};

} // namespace assay_host
