#include "support/OpenThings.h"

#include <windows.h>

#include <tlhelp32.h>

#include <cstdint>

const long kKeptPerLaunch = 2; // of the process and of its thread

// Asks for each value that a handle may have. Wine's GetProcessHandleCount isn't implemented, and
// its server can crash when it lists the handles of a process that ends. Handles are multiples of
// 4, and the lowest free value is used first.
long CountOpenThings()
{
    constexpr std::uintptr_t kStep = 4;
    constexpr std::uintptr_t kEnd = 0x10000;
    long count = 0;
    for (std::uintptr_t value = kStep; value < kEnd; value += kStep) {
        DWORD flags = 0;
        count += ::GetHandleInformation(reinterpret_cast<HANDLE>(value), &flags) != 0;
    }
    return count;
}

long GetMaxGrowth(long runs)
{
    return runs > 0 ? runs - 1 : 0;
}

long CountThreads()
{
    const HANDLE threads = ::CreateToolhelp32Snapshot(TH32CS_SNAPTHREAD, 0);
    THREADENTRY32 entry = {};
    entry.dwSize = sizeof entry;
    long count = 0;
    for (BOOL more = ::Thread32First(threads, &entry); more != 0;
         more = ::Thread32Next(threads, &entry))
        count += entry.th32OwnerProcessID == ::GetCurrentProcessId();
    ::CloseHandle(threads);
    return count;
}

bool HasChildren()
{
    const HANDLE processes = ::CreateToolhelp32Snapshot(TH32CS_SNAPPROCESS, 0);
    PROCESSENTRY32W entry = {};
    entry.dwSize = sizeof entry;
    bool found = false;
    for (BOOL more = ::Process32FirstW(processes, &entry); more != 0 && !found;
         more = ::Process32NextW(processes, &entry))
        found = entry.th32ParentProcessID == ::GetCurrentProcessId();
    ::CloseHandle(processes);
    return found;
}
