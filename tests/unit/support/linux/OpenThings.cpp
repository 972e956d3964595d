#include "support/OpenThings.h"

#include <dirent.h>
#include <sys/wait.h>

const long kKeptPerLaunch = 0;

namespace {

long CountEntries(const char* folder)
{
    long count = 0;
    DIR* const directory = ::opendir(folder);
    while (::readdir(directory) != nullptr)
        ++count;
    ::closedir(directory);
    return count;
}

} // namespace

long GetMaxGrowth(long /*runs*/)
{
    return 0;
}

long CountOpenThings()
{
    return CountEntries("/proc/self/fd");
}

long CountThreads()
{
    return CountEntries("/proc/self/task");
}

bool HasChildren()
{
    siginfo_t info = {};
    return ::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT) == 0;
}
