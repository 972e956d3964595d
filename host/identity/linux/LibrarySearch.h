// Finds libraries as the dynamic loader does, without loading them.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "identity/linux/ElfFile.h"
#include "identity/linux/Files.h"
#include "identity/linux/LibraryCache.h"
#include "identity/linux/Process.h"

namespace assay_host {

// What it has found it keeps. Throws only std::bad_alloc. One thread at a time.
class LibrarySearch {
public:
    // Both must outlive the search.
    LibrarySearch(const Files& files, const Process& process);

    // Returns the files that a library which `from` names can be: one, and its variants for newer
    // processors, from which the loader chooses. A name with a slash is a path. Empty if there is
    // no such library.
    std::vector<FileStatus> Find(const std::string& name, const ElfFile& from) const;

private:
    std::vector<FileStatus> FindName(const std::string& name, const ElfFile& from) const;
    const std::vector<std::string>& ListVariants(const std::string& folder) const;
    void AddFolder(const std::string& folder, const std::string& name,
                   std::vector<FileStatus>& found) const;
    std::vector<FileStatus> FindIn(const std::vector<std::string>& folders,
                                   const std::string& name) const;

    const Files& fFiles;
    const Process& fProcess;
    LibraryCache fCache;
    std::vector<std::string> fFirstFolders; // of LD_LIBRARY_PATH
    std::vector<std::string> fLastFolders;  // without a cache
    // The folders for newer processors in a folder, and the files of a name that no library's own
    // folders are searched for.
    mutable std::map<std::string, std::vector<std::string>> fVariants;
    mutable std::map<std::string, std::vector<FileStatus>> fKnown;
};

} // namespace assay_host
