#include <windows.h>

#include <psapi.h>
#include <tlhelp32.h>

#include "Runs.h"

namespace {

long CountThreads()
{
    const HANDLE list = ::CreateToolhelp32Snapshot(TH32CS_SNAPTHREAD, 0);
    THREADENTRY32 entry = {};
    entry.dwSize = sizeof entry;
    long count = 0;
    for (BOOL more = ::Thread32First(list, &entry); more != 0; more = ::Thread32Next(list, &entry))
        if (entry.th32OwnerProcessID == ::GetCurrentProcessId())
            ++count;
    ::CloseHandle(list);
    return count;
}

} // namespace

Counts CountThings()
{
    DWORD handles = 0;
    ::GetProcessHandleCount(::GetCurrentProcess(), &handles);
    return {CountThreads(), static_cast<long>(handles)};
}

long GetMemoryKiB()
{
    PROCESS_MEMORY_COUNTERS counters = {};
    ::GetProcessMemoryInfo(::GetCurrentProcess(), &counters, sizeof counters);
    return static_cast<long>(counters.PagefileUsage / 1024);
}
