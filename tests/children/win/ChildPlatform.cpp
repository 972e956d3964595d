#include "ChildPlatform.h"

#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <fcntl.h>
#include <io.h>
#include <string>

#include "win/Misbehave.h"

// A function of the C runtime that no header declares: it parses the wide command line.
struct StartupInfo {
    int newMode;
};
extern "C" int __cdecl __wgetmainargs(int* argc, wchar_t*** argv, wchar_t*** environment,
                                      int expandWildcards, StartupInfo* info);

std::vector<std::string> GetArguments(int /*argc*/, char** /*argv*/)
{
    int argc = 0;
    wchar_t** argv = nullptr;
    wchar_t** environment = nullptr;
    StartupInfo info = {};
    __wgetmainargs(&argc, &argv, &environment, 0, &info);
    std::vector<std::string> arguments;
    for (int index = 0; index < argc; ++index) {
        std::string text(4 * std::wcslen(argv[index]) + 1, '\0');
        const int size = ::WideCharToMultiByte(CP_UTF8, 0, argv[index], -1, text.data(),
                                               static_cast<int>(text.size()), nullptr, nullptr);
        text.resize(static_cast<std::size_t>(size - 1));
        arguments.push_back(text);
    }
    return arguments;
}

namespace {

LONG WINAPI EndAtException(EXCEPTION_POINTERS* /*pointers*/)
{
    return EXCEPTION_EXECUTE_HANDLER; // otherwise Wine starts its debugger
}

} // namespace

void PrepareStreams()
{
    ::SetUnhandledExceptionFilter(EndAtException);
    ULONG stackBytes = 64 * 1024; // for the filter, after a stack overflow
    ::SetThreadStackGuarantee(&stackBytes);
    ::SetErrorMode(SEM_FAILCRITICALERRORS | SEM_NOGPFAULTERRORBOX);
    ::_setmode(0, _O_BINARY);
    ::_setmode(1, _O_BINARY);
    ::_setmode(2, _O_BINARY);
}

std::size_t ReadInput(char* bytes, std::size_t size)
{
    const int count = ::_read(0, bytes, static_cast<unsigned>(size));
    return count > 0 ? static_cast<std::size_t>(count) : 0;
}

void ExitNow(int code)
{
    std::fflush(stdout);
    ::ExitProcess(static_cast<UINT>(code));
}

void CrashNow()
{
    ::TerminateProcess(::GetCurrentProcess(), STATUS_ACCESS_VIOLATION);
    for (;;) {
    }
}

void DieOf(const std::string& how)
{
    Misbehave(how);
}

void CloseOutputs()
{
    ::_close(1);
    ::_close(2);
}

void SpawnGrandchild(const std::vector<std::string>& command)
{
    std::string line = "\"" + command[0] + "\"";
    for (std::size_t index = 1; index < command.size(); ++index)
        line += " " + command[index];
    STARTUPINFOA startup = {};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION process = {};
    ::CreateProcessA(nullptr, line.data(), nullptr, nullptr, TRUE, 0, nullptr, nullptr, &startup,
                     &process);
}

void WriteCommandLine()
{
    for (const wchar_t* at = ::GetCommandLineW(); *at != L'\0'; ++at)
        std::printf("%04x", static_cast<unsigned>(*at));
    std::fflush(stdout);
}

std::string GetOwnPath()
{
    char path[MAX_PATH] = {};
    ::GetModuleFileNameA(nullptr, path, MAX_PATH);
    return path;
}

int CountPipes()
{
    // An inherited handle has the same value as the parent's, which grows with each launch.
    constexpr ULONG_PTR kMaxHandle = 1 << 15;
    int count = 0;
    for (ULONG_PTR handle = 4; handle < kMaxHandle; handle += 4)
        count += ::GetFileType(reinterpret_cast<HANDLE>(handle)) == FILE_TYPE_PIPE;
    return count;
}

void EndFirstThread() {}

void WriteState() {}
