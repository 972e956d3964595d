// The folder of the state: small files that are replaced as a whole.
//
// Only files of the user that this process runs as are touched. A link is refused, and on Linux a
// file that other users can change.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace assay_host {

enum class FileState {
    kRead,
    kMissing,
    kRefused // a link, another user's file, no file, too large, or unreadable
};

struct FileRead {
    FileState fState = FileState::kMissing;
    std::string fText{};   // only of kRead
    std::string fReason{}; // only of kRefused: "it is a link"
};

struct FolderEntry {
    std::string fName;
    std::int64_t fTime; // of the last change, seconds since 1970
};

// A lock that is held. Its destruction, and the end of the process, release it.
class FolderLock {
public:
    FolderLock() = default;
    virtual ~FolderLock() = default;
    FolderLock(const FolderLock&) = delete;
    FolderLock& operator=(const FolderLock&) = delete;
};

enum class LockState {
    kHeld,
    kBusy,  // another process or thread has it
    kFailed // the file system or the folder doesn't permit it
};

struct LockTry {
    LockState fState = LockState::kFailed;
    std::unique_ptr<FolderLock> fLock{}; // only of kHeld
    std::string fReason{};               // only of kFailed
};

// No function throws for a failure of the system. Any thread may call. A name is a file's in the
// folder, without a path.
class Folder {
public:
    Folder() = default;
    virtual ~Folder() = default;
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;

    // Returns why the folder can't be used; empty if it can.
    virtual std::string GetProblem() const { return {}; }

    virtual FileRead Read(const std::string& name, std::size_t maxBytes) = 0;

    // Creates or replaces a file: after a crash or a power loss there is the old one or the new
    // one. Returns the reason if it fails, and leaves the old one.
    virtual std::string Write(const std::string& name, const std::string& text) = 0;

    // Removes a file; one that is missing is removed already. Returns the reason if it fails.
    virtual std::string Remove(const std::string& name) = 0;

    // Returns the files of this user, in no order, without links and folders.
    virtual std::vector<FolderEntry> List() = 0;

    // Locks the folder against other processes and threads that do the same. Doesn't wait.
    virtual LockTry TryLock() = 0;
};

enum class FolderUse { kRead, kWrite };

// Opens a folder; the path is UTF-8. For kWrite creates it if it is missing, but not its parents.
// If it can't be used, the returned object's files are missing, and its writes fail with the
// reason.
std::unique_ptr<Folder> OpenFolder(const std::string& path, FolderUse use);

// Opens a folder to read. Throws std::runtime_error, "PATH: REASON", if it can't be used.
std::unique_ptr<Folder> OpenUsableFolder(const std::string& path);

// Returns a folder that can't be used.
std::unique_ptr<Folder> MakeUnusableFolder(const std::string& reason);

// Names of files that Write has not renamed yet. They are left behind by a power loss.
bool IsTemporaryName(const std::string& name);

} // namespace assay_host
