// A child of this process. Signals are sent to its process descriptor, so that they can't reach
// another process with the same process id.
#pragma once

#include <sys/types.h>
#include <sys/wait.h>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

// Only one thread may call Wait; any thread may call the other functions.
class ChildProcess {
public:
    ChildProcess();

    // Doesn't end a child that wasn't waited for; a later ReapOrphans reaps it.
    ~ChildProcess();
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    // Takes a child that was just started. Call once. If other code of this process has reaped the
    // child already, `pid` may be another process: then the child is lost, Wait throws and no
    // signal is sent. If the descriptor can't be opened, kills the child and throws CallFailure.
    void Adopt(::pid_t pid);

    // Throws std::runtime_error, "waitid failed: No child processes" for a lost child.
    WaitResult Wait(int* exitCode);
    void Kill();

    // Returns the number of the signal that ended the child; 0 if none did, or if its end is
    // unknown.
    int GetTermSignal() const;

private:
    void ReapLocked();

    mutable boost::mutex fMutex;
    boost::shared_ptr<PosixHandle> fPidfd; // closed when the child was reaped
    bool fHasWaiter = false;               // Wait was called; only Wait reaps from then on
    bool fKilled = false;
    int fError = 0; // errno if the child couldn't be reaped
    siginfo_t fEnd{};
};

// Reaps the children that have ended and whose ChildProcess was destroyed before a Wait.
void ReapOrphans();

} // namespace pmutil
