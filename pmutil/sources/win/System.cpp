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

// The exception by which a debugger learns a thread's name, and its record.
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

// Ignores the exception if no debugger handled it, so that it doesn't end the process.
LONG CALLBACK IgnoreThreadNameException(EXCEPTION_POINTERS* pointers)
{
    return pointers->ExceptionRecord->ExceptionCode == kThreadNameException
               ? EXCEPTION_CONTINUE_EXECUTION
               : EXCEPTION_CONTINUE_SEARCH;
}

// Boost's conversion to the code page of the narrow file calls. A path that the code page can't
// represent is an error; Boost would replace characters by question marks.
class PathFacet : public boost::filesystem::path::codecvt_type {
public:
    PathFacet() : codecvt_type(1) {} // 1: a locale doesn't delete it

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

// abort() would end the process with status 3, like a normal exit. Newer runtimes end an aborted
// process with this code.
[[noreturn]] void EndAsCrash(int /*signal*/)
{
    constexpr UINT kAborted = 0xC0000409; // STATUS_STACK_BUFFER_OVERRUN
    TerminateProcess(GetCurrentProcess(), kAborted);
    for (;;)
        Sleep(INFINITE); // until the termination takes effect
}

LPTOP_LEVEL_EXCEPTION_FILTER gPreviousFilter = nullptr;

// Ends the process with the exception's code, before the system starts a debugger or error
// reporting. The C runtime's filter is called first: for an uncaught C++ exception it continues, so
// that std::terminate is called.
LONG WINAPI EndAtException(EXCEPTION_POINTERS* pointers)
{
    const LONG action =
        gPreviousFilter != nullptr ? gPreviousFilter(pointers) : EXCEPTION_CONTINUE_SEARCH;
    return action == EXCEPTION_CONTINUE_EXECUTION ? action : EXCEPTION_EXECUTE_HANDLER;
}

// Disables the dialog of Windows Error Reporting for crashes that the error mode doesn't cover.
// Does nothing on systems that lack the calls.
void DisableErrorReportDialog()
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

std::uint64_t GetCurrentThreadNumber()
{
    return GetCurrentThreadId();
}

void ShowThreadName(const std::string& name)
{
    const ThreadNameRecord record{kThreadNameType, name.c_str(), static_cast<DWORD>(-1), 0};
    void* const handler = AddVectoredExceptionHandler(1, IgnoreThreadNameException);
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
        buffer.resize(length); // includes the terminating zero
    }
}

std::FILE* OpenSharedAppend(const std::string& path)
{
    return _fsopen(path.c_str(), "a", _SH_DENYNO);
}

void DiscardUnwritten(std::FILE* stream)
{
    // The runtime discards its buffer when a write fails; only the error state remains.
    std::clearerr(stream);
}

void PrepareConsoleProcess()
{
    const UINT previousMode = SetErrorMode(SEM_NOGPFAULTERRORBOX);
    SetErrorMode(previousMode | SEM_NOGPFAULTERRORBOX);
    // Disable the other dialogs on this thread, which calls the drivers: missing libraries and
    // drives without a disk.
    SetThreadErrorMode(SEM_FAILCRITICALERRORS | SEM_NOGPFAULTERRORBOX | SEM_NOOPENFILEERRORBOX,
                       nullptr);
    DisableErrorReportDialog();
    gPreviousFilter = SetUnhandledExceptionFilter(EndAtException);
    ULONG filterStack = 64 * 1024; // bytes reserved for the filter after a stack overflow
    SetThreadStackGuarantee(&filterStack);
    _set_error_mode(_OUT_TO_STDERR);
    std::signal(SIGABRT, EndAsCrash);
    SetDllDirectoryW(L""); // load no library from the current directory
}

const boost::filesystem::path::codecvt_type& GetPathCodecvt()
{
    static const PathFacet& facet = *new PathFacet; // never destroyed: it must outlive all users
    return facet;
}

} // namespace pmutil
