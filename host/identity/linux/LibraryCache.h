// Reads the dynamic loader's list of libraries (ld.so.cache).
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace assay_host {

class LibraryCache {
public:
    // Parses the bytes of the file. A file of another format, byte order or machine, or a damaged
    // one, is as good as empty.
    explicit LibraryCache(std::string bytes);
    LibraryCache(const LibraryCache&) = delete;
    LibraryCache& operator=(const LibraryCache&) = delete;

    // Returns the paths of a library, in no particular order: the one for any processor and those
    // for newer ones, among which the loader chooses. Any thread may call.
    std::vector<std::string> Find(std::string_view name) const;

private:
    std::string fBytes;
    std::vector<std::pair<std::string_view, std::string_view>> fEntries; // sorted
};

} // namespace assay_host
