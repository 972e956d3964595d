#include <windows.h>

#include <atomic>
#include <stdexcept>
#include <system_error>

#include <boost/filesystem/operations.hpp>

#include "output/Links.h"
#include "output/Output.h"
#include "output/win/WriteAll.h"
#include "supervise/Paths.h"

namespace assay_host {

namespace {

class OutputFile : public Output {
public:
    OutputFile(const std::string& path, bool isNew)
        : fName(path), fPath(isNew ? ToPath(path) : FollowLinks(ToPath(path))), fIsNew(isNew)
    {
        boost::system::error_code error;
        if (isNew && boost::filesystem::symlink_status(fPath, error).type() !=
                         boost::filesystem::file_not_found)
            Fail({ERROR_FILE_EXISTS, std::system_category()});
        const boost::filesystem::file_type type = boost::filesystem::status(fPath, error).type();
        if (type != boost::filesystem::file_not_found && type != boost::filesystem::regular_file)
            return;
        fTemporary = MakeTemporaryPath(fPath);
        OpenPath(fTemporary, CREATE_NEW);
        fHasTemporary = true;
    }

    ~OutputFile() override
    {
        Close();
        OutputFile::Abandon();
    }

    void Open() override
    {
        if (fTemporary.empty())
            OpenPath(fPath, OPEN_EXISTING);
    }

    void Write(std::string_view text) override
    {
        if (const std::error_code error = WriteAll(fFile, text))
            Fail(error);
    }

    void Finish() override
    {
        if (fTemporary.empty())
            return;
        if (::FlushFileBuffers(fFile) == 0)
            Fail(GetLastCode());
        Close();
        if (::MoveFileExW(fTemporary.c_str(), fPath.c_str(),
                          MOVEFILE_WRITE_THROUGH |
                              (fIsNew ? 0U : DWORD{MOVEFILE_REPLACE_EXISTING})) == 0)
            Fail(GetLastCode());
        fHasTemporary = false;
    }

    void Abandon() override
    {
        if (fHasTemporary.exchange(false))
            ::DeleteFileW(fTemporary.c_str());
    }

private:
    void OpenPath(const boost::filesystem::path& path, DWORD disposition)
    {
        fFile = ::CreateFileW(path.c_str(), GENERIC_WRITE, FILE_SHARE_READ | FILE_SHARE_DELETE,
                              nullptr, disposition, FILE_ATTRIBUTE_NORMAL, nullptr);
        if (fFile == INVALID_HANDLE_VALUE)
            Fail(GetLastCode());
    }

    void Close()
    {
        if (fFile != INVALID_HANDLE_VALUE)
            ::CloseHandle(fFile);
        fFile = INVALID_HANDLE_VALUE;
    }

    static std::error_code GetLastCode()
    {
        return {static_cast<int>(::GetLastError()), std::system_category()};
    }

    [[noreturn]] void Fail(const std::error_code& error) const
    {
        throw std::runtime_error("cannot write " + fName + ": " + error.message());
    }

    const std::string fName;
    const boost::filesystem::path fPath;
    const bool fIsNew;
    boost::filesystem::path fTemporary; // empty if fPath is written directly
    std::atomic<bool> fHasTemporary{false};
    HANDLE fFile = INVALID_HANDLE_VALUE;
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
