// Reads the files of a machine below a root that a test replaces.
#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

struct stat;

namespace assay_host {

// What the file system has of a regular file.
struct FileStatus {
    std::string fPath;   // without symbolic links, as seen from the root
    std::uint64_t fSize; // bytes
    std::int64_t fTime;  // of the last change: nanoseconds since 1970 in UTC
    // What all names of one file have in common.
    std::pair<std::uint64_t, std::uint64_t> fNode;
};

// Returns "FOLDER/NAME".
inline std::string JoinPath(const std::string& folder, const std::string& name)
{
    return std::string(folder).append("/").append(name);
}

// Every path is absolute and as seen from the root. Below another root, absolute links are followed
// only by Resolve() and Find(); pass their paths to the other functions. Nothing is opened but
// folders and regular files. The links of a folder are read once. Throws only std::bad_alloc. One
// thread at a time.
class Files {
public:
    // An empty root is that of the machine.
    explicit Files(std::string root = {}) : fRoot(std::move(root)) {}

    // Reads at most `maxSize` bytes of a file. Returns an empty text if it can't be read.
    std::string Read(const std::string& path, std::size_t maxSize = kMaxSize) const;

    // Returns the first line of a file without the blanks around it; empty if it can't be read.
    std::string ReadLine(const std::string& path) const;

    // Returns the names in a folder, sorted by their bytes, without hidden ones. At most 4096.
    std::vector<std::string> List(const std::string& path) const;

    // Returns the text of a symbolic link; empty if it is none.
    std::string ReadLink(const std::string& path) const;

    // Returns the path without symbolic links; empty if there is no such file or folder. An
    // absolute link starts at the root.
    std::string Resolve(const std::string& path) const;

    // Returns the status of a regular file, all links followed.
    std::optional<FileStatus> Find(const std::string& path) const;

    // Returns the path for the functions of the system.
    std::string GetRealPath(const std::string& path) const { return fRoot + path; }

private:
    static constexpr std::size_t kMaxSize = std::size_t{1} << 20;

    // Sets `status` if the path is a file's. `depth` is the number of nested calls.
    std::string Resolve(const std::string& path, int& links, struct stat& status, int depth) const;
    std::string ResolveFolder(const std::string& path, int& links, int depth) const;

    std::string fRoot;
    mutable std::map<std::string, std::string> fFolders; // their paths without links
};

} // namespace assay_host
