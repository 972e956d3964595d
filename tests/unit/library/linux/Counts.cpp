#include <dirent.h>
#include <unistd.h>

#include <fstream>
#include <string>

#include "Runs.h"
#include "support/OpenThings.h"

namespace {

// All processes whose parent this process is, whatever signal their end has.
long CountChildren()
{
    long count = 0;
    DIR* const folder = ::opendir("/proc");
    const std::string parent = std::to_string(::getpid());
    while (const dirent* entry = ::readdir(folder)) {
        if (entry->d_name[0] < '0' || entry->d_name[0] > '9')
            continue;
        std::ifstream file("/proc/" + std::string(entry->d_name) + "/stat");
        std::string text;
        std::getline(file, text, '\0'); // fails if the process has just ended
        const std::size_t name = text.rfind(')');
        if (name != std::string::npos &&
            text.compare(name + 4, parent.size() + 1, parent + " ") == 0)
            ++count;
    }
    ::closedir(folder);
    return count;
}

} // namespace

Counts CountThings()
{
    return {CountThreads(), CountOpenThings(), CountChildren()};
}

long GetMemoryKiB()
{
    std::ifstream file("/proc/self/status");
    for (std::string line; std::getline(file, line);)
        if (line.rfind("RssAnon:", 0) == 0)
            return std::atol(line.c_str() + 8);
    return 0;
}
