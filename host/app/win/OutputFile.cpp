#include <windows.h>

#include <algorithm>
#include <stdexcept>
#include <system_error>

#include <boost/filesystem/operations.hpp>

#include "app/Output.h"
#include "supervise/Paths.h"

namespace assay_host {

namespace {

constexpr std::size_t kMaxWrite = std::size_t{1} << 20;

class OutputFile : public Output {
public:
    explicit OutputFile(const std::string& path) : fName(path), fPath(ToPath(path))
    {
        boost::system::error_code error;
        const boost::filesystem::file_type type = boost::filesystem::status(fPath, error).type();
        if (type != boost::filesystem::file_not_found && type != boost::filesystem::regular_file) {
            Open(fPath, OPEN_EXISTING);
            return;
        }
        fTemporary = fPath;
        fTemporary += boost::filesystem::unique_path(L".%%%%%%%%.tmp");
        Open(fTemporary, CREATE_NEW);
    }

    ~OutputFile() override
    {
        Close();
        if (!fTemporary.empty())
            ::DeleteFileW(fTemporary.c_str());
    }

    void Write(std::string_view text) override
    {
        while (!text.empty()) {
            DWORD count = 0;
            if (::WriteFile(fFile, text.data(),
                            static_cast<DWORD>(std::min(text.size(), kMaxWrite)), &count,
                            nullptr) == 0)
                Fail();
            text.remove_prefix(count);
        }
    }

    void Finish() override
    {
        if (fTemporary.empty())
            return;
        if (::FlushFileBuffers(fFile) == 0)
            Fail();
        Close();
        if (::MoveFileExW(fTemporary.c_str(), fPath.c_str(),
                          MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH) == 0)
            Fail();
        fTemporary.clear();
    }

private:
    void Open(const boost::filesystem::path& path, DWORD disposition)
    {
        fFile = ::CreateFileW(path.c_str(), GENERIC_WRITE, FILE_SHARE_READ, nullptr, disposition,
                              FILE_ATTRIBUTE_NORMAL, nullptr);
        if (fFile == INVALID_HANDLE_VALUE) {
            fTemporary.clear();
            Fail();
        }
    }

    void Close()
    {
        if (fFile != INVALID_HANDLE_VALUE)
            ::CloseHandle(fFile);
        fFile = INVALID_HANDLE_VALUE;
    }

    [[noreturn]] void Fail() const
    {
        const auto error = static_cast<int>(::GetLastError());
        throw std::runtime_error("cannot write " + fName + ": " +
                                 std::system_category().message(error));
    }

    const std::string fName;
    const boost::filesystem::path fPath;
    boost::filesystem::path fTemporary; // empty if there is none
    HANDLE fFile = INVALID_HANDLE_VALUE;
};

} // namespace

std::unique_ptr<Output> OpenFile(const std::string& path)
{
    return std::make_unique<OutputFile>(path);
}

} // namespace assay_host
