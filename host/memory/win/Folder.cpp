#include "memory/Folder.h"

#include <windows.h>

#include <system_error>

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>
#include <boost/nowide/convert.hpp>

#include "memory/win/Owner.h"

namespace assay_host {

namespace {

using Path = boost::filesystem::path;

constexpr char kLockName[] = "lock";
constexpr DWORD kShareAll = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;
// Seconds from 1601 to 1970, and the units of a FILETIME in a second.
constexpr std::int64_t kEpoch = 11644473600;
constexpr std::int64_t kUnits = 10000000;

std::string GetReason(DWORD error)
{
    return std::system_category().message(static_cast<int>(error));
}

bool IsMissing(DWORD error)
{
    return error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND;
}

class Handle {
public:
    explicit Handle(HANDLE handle) : fHandle(handle) {}
    ~Handle() { Close(); }
    Handle(const Handle&) = delete;
    Handle& operator=(const Handle&) = delete;

    bool IsOpen() const { return fHandle != INVALID_HANDLE_VALUE; }
    HANDLE Get() const { return fHandle; }

    void Close()
    {
        if (IsOpen())
            ::CloseHandle(fHandle);
        fHandle = INVALID_HANDLE_VALUE;
    }

private:
    HANDLE fHandle;
};

class HeldLock : public FolderLock {
public:
    explicit HeldLock(std::unique_ptr<Handle> file) : fFile(std::move(file)) {}

private:
    const std::unique_ptr<Handle> fFile;
};

// Returns why the open file must not be used; empty if it may.
std::string CheckFile(HANDLE file)
{
    BY_HANDLE_FILE_INFORMATION found = {};
    if (::GetFileInformationByHandle(file, &found) == 0)
        return GetReason(::GetLastError());
    if ((found.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0)
        return "it is a link";
    if ((found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0)
        return "it is not a file";
    return CheckOwner(file);
}

class SystemFolder : public Folder {
public:
    explicit SystemFolder(Path path) : fPath(std::move(path)) {}

    FileRead Read(const std::string& name, std::size_t maxBytes) override
    {
        const Handle file(::CreateFileW((fPath / name).c_str(), GENERIC_READ, kShareAll, nullptr,
                                        OPEN_EXISTING, FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
        if (!file.IsOpen()) {
            const DWORD error = ::GetLastError();
            if (IsMissing(error))
                return {};
            return {FileState::kRefused, {}, GetReason(error)};
        }
        if (std::string reason = CheckFile(file.Get()); !reason.empty())
            return {FileState::kRefused, {}, std::move(reason)};
        std::string text(maxBytes + 1, '\0');
        std::size_t size = 0;
        while (size < text.size()) {
            DWORD got = 0;
            if (::ReadFile(file.Get(), &text[size], static_cast<DWORD>(text.size() - size), &got,
                           nullptr) == 0)
                return {FileState::kRefused, {}, GetReason(::GetLastError())};
            if (got == 0)
                break;
            size += got;
        }
        if (size > maxBytes)
            return {FileState::kRefused, {}, "it is too large"};
        text.resize(size);
        return {FileState::kRead, std::move(text), {}};
    }

    std::string Write(const std::string& name, const std::string& text) override
    {
        const Path temporary =
            fPath / ("." + name + boost::filesystem::unique_path(".%%%%%%%%").string() + ".tmp");
        std::string reason = WriteNew(temporary, text);
        if (reason.empty() &&
            ::MoveFileExW(temporary.c_str(), (fPath / name).c_str(),
                          MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH) == 0)
            reason = GetReason(::GetLastError());
        if (!reason.empty())
            ::DeleteFileW(temporary.c_str());
        return reason;
    }

    std::string Remove(const std::string& name) override
    {
        if (::DeleteFileW((fPath / name).c_str()) != 0 || IsMissing(::GetLastError()))
            return {};
        return GetReason(::GetLastError());
    }

    std::vector<FolderEntry> List() override
    {
        std::vector<FolderEntry> entries;
        WIN32_FIND_DATAW found = {};
        const HANDLE search = ::FindFirstFileW((fPath / L"*").c_str(), &found);
        if (search == INVALID_HANDLE_VALUE)
            return entries;
        do {
            constexpr DWORD kOthers = FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT;
            if ((found.dwFileAttributes & kOthers) != 0)
                continue;
            const std::int64_t time =
                static_cast<std::int64_t>(
                    static_cast<std::uint64_t>(found.ftLastWriteTime.dwHighDateTime) << 32 |
                    found.ftLastWriteTime.dwLowDateTime) /
                    kUnits -
                kEpoch;
            entries.push_back({boost::nowide::narrow(found.cFileName), time});
        } while (::FindNextFileW(search, &found) != 0);
        ::FindClose(search);
        return entries;
    }

    LockTry TryLock() override
    {
        auto file = std::make_unique<Handle>(::CreateFileW(
            (fPath / kLockName).c_str(), GENERIC_READ | GENERIC_WRITE, kShareAll, nullptr,
            OPEN_ALWAYS, FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
        if (!file->IsOpen())
            return {LockState::kFailed, nullptr, GetReason(::GetLastError())};
        if (std::string reason = CheckFile(file->Get()); !reason.empty())
            return {LockState::kFailed, nullptr, "the lock can't be used: " + reason};
        OVERLAPPED place = {};
        if (::LockFileEx(file->Get(), LOCKFILE_EXCLUSIVE_LOCK | LOCKFILE_FAIL_IMMEDIATELY, 0, 1, 0,
                         &place) == 0) {
            const DWORD error = ::GetLastError();
            const bool isBusy = error == ERROR_LOCK_VIOLATION || error == ERROR_IO_PENDING;
            return {isBusy ? LockState::kBusy : LockState::kFailed, nullptr, GetReason(error)};
        }
        return {LockState::kHeld, std::make_unique<HeldLock>(std::move(file)), {}};
    }

private:
    static std::string WriteNew(const Path& path, const std::string& text)
    {
        const Handle file(::CreateFileW(path.c_str(), GENERIC_WRITE, FILE_SHARE_DELETE, nullptr,
                                        CREATE_NEW, FILE_ATTRIBUTE_NORMAL, nullptr));
        if (!file.IsOpen())
            return GetReason(::GetLastError());
        DWORD wrote = 0;
        if (::WriteFile(file.Get(), text.data(), static_cast<DWORD>(text.size()), &wrote,
                        nullptr) == 0 ||
            wrote != text.size() || ::FlushFileBuffers(file.Get()) == 0)
            return GetReason(::GetLastError());
        return {};
    }

    const Path fPath;
};

} // namespace

std::unique_ptr<Folder> OpenFolder(const std::string& path, FolderUse use)
{
    const Path folder = boost::nowide::widen(path);
    if (use == FolderUse::kWrite && ::CreateDirectoryW(folder.c_str(), nullptr) == 0 &&
        ::GetLastError() != ERROR_ALREADY_EXISTS)
        return MakeUnusableFolder(GetReason(::GetLastError()));
    const DWORD attributes = ::GetFileAttributesW(folder.c_str());
    if (attributes == INVALID_FILE_ATTRIBUTES)
        return MakeUnusableFolder(GetReason(::GetLastError()));
    if ((attributes & FILE_ATTRIBUTE_DIRECTORY) == 0)
        return MakeUnusableFolder(GetReason(ERROR_DIRECTORY));
    const Handle opened(::CreateFileW(folder.c_str(), READ_CONTROL, kShareAll, nullptr,
                                      OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr));
    if (!opened.IsOpen())
        return MakeUnusableFolder(GetReason(::GetLastError()));
    if (const std::string reason = CheckOwner(opened.Get()); !reason.empty())
        return MakeUnusableFolder(reason);
    return std::make_unique<SystemFolder>(folder);
}

} // namespace assay_host
