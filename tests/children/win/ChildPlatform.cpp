#include "ChildPlatform.h"

#include <windows.h>

#include <cstdio>
#include <fcntl.h>
#include <io.h>
#include <string>

void PrepareStreams()
{
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

void WriteState() {}
