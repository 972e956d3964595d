#include "pmutil/WinHandle.h"

#include <windows.h>

#include "all/HandleChannelImpl.h"
#include "all/OpenFlags.h"

namespace pmutil {

namespace {

constexpr std::uint64_t kMaxBytesPerCall = 0xFFFFFFFF;
constexpr DWORD kMaxPathLength = 0x104; // with the terminating zero
constexpr DWORD kShareAll = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;

[[noreturn]] void ThrowCallFailed(const char* call)
{
    throw std::runtime_error(std::string(call) + " failed");
}

// Call RequireOpenFlags before.
DWORD GetDesiredAccess(int access)
{
    static constexpr DWORD kAccess[] = {GENERIC_READ, GENERIC_WRITE, GENERIC_READ | GENERIC_WRITE};
    return kAccess[access - kOpenRead];
}

DWORD GetDisposition(int creation)
{
    static constexpr DWORD kCreation[] = {OPEN_EXISTING, TRUNCATE_EXISTING, OPEN_ALWAYS,
                                          CREATE_ALWAYS};
    return kCreation[creation - kOpenExisting];
}

DWORD GetMoveMethod(SeekOrigin origin)
{
    switch (origin) {
    case SeekOrigin::kBegin:
        return FILE_BEGIN;
    case SeekOrigin::kCurrent:
        return FILE_CURRENT;
    case SeekOrigin::kEnd:
        break;
    }
    return FILE_END;
}

} // namespace

WinCalls::Handle WinCalls::GetInvalid()
{
    return INVALID_HANDLE_VALUE;
}

void WinCalls::Close(Handle handle)
{
    ::CloseHandle(handle);
}

void WinCalls::Delete(const Path& path)
{
    ::DeleteFileW(path.c_str());
}

WinCalls::Handle WinCalls::Open(const Path& path, int access, int creation)
{
    RequireOpenFlags(access, creation);
    const Handle handle = ::CreateFileW(path.c_str(), GetDesiredAccess(access), kShareAll, nullptr,
                                        GetDisposition(creation), FILE_ATTRIBUTE_NORMAL, nullptr);
    if (handle == GetInvalid())
        ThrowCallFailed("CreateFileW");
    return handle;
}

std::uint64_t WinCalls::Read(Handle handle, void* bytes, std::uint64_t nbytes)
{
    DWORD count = 0;
    if (::ReadFile(handle, bytes, static_cast<DWORD>(std::min(nbytes, kMaxBytesPerCall)), &count,
                   nullptr) == 0 &&
        ::GetLastError() != ERROR_BROKEN_PIPE)
        ThrowCallFailed("ReadFile");
    return count;
}

std::uint64_t WinCalls::Write(Handle handle, const void* bytes, std::uint64_t nbytes)
{
    DWORD count = 0;
    if (::WriteFile(handle, bytes, static_cast<DWORD>(std::min(nbytes, kMaxBytesPerCall)), &count,
                    nullptr) == 0)
        ThrowCallFailed("WriteFile");
    return count;
}

void WinCalls::Seek(Handle handle, std::int64_t offset, SeekOrigin origin)
{
    SeekAndTell(handle, offset, origin);
}

std::uint64_t WinCalls::SeekAndTell(Handle handle, std::int64_t offset, SeekOrigin origin)
{
    LARGE_INTEGER distance;
    distance.QuadPart = offset;
    LARGE_INTEGER position;
    position.QuadPart = 0;
    if (::SetFilePointerEx(handle, distance, &position, GetMoveMethod(origin)) == 0)
        ThrowCallFailed("SetFilePointerEx");
    return static_cast<std::uint64_t>(position.QuadPart);
}

void WinCalls::SetEndOfFile(Handle handle)
{
    if (::SetEndOfFile(handle) == 0)
        ThrowCallFailed("SetEndOfFile");
}

WinCalls::Path WinCalls::GetTemporaryDirectory()
{
    wchar_t buffer[kMaxPathLength] = {};
    const DWORD length = ::GetTempPathW(kMaxPathLength, buffer);
    if (length == 0 || length >= kMaxPathLength) // a larger value is the length needed
        ThrowCallFailed("GetTempPathW");
    return buffer;
}

WinCalls::Path WinCalls::MakeTemporaryFileName(const Path& prefix)
{
    wchar_t buffer[kMaxPathLength] = {};
    if (::GetTempFileNameW(GetTemporaryDirectory().c_str(), prefix.c_str(), 0, buffer) == 0)
        ThrowCallFailed("GetTempFileNameW");
    return buffer;
}

WinCalls::Handle WinCalls::GetStandard(int number)
{
    static constexpr DWORD kStandard[] = {STD_INPUT_HANDLE, STD_OUTPUT_HANDLE, STD_ERROR_HANDLE};
    return ::GetStdHandle(kStandard[number]);
}

template class HandleChannel<WinCalls>;

} // namespace pmutil
