// A child of this process, addressed by its process descriptor, so that no signal can reach another
// process that has got its number since.
#pragma once

#include <sys/types.h>
#include <sys/wait.h>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

// Wait is for one thread; any may call the rest.
class ChildProcess {
public:
    ChildProcess();

    // A child that wasn't waited for is left to itself, and reaped by a later ReapOrphans.
    ~ChildProcess();
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    // Called once, with a process just started. Where something else in this process has reaped the
    // child already, the number may be another process's by now: the child is lost then, which Wait
    // reports, and nothing is signalled. Throws CallFailure if the child can't be followed, and
    // ends it before.
    void Adopt(::pid_t pid);

    // Throws std::runtime_error, "waitid failed: No child processes" for a lost child.
    WaitResult Wait(int* exitCode);
    void Kill();

    // The number of the signal that ended it; 0 if none did, or its end isn't known.
    int GetTermSignal() const;

private:
    void ReapLocked();

    mutable boost::mutex fMutex;
    boost::shared_ptr<PosixHandle> fPidfd; // closed once the end is known
    bool fHasWaiter = false;               // from then on only the waiter reaps
    bool fKilled = false;
    int fError = 0; // why the end will never be known
    siginfo_t fEnd{};
};

// Reaps the children that nobody waited for and that have ended since.
void ReapOrphans();

} // namespace pmutil
