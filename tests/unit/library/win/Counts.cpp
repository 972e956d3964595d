#include <windows.h>

#include <psapi.h>

#include "Runs.h"
#include "support/OpenThings.h"

Counts CountThings()
{
    return {CountThreads(), CountOpenThings()};
}

long GetMemoryKiB()
{
    PROCESS_MEMORY_COUNTERS counters = {};
    ::GetProcessMemoryInfo(::GetCurrentProcess(), &counters, sizeof counters);
    return static_cast<long>(counters.PagefileUsage / 1024);
}
