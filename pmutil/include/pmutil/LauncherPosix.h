// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Launches, waits for and kills children with posix_spawn and process descriptors.
//
// The child has default signal dispositions, an empty signal mask, and no descriptors but its three
// pipes. If a signal ends it, it crashed, or was killed if Kill was called.
#pragma once

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"

namespace pmutil {

class ChildProcess;

class LauncherPosix : public Launcher {
public:
    // The process group of a child. In the host's group, which is the default, a signal that the
    // child sends to its group (kill(0, ...)) also reaches the host.
    enum class Group { kOfHost, kOwn };

    explicit LauncherPosix(Group group = Group::kOfHost);
    ~LauncherPosix() override;

    // Converts `program` to UTF-8 and doesn't search the PATH; passes the arguments unchanged. If
    // the start fails, throws std::runtime_error with the call, the path and the system's text,
    // such as "posix_spawn failed: /bin/thing: No such file or directory". Fails also if the host
    // ignores SIGCHLD, since the system then discards the exit statuses of children.
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;

    // Throws std::runtime_error "waitid failed: No child processes" if other code of the host has
    // reaped the child, such as a handler that waits for any child. After that Kill sends no
    // signal, because the process id may belong to another process.
    WaitResult Wait(int* exitCode) override;
    void Kill() override;

    // Returns the number of the signal that ended the latest child; 0 if none did, or before Wait
    // has returned.
    int GetTermSignal() const;

private:
    LaunchResult Start(const std::string& path, const std::deque<std::string>& args);

    boost::shared_ptr<ChildProcess> GetChild() const;

    const Group fGroup;
    mutable boost::mutex fMutex;
    boost::shared_ptr<ChildProcess> fChild; // of the latest launch
};

} // namespace pmutil
