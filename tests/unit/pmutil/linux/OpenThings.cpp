#include "../OpenThings.h"

#include <dirent.h>
#include <sys/wait.h>

const long kKeptPerLaunch = 0;

long CountOpenThings()
{
    long count = 0;
    DIR* const directory = ::opendir("/proc/self/fd");
    while (::readdir(directory) != nullptr)
        ++count;
    ::closedir(directory);
    return count;
}

bool HasChildren()
{
    siginfo_t info = {};
    return ::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT) == 0;
}
