#include "memory/Folder.h"

#include <algorithm>
#include <cerrno>
#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>
#include <utility>

#include <boost/filesystem/operations.hpp>

namespace assay_host {

namespace {

constexpr ::mode_t kFolderMode = 0700;
constexpr ::mode_t kFileMode = 0600;
constexpr ::mode_t kOthersWrite = S_IWGRP | S_IWOTH;
constexpr char kLockName[] = "lock";

std::string GetReason(int error)
{
    return std::generic_category().message(error);
}

class Descriptor {
public:
    explicit Descriptor(int number) : fNumber(number) {}
    Descriptor(Descriptor&& other) noexcept : fNumber(std::exchange(other.fNumber, -1)) {}
    Descriptor& operator=(Descriptor&& other) noexcept
    {
        std::swap(fNumber, other.fNumber);
        return *this;
    }
    ~Descriptor()
    {
        if (fNumber >= 0)
            ::close(fNumber);
    }

    int Get() const { return fNumber; }

    int Close()
    {
        const int number = fNumber;
        fNumber = -1;
        return ::close(number);
    }

private:
    int fNumber;
};

class HeldLock : public FolderLock {
public:
    explicit HeldLock(Descriptor&& file) : fFile(std::move(file)) {}

private:
    const Descriptor fFile;
};

// Returns why the open file must not be used; empty if it may.
std::string CheckFile(const struct stat& file)
{
    if (!S_ISREG(file.st_mode))
        return "it is not a file";
    if (file.st_uid != ::geteuid())
        return "it belongs to another user";
    if ((file.st_mode & kOthersWrite) != 0)
        return "other users can change it";
    return {};
}

class SystemFolder : public Folder {
public:
    explicit SystemFolder(Descriptor&& folder) : fFolder(std::move(folder)) {}

