#include "support/OpenThings.h"

#include <windows.h>

#include <tlhelp32.h>

#include <cstddef>
#include <vector>

const long kKeptPerLaunch = 2; // of the process and of its thread

namespace {

// Queries the system's list of all handles: Wine's GetProcessHandleCount isn't implemented.
constexpr ULONG kExtendedHandleInformation = 64;
constexpr LONG kTooSmall = static_cast<LONG>(0xC0000004);

struct HandleEntry {
    void* object;
    ULONG_PTR process;
    ULONG_PTR handle;
    ULONG access;
    USHORT creator;
    USHORT type;
    ULONG attributes;
    ULONG reserved;
};

struct HandleTable {
    ULONG_PTR count;
    ULONG_PTR reserved;
    HandleEntry entries[1];
};

using QueryFunction = LONG(NTAPI*)(ULONG, void*, ULONG, ULONG*);

} // namespace

long CountOpenThings()
{
    const auto query = reinterpret_cast<QueryFunction>(reinterpret_cast<void*>(
        ::GetProcAddress(::GetModuleHandleW(L"ntdll.dll"), "NtQuerySystemInformation")));
    std::vector<std::max_align_t> buffer(1 << 12);
    while (query(kExtendedHandleInformation, buffer.data(),
                 static_cast<ULONG>(buffer.size() * sizeof(std::max_align_t)),
                 nullptr) == kTooSmall)
        buffer.resize(2 * buffer.size());
    const auto* const table = reinterpret_cast<const HandleTable*>(buffer.data());
    long count = 0;
    for (ULONG_PTR index = 0; index < table->count; ++index)
        count += table->entries[index].process == ::GetCurrentProcessId();
    return count;
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
