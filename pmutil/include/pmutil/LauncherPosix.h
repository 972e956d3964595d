// Starts, awaits and kills children by posix_spawn and process descriptors.
//
// The child gets default signal dispositions, an empty signal mask, and no descriptor but its three
// pipes. Its end by a signal counts as a crash, or as killed if Kill was called.
#pragma once

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"

namespace pmutil {

class ChildProcess;

class LauncherPosix : public Launcher {
public:
    // The process group of a child. A signal that a process sends to its own group (kill(0, ...))
    // reaches the host too where the child has the host's group, as by default.
    enum class Group { kOfHost, kOwn };

    explicit LauncherPosix(Group group = Group::kOfHost);
    ~LauncherPosix() override;

    // `program` is used in UTF-8, without a search; arguments are passed byte by byte. A failed
    // start throws with the call, the path and the system's text:
    // "posix_spawn failed: /bin/thing: No such file or directory". So it does where the host
    // ignores SIGCHLD, and the system would throw away how children end.
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;

    // Throws std::runtime_error "waitid failed: No child processes" where something else in the
    // host has reaped the child, such as a handler that waits for any child, however early. A Kill
    // signals nothing from then on: the child's number may be another process's.
    WaitResult Wait(int* exitCode) override;
    void Kill() override;

    // The number of the signal that ended the latest child; 0 if none did, or the child wasn't
    // waited for yet.
    int GetTermSignal() const;

private:
    LaunchResult Start(const std::string& path, const std::deque<std::string>& args);

    boost::shared_ptr<ChildProcess> GetChild() const;

    const Group fGroup;
    mutable boost::mutex fMutex;
    boost::shared_ptr<ChildProcess> fChild; // that of the latest launch
};

} // namespace pmutil
