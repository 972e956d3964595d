#include "qgf/SystemFiles.h"

#include <algorithm>
#include <cerrno>
#include <memory>
#include <string_view>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace QGF {
namespace {

constexpr std::size_t kMaxFolderEntries = 4096;

class Descriptor {
public:
    explicit Descriptor(int fd) : fFd(fd) {}
    ~Descriptor()
    {
        if (fFd >= 0)
            close(fFd);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int get() const { return fFd; }

private:
    int fFd;
};

// How much of a file to read; never more than the maximum size.
enum class Extent { kAll, kFirstLine };

bool ReadBytes(int fd, std::string& text, std::size_t maxSize, Extent extent)
{
    char block[4096];
    while (text.size() < maxSize) {
        const ssize_t count = read(fd, block, std::min(sizeof block, maxSize - text.size()));
        if (count < 0) {
            if (errno == EINTR)
                continue;
            return false;
        }
        if (count == 0)
            break;
        const std::string_view added(block, static_cast<std::size_t>(count));
        text += added;
        if (extent == Extent::kFirstLine && added.find('\n') != std::string_view::npos)
            break;
    }
    return true;
}

bool ReadFile(const std::string& path, std::string& text, std::size_t maxSize, Extent extent)
{
    text.clear();
    const std::string full = SystemRoot() + path;
    // Check the type before the open: opening a pipe would block, and opening a device node may
    // have an effect. Check again after it, since the file may have been replaced.
    struct stat status {};
    if (stat(full.c_str(), &status) != 0 || !S_ISREG(status.st_mode))
        return false;
    const Descriptor file(open(full.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC | O_NOCTTY));
    if (file.get() < 0 || fstat(file.get(), &status) != 0 || !S_ISREG(status.st_mode))
        return false;
    if (!ReadBytes(file.get(), text, maxSize, extent)) {
        text.clear();
        return false;
    }
    return true;
}

} // namespace

bool ReadSystemFile(const std::string& path, std::string& text, std::size_t maxSize)
{
    return ReadFile(path, text, maxSize, Extent::kAll);
}

std::string ReadSystemLine(const std::string& path)
{
    std::string text;
    ReadFile(path, text, kMaxSystemFileSize, Extent::kFirstLine);
    text.resize(std::min(text.find('\n'), text.size()));
    const char* const blanks = " \t\r";
    const std::size_t first = text.find_first_not_of(blanks);
    if (first == std::string::npos)
        return std::string();
    return text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

std::vector<std::string> ListSystemFolder(const std::string& path)
{
    std::vector<std::string> names;
    const std::unique_ptr<DIR, int (*)(DIR*)> folder(opendir((SystemRoot() + path).c_str()),
                                                     closedir);
    if (!folder)
        return names;
    while (names.size() < kMaxFolderEntries) {
        // NOLINTNEXTLINE(concurrency-mt-unsafe): the stream is local to this call.
        const dirent* const entry = readdir(folder.get());
        if (!entry)
            break;
        if (entry->d_name[0] != '.')
            names.emplace_back(entry->d_name);
    }
    std::sort(names.begin(), names.end());
    return names;
}

std::string ReadSystemLink(const std::string& path)
{
    char target[4096];
    const ssize_t length = readlink((SystemRoot() + path).c_str(), target, sizeof target);
    return length > 0 ? std::string(target, static_cast<std::size_t>(length)) : std::string();
}

std::string LastOfPath(const std::string& path)
{
    return path.substr(path.rfind('/') + 1);
}

} // namespace QGF
