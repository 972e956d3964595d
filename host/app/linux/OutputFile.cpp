#include <cerrno>
#include <fcntl.h>
#include <stdexcept>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

#include <boost/filesystem/operations.hpp>

#include "app/Output.h"

namespace assay_host {

namespace {

constexpr ::mode_t kMode = 0666; // less what the user's mask takes

class OutputFile : public Output {
public:
    explicit OutputFile(const std::string& path) : fName(path), fPath(Resolve(path))
    {
        struct stat found = {};
        const bool exists = ::stat(fPath.c_str(), &found) == 0;
        if (exists && !S_ISREG(found.st_mode)) {
            Open(fPath, O_WRONLY);
            return;
        }
        fTemporary = fPath + boost::filesystem::unique_path(".%%%%%%%%.tmp").native();
        Open(fTemporary, O_WRONLY | O_CREAT | O_EXCL);
        if (exists)
            ::fchmod(fFile, found.st_mode);
    }

    ~OutputFile() override
    {
        if (fFile >= 0)
            ::close(fFile);
        if (!fTemporary.empty())
            ::unlink(fTemporary.c_str());
    }

    void Write(std::string_view text) override
    {
        while (!text.empty()) {
            const ::ssize_t count = ::write(fFile, text.data(), text.size());
            if (count >= 0)
                text.remove_prefix(static_cast<std::size_t>(count));
            else if (errno != EINTR)
                Fail();
        }
    }

    void Finish() override
    {
        if (fTemporary.empty())
            return;
        if (::fsync(fFile) != 0 || ::close(std::exchange(fFile, -1)) != 0 ||
            ::rename(fTemporary.c_str(), fPath.c_str()) != 0)
            Fail();
        fTemporary.clear();
    }

private:
    // A link stays one: the file that it leads to is replaced.
    static std::string Resolve(const std::string& path)
    {
        boost::system::error_code error;
        const boost::filesystem::path resolved = boost::filesystem::canonical(path, error);
        return error ? path : resolved.native();
    }

    void Open(const std::string& path, int flags)
    {
        fFile = ::open(path.c_str(), flags | O_CLOEXEC, kMode);
        if (fFile < 0) {
            fTemporary.clear();
            Fail();
        }
    }

    [[noreturn]] void Fail() const
    {
        throw std::runtime_error("cannot write " + fName + ": " +
                                 std::generic_category().message(errno));
    }

    const std::string fName;
    const std::string fPath;
    std::string fTemporary; // empty if there is none
    int fFile = -1;
};

} // namespace

std::unique_ptr<Output> OpenFile(const std::string& path)
{
    return std::make_unique<OutputFile>(path);
}

} // namespace assay_host
