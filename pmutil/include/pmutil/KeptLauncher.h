// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Launches children through a keeper, for libraries: a process between the host and the child.
//
// The host needn't know of the child: its handlers and its waits for any child don't see the keeper
// or the child, and it may ignore SIGCHLD. If the host ends, even if it is killed, the keeper kills
// the child and all its descendants; if the keeper is killed, the child ends with it.
//
// The keeper is a clone that shares the memory of the host, so that its start takes the same time
// in a large host. It has the name "child-keeper", a process group of its own, and no descriptor of
// the host. The child is as that of LauncherPosix, in a process group of its own.
#pragma once

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"

namespace pmutil {

class KeeperProcess;

// For one launch.
class KeptLauncher : public Launcher {
public:
    KeptLauncher();

    // As Leave().
    ~KeptLauncher() override;

    // As LauncherPosix::Launch; the text of a failure begins with the failed call, such as "execve
    // failed: /bin/thing: No such file or directory".
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;
    WaitResult Wait(int* exitCode) override;
    void Kill() override;

    // Kills the child and all its descendants, even those in other sessions. Returns false if some
    // are left after this time. Any thread may call.
    bool EndAll(double seconds);

    // Kills all that is left, and waits for the end of the keeper, up to a second. If a process
    // can't be killed, the keeper tries for ten seconds, and a later launch reaps it. Any thread
    // may call.
    void Leave();

    // Returns the number of the signal that ended the child; 0 if none did, or before Wait has
    // returned.
    int GetTermSignal() const;

private:
    boost::shared_ptr<KeeperProcess> GetKeeper() const;

    mutable boost::mutex fMutex;
    boost::shared_ptr<KeeperProcess> fKeeper;
    bool fKilled = false;
    int fTermSignal = 0;
};

} // namespace pmutil