    FileRead Read(const std::string& name, std::size_t maxBytes) override
    {
        // O_NONBLOCK: a named pipe doesn't block.
        const Descriptor file(
            ::openat(fFolder.Get(), name.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
        if (file.Get() < 0) {
            if (errno == ENOENT)
                return {};
            return {FileState::kRefused, {}, errno == ELOOP ? "it is a link" : GetReason(errno)};
        }
        struct stat found = {};
        if (::fstat(file.Get(), &found) != 0)
            return {FileState::kRefused, {}, GetReason(errno)};
        if (std::string reason = CheckFile(found); !reason.empty())
            return {FileState::kRefused, {}, std::move(reason)};
        // One byte more than the file has shows its end with one read. A file that grows needs
        // more.
        std::string text(std::min(static_cast<std::size_t>(found.st_size), maxBytes) + 1, '\0');
        std::size_t size = 0;
        while (size <= maxBytes) {
            if (size == text.size())
                text.resize(maxBytes + 1);
            const ::ssize_t got = ::read(file.Get(), &text[size], text.size() - size);
            if (got < 0 && errno != EINTR)
                return {FileState::kRefused, {}, GetReason(errno)};
            if (got == 0)
                break;
            size += got > 0 ? static_cast<std::size_t>(got) : 0;
        }
        if (size > maxBytes)
            return {FileState::kRefused, {}, "it is too large"};
        text.resize(size);
        return {FileState::kRead, std::move(text), {}};
    }

    std::string Write(const std::string& name, const std::string& text) override
    {
        const std::string temporary =
            "." + name + boost::filesystem::unique_path(".%%%%%%%%").native() + ".tmp";
        std::string reason = WriteNew(temporary, text);
        if (reason.empty() &&
            ::renameat(fFolder.Get(), temporary.c_str(), fFolder.Get(), name.c_str()) != 0)
            reason = GetReason(errno);
        if (!reason.empty())
            ::unlinkat(fFolder.Get(), temporary.c_str(), 0);
        else if (::fsync(fFolder.Get()) != 0 && errno != EINVAL)
            reason = GetReason(errno); // EINVAL: this file system can't, and needs no, sync
        return reason;
    }

    std::string Remove(const std::string& name) override
    {
        const bool removed = ::unlinkat(fFolder.Get(), name.c_str(), 0) == 0 || errno == ENOENT;
        return removed ? std::string() : GetReason(errno);
    }

    std::vector<FolderEntry> List() override
    {
        std::vector<FolderEntry> entries;
        const int copy = ::openat(fFolder.Get(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        const std::unique_ptr<DIR, int (*)(DIR*)> folder(copy >= 0 ? ::fdopendir(copy) : nullptr,
                                                         ::closedir);
        if (folder == nullptr) {
            if (copy >= 0)
                ::close(copy);
            return entries;
        }
        // NOLINTNEXTLINE(concurrency-mt-unsafe): the stream is local to this call
        while (const dirent* const entry = ::readdir(folder.get())) {
            struct stat found = {};
            if (::fstatat(copy, entry->d_name, &found, AT_SYMLINK_NOFOLLOW) == 0 &&
                CheckFile(found).empty())
                entries.push_back({entry->d_name, found.st_mtime});
        }
        return entries;
    }

    LockTry TryLock() override
    {
        Descriptor file(::openat(fFolder.Get(), kLockName,
                                 O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC,
                                 kFileMode));
        struct stat found = {};
        if (file.Get() < 0 || ::fstat(file.Get(), &found) != 0)
            return {LockState::kFailed, nullptr, GetReason(errno)};
        if (std::string reason = CheckFile(found); !reason.empty())
            return {LockState::kFailed, nullptr, "the lock can't be used: " + reason};
        if (::flock(file.Get(), LOCK_EX | LOCK_NB) != 0)
            return {errno == EWOULDBLOCK ? LockState::kBusy : LockState::kFailed, nullptr,
                    GetReason(errno)};
        return {LockState::kHeld, std::make_unique<HeldLock>(std::move(file)), {}};
    }

private:
    std::string WriteNew(const std::string& name, const std::string& text) const
    {
        Descriptor file(::openat(fFolder.Get(), name.c_str(),
                                 O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, kFileMode));
        if (file.Get() < 0)
            return GetReason(errno);
        std::size_t done = 0;
        while (done < text.size()) {
            const ::ssize_t wrote = ::write(file.Get(), text.data() + done, text.size() - done);
            if (wrote < 0 && errno != EINTR)
                return GetReason(errno);
            done += wrote > 0 ? static_cast<std::size_t>(wrote) : 0;
        }
        if (::fsync(file.Get()) != 0 || file.Close() != 0)
            return GetReason(errno);
        return {};
    }

    const Descriptor fFolder;
};

// Returns why the open folder must not be used; empty if it may.
std::string CheckFolder(int folder)
{
    struct stat found = {};
    if (::fstat(folder, &found) != 0)
        return GetReason(errno);
    if (found.st_uid != ::geteuid() && found.st_uid != 0)
        return "it belongs to another user";
    // In a folder with the sticky bit nobody can rename or remove another user's files.
    if ((found.st_mode & S_IWOTH) != 0 && (found.st_mode & S_ISVTX) == 0)
        return "all users can change it";
    return {};
}

} // namespace

std::unique_ptr<Folder> OpenFolder(const std::string& path, FolderUse use)
{
    // With a slash at its end, the name of a link would mean what it leads to.
    std::string place = path;
    while (place.size() > 1 && place.back() == '/')
        place.pop_back();
    if (use == FolderUse::kWrite && ::mkdir(place.c_str(), kFolderMode) != 0 && errno != EEXIST &&
        errno != EROFS)
        return MakeUnusableFolder(GetReason(errno));
    constexpr int kFlags = O_RDONLY | O_DIRECTORY | O_CLOEXEC;
    Descriptor folder(::open(place.c_str(), kFlags | O_NOFOLLOW));
    int error = errno;
    struct stat link = {};
    if (folder.Get() < 0 && ::lstat(place.c_str(), &link) == 0 && S_ISLNK(link.st_mode)) {
        if (link.st_uid != ::geteuid() && link.st_uid != 0)
            return MakeUnusableFolder("it is a link of another user");
        folder = Descriptor(::open(place.c_str(), kFlags));
        error = errno;
    }
    if (folder.Get() < 0)
        return MakeUnusableFolder(GetReason(error));
    if (const std::string reason = CheckFolder(folder.Get()); !reason.empty())
        return MakeUnusableFolder(reason);
    return std::make_unique<SystemFolder>(std::move(folder));
}

} // namespace assay_host
