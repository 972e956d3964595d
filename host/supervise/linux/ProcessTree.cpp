#include "supervise/ProcessTree.h"

#include <csignal>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <map>
#include <thread>

#include "supervise/linux/Children.h"

namespace assay_host {

namespace {

constexpr std::chrono::milliseconds kPause{2};

bool HasChildren()
{
    siginfo_t info = {};
    return ::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT) == 0;
}

bool HasEnded(char state)
{
    return state == 'Z' || state == 'X';
}

// The children of this process, with their states.
std::map<::pid_t, char> ListOwnChildren()
{
    return HasChildren() ? ListChildren(::getpid()) : std::map<::pid_t, char>();
}

} // namespace

class ProcessTree::Platform {
public:
    Platform() : fBefore(ListOwnChildren())
    {
        // Orphaned descendants become children of this process.
        ::prctl(PR_SET_CHILD_SUBREAPER, 1);
    }

    // Kills only children of this process: only it reaps them, so that no process id is reused. The
    // children of a killed process become children of this process in turn.
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
            for (const auto& [child, state] : children) {
                ::kill(child, SIGKILL);
                ::waitpid(child, nullptr, WNOHANG);
            }
            std::this_thread::sleep_for(kPause);
        }
    }

private:
    std::map<::pid_t, char> ListNewChildren() const
    {
        std::map<::pid_t, char> children = ListOwnChildren();
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
