#include "supervise/linux/Children.h"

#include <cstdlib>
#include <dirent.h>

#include <fstream>
#include <memory>
#include <sstream>
#include <string>

namespace assay_host {

namespace {

struct Status {
    char fState = 'X';
    ::pid_t fParent = 0; // 0 if there is no such process any more
};

Status ReadStatus(const std::string& process)
{
    Status result;
    std::ifstream file("/proc/" + process + "/stat");
    std::stringstream text;
    text << file.rdbuf();
    const std::string stat = text.str();
    // The name, in parentheses, may hold anything; after it come the state and the parent.
    const std::size_t name = stat.rfind(')');
    if (name == std::string::npos || name + 4 >= stat.size())
        return result;
    result.fState = stat[name + 2];
    result.fParent = static_cast<::pid_t>(std::strtol(stat.c_str() + name + 4, nullptr, 10));
    return result;
}

} // namespace

std::map<::pid_t, char> ListChildren(::pid_t parent)
{
    std::map<::pid_t, char> result;
    const std::unique_ptr<DIR, int (*)(DIR*)> folder(::opendir("/proc"), ::closedir);
    if (folder == nullptr)
        return result;
    // NOLINTNEXTLINE(concurrency-mt-unsafe): each stream is read by one thread
    while (const dirent* entry = ::readdir(folder.get())) {
        const std::string name = entry->d_name;
        if (name.find_first_not_of("0123456789") != std::string::npos)
            continue;
        const Status status = ReadStatus(name);
        if (status.fParent == parent)
            result.emplace(static_cast<::pid_t>(std::strtol(name.c_str(), nullptr, 10)),
                           status.fState);
    }
    return result;
}

} // namespace assay_host
