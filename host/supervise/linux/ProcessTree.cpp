#include "supervise/ProcessTree.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <dirent.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <thread>

namespace assay_host {

namespace {

constexpr std::chrono::milliseconds kPause{2};

bool HasChildren()
{
    siginfo_t info = {};
    return ::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT) == 0 || errno != ECHILD;
}

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

bool HasEnded(char state)
{
    return state == 'Z' || state == 'X';
}

// The children of this process, with their states.
std::map<::pid_t, char> ListChildren()
{
    std::map<::pid_t, char> result;
    if (!HasChildren())
        return result;
    DIR* const folder = ::opendir("/proc");
    if (folder == nullptr)
        return result;
    const ::pid_t self = ::getpid();
    // NOLINTNEXTLINE(concurrency-mt-unsafe): each stream is read by one thread
    while (const dirent* entry = ::readdir(folder)) {
        const std::string name = entry->d_name;
        if (name.find_first_not_of("0123456789") != std::string::npos)
            continue;
        const Status status = ReadStatus(name);
        if (status.fParent == self)
            result.emplace(static_cast<::pid_t>(std::strtol(name.c_str(), nullptr, 10)),
                           status.fState);
    }
    ::closedir(folder);
    return result;
}

} // namespace

class ProcessTree::Platform {
public:
    Platform() : fBefore(ListChildren())
    {
        // Orphans become this process's children, instead of the first process's.
        ::prctl(PR_SET_CHILD_SUBREAPER, 1, 0, 0, 0);
    }

    // Only children are killed, and none but this process sees them off, so that a number always
    // means the same process. When one goes, its own children take its place.
    bool EndAll(double seconds)
    {
        const auto deadline =
            std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
        for (;;) {
            const std::map<::pid_t, char> children = ListNewChildren();
            if (children.empty())
                return true;
            if (std::chrono::steady_clock::now() >= deadline)
                return std::all_of(children.begin(), children.end(),
                                   [](const auto& child) { return HasEnded(child.second); });
            bool left = false;
            for (const auto& [child, state] : children) {
                ::kill(child, SIGKILL);
                left = ::waitpid(child, nullptr, WNOHANG) == 0 || left;
            }
            if (left)
                std::this_thread::sleep_for(kPause);
        }
    }

private:
    std::map<::pid_t, char> ListNewChildren() const
    {
        std::map<::pid_t, char> children = ListChildren();
        for (const auto& [child, state] : fBefore)
            children.erase(child);
        return children;
    }

    const std::map<::pid_t, char> fBefore;
};

ProcessTree::ProcessTree() : fPlatform(std::make_unique<Platform>()) {}
ProcessTree::~ProcessTree() = default;

bool ProcessTree::EndAll(double seconds)
{
    return fPlatform->EndAll(seconds);
}

} // namespace assay_host
