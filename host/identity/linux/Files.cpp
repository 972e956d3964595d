#include "identity/linux/Files.h"

#include <algorithm>
#include <cerrno>
#include <memory>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "identity/linux/Descriptor.h"

namespace assay_host {

namespace {

constexpr std::size_t kMaxNames = 4096;
// The kernel's limits: MAXSYMLINKS and PATH_MAX.
constexpr int kMaxLinks = 40;
constexpr std::size_t kMaxPath = 4096;
// Folders and links within each other, for a host's threads with small stacks. No driver needs
// more.
constexpr int kMaxDepth = 128;

bool IsRegular(const struct stat& status)
{
    return S_ISREG(status.st_mode);
}

std::string ReadSystemLink(const std::string& path)
{
    char target[kMaxPath];
    const ssize_t size = ::readlink(path.c_str(), target, sizeof(target));
    return size > 0 ? std::string(target, static_cast<std::size_t>(size)) : std::string();
}

} // namespace

std::string Files::Read(const std::string& path, std::size_t maxSize) const
{
    const std::string real = GetRealPath(path);
    struct stat status {};
    // Check the type before the file is opened, because opening a device has effects, and after it,
    // because the file may have been replaced.
    if (::stat(real.c_str(), &status) != 0 || !IsRegular(status))
        return {};
    const Descriptor file(::open(real.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    if (file.Get() < 0 || ::fstat(file.Get(), &status) != 0 || !IsRegular(status))
        return {};
    std::string text;
    char block[4096];
    while (text.size() < maxSize) {
        const ssize_t count =
            ::read(file.Get(), block, std::min(sizeof(block), maxSize - text.size()));
        if (count < 0 && errno == EINTR)
            continue;
        if (count < 0)
            return {};
        if (count == 0)
            break;
        text.append(block, static_cast<std::size_t>(count));
    }
    return text;
}

std::string Files::ReadLine(const std::string& path) const
{
    constexpr std::size_t kMaxLine = 4096;
    constexpr const char* kBlanks = " \t\r";
    std::string text = Read(path, kMaxLine);
    text.resize(std::min(text.find('\n'), text.size()));
    const std::size_t first = text.find_first_not_of(kBlanks);
    if (first == std::string::npos)
        return {};
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

std::vector<std::string> Files::List(const std::string& path) const
{
    std::vector<std::string> names;
    if (path.empty())
        return names;
    const std::unique_ptr<DIR, int (*)(DIR*)> entries(::opendir(GetRealPath(path).c_str()),
                                                      ::closedir);
    while (entries && names.size() < kMaxNames) {
        // NOLINTNEXTLINE(concurrency-mt-unsafe): the stream is local to this call.
        const dirent* const entry = ::readdir(entries.get());
        if (entry == nullptr)
            break;
        if (entry->d_name[0] != '.')
            names.emplace_back(entry->d_name);
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::string Files::ReadLink(const std::string& path) const
{
    return ReadSystemLink(GetRealPath(path));
}

std::string Files::Resolve(const std::string& path) const
{
    int links = 0;
    struct stat status {};
    return Resolve(path, links, status, 0);
}

std::string Files::ResolveFolder(const std::string& path, int& links, int depth) const
{
    const auto known = fFolders.find(path);
    if (known != fFolders.end())
        return known->second;
    struct stat status {};
    return fFolders[path] = Resolve(path, links, status, depth);
}

// Returns an empty path after too many links or folders.
std::string Files::Resolve(const std::string& path, int& links, struct stat& status,
                           int depth) const
{
    if (path.size() > kMaxPath || depth == kMaxDepth)
        return {};
    const std::size_t end = path.find_last_not_of('/');
    if (end == std::string::npos)
        return path.empty() ? "" : "/";
    const std::size_t slash = path.rfind('/', end);
    if (slash == std::string::npos)
        return {};
    const std::string name = path.substr(slash + 1, end - slash);
    std::string folder = slash == 0 ? "/" : ResolveFolder(path.substr(0, slash), links, depth + 1);
    if (folder.empty() || name == ".")
        return folder;
    if (name == "..")
        return folder.substr(0, std::max<std::size_t>(folder.rfind('/'), 1));
    std::string resolved = (folder == "/" ? "" : folder) + "/" + name;
    if (::lstat(GetRealPath(resolved).c_str(), &status) != 0)
        return {};
    if (!S_ISLNK(status.st_mode))
        return resolved;
    const std::string target = ReadSystemLink(GetRealPath(resolved));
    if (target.empty() || ++links > kMaxLinks)
        return {};
    return Resolve(target.front() == '/' ? target : folder + "/" + target, links, status,
                   depth + 1);
}

std::optional<FileStatus> Files::Find(const std::string& path) const
{
    int links = 0;
    struct stat status {};
    std::string resolved = Resolve(path, links, status, 0);
    if (resolved.empty() || !IsRegular(status))
        return std::nullopt;
    constexpr std::int64_t kNanoseconds = 1000000000;
    return FileStatus{std::move(resolved),
                      static_cast<std::uint64_t>(status.st_size),
                      std::int64_t{status.st_mtim.tv_sec} * kNanoseconds + status.st_mtim.tv_nsec,
                      {status.st_dev, status.st_ino}};
}

} // namespace assay_host
