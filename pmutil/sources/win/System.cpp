#include "pmutil/System.h"

#include <windows.h>

#include <knownfolders.h>
#include <shlobj.h>

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <share.h>
#include <stdexcept>
#include <utility>
#include <vector>

#include "all/PathCodecvt.h"

namespace pmutil {

namespace {

// The debugger's thread-naming exception and its record, as debuggers know them.
constexpr DWORD kThreadNameException = 0x406D1388;
constexpr DWORD kThreadNameType = 0x1000;

#pragma pack(push, 8)
struct ThreadNameRecord {
    DWORD type;
    LPCSTR name;
    DWORD threadID; // -1: the calling thread
    DWORD flags;
};
#pragma pack(pop)

// Swallows that exception where no debugger took it, so that it can't end the thread.
LONG CALLBACK SwallowThreadNameException(EXCEPTION_POINTERS* pointers)
{
    return pointers->ExceptionRecord->ExceptionCode == kThreadNameException
               ? EXCEPTION_CONTINUE_EXECUTION
               : EXCEPTION_CONTINUE_SEARCH;
}

// The code page of the narrow file calls, as Boost has it; but a path that it can't say fails, and
// isn't another path with question marks.
class PathFacet : public boost::filesystem::path::codecvt_type {
public:
    PathFacet() : codecvt_type(1) {} // the reference that keeps locales from deleting it

private:
    using codecvt_type = boost::filesystem::path::codecvt_type;

    result do_out(state_type& state, const wchar_t* from, const wchar_t* fromEnd,
                  const wchar_t*& fromNext, char* to, char* toEnd, char*& toNext) const override
    {
        const codecvt_type& base = boost::filesystem::path::codecvt();
        const result converted = base.out(state, from, fromEnd, fromNext, to, toEnd, toNext);
        if (converted != ok)
            return converted;
        std::wstring back(static_cast<std::size_t>(toNext - to), L'\0');
        const char* read = to;
        wchar_t* backEnd = back.data();
        if (base.in(state, to, toNext, read, back.data(), back.data() + back.size(), backEnd) != ok)
            return error;
        return std::equal(from, fromEnd, std::as_const(back).data(),
                          static_cast<const wchar_t*>(backEnd))
                   ? ok
                   : error;
    }

    result do_in(state_type& state, const char* from, const char* fromEnd, const char*& fromNext,
                 wchar_t* to, wchar_t* toEnd, wchar_t*& toNext) const override
    {
        return boost::filesystem::path::codecvt().in(state, from, fromEnd, fromNext, to, toEnd,
                                                     toNext);
    }

