#include <atomic>
#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <stdexcept>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

#include <boost/filesystem/operations.hpp>

#include "output/Links.h"
#include "output/Output.h"
#include "output/linux/WriteAll.h"

namespace assay_host {

namespace {

constexpr ::mode_t kMode = 0666; // before the umask

class OutputFile : public Output {
public:
    OutputFile(const std::string& path, bool isNew)
        : fName(path), fPath(isNew ? path : Resolve(path)), fIsNew(isNew)
    {
        struct stat found = {};
        if (isNew && ::lstat(fPath.c_str(), &found) == 0)
            Fail(EEXIST);
        const bool exists = ::stat(fPath.c_str(), &found) == 0;
        if (!exists && errno != ENOENT)
            Fail(errno);
        if (exists && !S_ISREG(found.st_mode))
            return;
        fTemporary = MakeTemporaryPath(fPath).native();
        OpenPath(fTemporary, O_WRONLY | O_CREAT | O_EXCL);
        fHasTemporary = true;
        if (exists)
            ::fchmod(fFile, found.st_mode);
    }

    ~OutputFile() override
    {
        if (fFile >= 0)
            ::close(fFile);
        OutputFile::Abandon();
    }

    void Open() override
    {
        if (fTemporary.empty())
            OpenPath(fPath, O_WRONLY);
    }

    void Write(std::string_view text) override
    {
        if (const std::error_code error = WriteAll(fFile, text))
            Fail(error.value());
    }

    void Finish() override
    {
        if (fTemporary.empty())
            return;
        if (::fsync(fFile) != 0 || ::close(std::exchange(fFile, -1)) != 0 || !Rename())
            Fail(errno);
        fHasTemporary = false;
    }

    void Abandon() override
    {
        if (fHasTemporary.exchange(false))
            ::unlink(fTemporary.c_str());
    }

private:
    // Returns the file that a link leads to, so that the link itself stays. Only the system can
    // follow links to open files, such as /dev/stdout.
    static std::string Resolve(const std::string& path)
    {
        boost::system::error_code error;
        if (boost::filesystem::status(path, error).type() == boost::filesystem::file_not_found)
            return FollowLinks(path).native();
        const boost::filesystem::path resolved = boost::filesystem::canonical(path, error);
        return error ? path : resolved.native();
    }

    // A file system without RENAME_NOREPLACE has links.
    bool Rename() const
    {
        if (!fIsNew)
            return ::rename(fTemporary.c_str(), fPath.c_str()) == 0;
        if (::renameat2(AT_FDCWD, fTemporary.c_str(), AT_FDCWD, fPath.c_str(), RENAME_NOREPLACE) ==
            0)
            return true;
        return errno == EINVAL && ::link(fTemporary.c_str(), fPath.c_str()) == 0 &&
               ::unlink(fTemporary.c_str()) == 0;
    }

    void OpenPath(const std::string& path, int flags)
    {
        fFile = ::open(path.c_str(), flags | O_CLOEXEC, kMode);
        if (fFile < 0)
            Fail(errno);
    }

    [[noreturn]] void Fail(int error) const
    {
        throw std::runtime_error("cannot write " + fName + ": " +
                                 std::generic_category().message(error));
    }

    const std::string fName;
    const std::string fPath;
    const bool fIsNew;
    std::string fTemporary; // empty if fPath is written directly; set by the constructor
    std::atomic<bool> fHasTemporary{false};
    int fFile = -1;
};

} // namespace

std::unique_ptr<Output> OpenFile(const std::string& path)
{
    return std::make_unique<OutputFile>(path, false);
}

std::unique_ptr<Output> OpenNewFile(const std::string& path)
{
    return std::make_unique<OutputFile>(path, true);
}

} // namespace assay_host