    bool do_always_noconv() const noexcept override { return false; }
};

// An abort would end the process with 3, as a chosen status. This is the code by which newer
// runtimes end an aborted process.
[[noreturn]] void EndAsCrash(int /*signal*/)
{
    constexpr UINT kAborted = 0xC0000409; // STATUS_STACK_BUFFER_OVERRUN
    TerminateProcess(GetCurrentProcess(), kAborted);
    for (;;)
        Sleep(INFINITE); // until it has taken effect
}

LPTOP_LEVEL_EXCEPTION_FILTER gFilterBefore = nullptr;

// Ends the process with the exception's code, before the system asks a debugger or error reporting.
// The C runtime's own filter comes first: it goes on after a C++ exception that nobody catches, so
// that std::terminate is called.
LONG WINAPI EndAtException(EXCEPTION_POINTERS* pointers)
{
    const LONG answer =
        gFilterBefore != nullptr ? gFilterBefore(pointers) : EXCEPTION_CONTINUE_SEARCH;
    return answer == EXCEPTION_CONTINUE_EXECUTION ? answer : EXCEPTION_EXECUTE_HANDLER;
}

// Keeps error reporting from showing crashes that the error mode doesn't cover, on systems that
// have the calls for it.
void HideErrorReports()
{
    constexpr DWORD kNoUI = 0x20; // WER_FAULT_REPORTING_NO_UI
    using GetFlags = HRESULT(WINAPI*)(HANDLE process, DWORD * flags);
    using SetFlags = HRESULT(WINAPI*)(DWORD flags);
    const HMODULE kernel = GetModuleHandleW(L"kernel32.dll");
    const auto get =
        reinterpret_cast<GetFlags>(reinterpret_cast<void*>(GetProcAddress(kernel, "WerGetFlags")));
    const auto set =
        reinterpret_cast<SetFlags>(reinterpret_cast<void*>(GetProcAddress(kernel, "WerSetFlags")));
    DWORD flags = 0;
    if (get != nullptr && set != nullptr && SUCCEEDED(get(GetCurrentProcess(), &flags)))
        set(flags | kNoUI);
}

} // namespace

double GetClockSeconds()
{
    constexpr double kSecondsPerTick = 1e-7;
    constexpr std::int64_t kTicksFrom1601To1970 = 116444736000000000;
    FILETIME now{};
    GetSystemTimeAsFileTime(&now);
    ULARGE_INTEGER ticks{};
    ticks.LowPart = now.dwLowDateTime;
    ticks.HighPart = now.dwHighDateTime;
    return static_cast<double>(static_cast<std::int64_t>(ticks.QuadPart) - kTicksFrom1601To1970) *
           kSecondsPerTick;
}

std::uint64_t GetCurrentThreadNumber()
{
    return GetCurrentThreadId();
}

void ShowThreadName(const std::string& name)
{
    const ThreadNameRecord record{kThreadNameType, name.c_str(), static_cast<DWORD>(-1), 0};
    void* const handler = AddVectoredExceptionHandler(1, SwallowThreadNameException);
    if (handler == nullptr)
        return;
    RaiseException(kThreadNameException, 0, sizeof record / sizeof(ULONG_PTR),
                   reinterpret_cast<const ULONG_PTR*>(&record));
    RemoveVectoredExceptionHandler(handler);
}

std::uint64_t GetPhysicalMemoryBytes()
{
    MEMORYSTATUSEX status{};
    static_assert(sizeof status == 64, "the length that the call expects");
    status.dwLength = sizeof status;
    if (GlobalMemoryStatusEx(&status) == 0)
        throw std::runtime_error("GlobalMemoryStatusEx failed");
    return status.ullTotalPhys;
}

std::wstring GetDesktopFolder()
{
    PWSTR folder = nullptr;
    std::wstring result;
    if (SUCCEEDED(SHGetKnownFolderPath(FOLDERID_Desktop, 0, nullptr, &folder)) && folder != nullptr)
        result = folder;
    CoTaskMemFree(folder);
    return result;
}

std::wstring GetCurrentDirectoryPath()
{
    std::vector<wchar_t> buffer(MAX_PATH);
    for (;;) {
        const DWORD length = GetCurrentDirectoryW(static_cast<DWORD>(buffer.size()), buffer.data());
        if (length == 0)
            throw std::runtime_error("GetCurrentDirectoryW failed");
        if (length < buffer.size())
            return std::wstring(buffer.data(), length);
        buffer.resize(length); // what it asks for includes the terminating zero
    }
}

std::FILE* OpenSharedAppend(const std::string& path)
{
    return _fsopen(path.c_str(), "a", _SH_DENYNO);
}

void DiscardUnwritten(std::FILE* stream)
{
    // The runtime empties its buffer when a write fails; only the error state stays.
    std::clearerr(stream);
}

void PrepareConsoleProcess()
{
    const UINT before = SetErrorMode(SEM_NOGPFAULTERRORBOX);
    SetErrorMode(before | SEM_NOGPFAULTERRORBOX);
    // What else would ask the user, on this thread, which is the one that calls drivers: a library
    // that lacks another one, a drive without a disk.
    SetThreadErrorMode(SEM_FAILCRITICALERRORS | SEM_NOGPFAULTERRORBOX | SEM_NOOPENFILEERRORBOX,
                       nullptr);
    HideErrorReports();
    gFilterBefore = SetUnhandledExceptionFilter(EndAtException);
    ULONG stackForIt = 64 * 1024; // which a stack overflow on this thread leaves to the filter
    SetThreadStackGuarantee(&stackForIt);
    _set_error_mode(_OUT_TO_STDERR);
    std::signal(SIGABRT, EndAsCrash);
    SetDllDirectoryW(L""); // no library comes from the current directory
}

const boost::filesystem::path::codecvt_type& GetPathCodecvt()
{
    static const PathFacet& facet = *new PathFacet; // outlives all users
    return facet;
}

} // namespace pmutil
