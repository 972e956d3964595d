#include "linux/ChildProcess.h"

#include <cerrno>
#include <csignal>
#include <poll.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <utility>
#include <vector>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "linux/CallFailure.h"

namespace pmutil {

namespace {

// The maximum time that Kill waits for the end of a child without a waiter, to reap it.
constexpr int kMaxReapMilliseconds = 1000;

// System calls, because older C libraries lack the functions, and some declare them not for C++.
int OpenPidfd(::pid_t pid)
{
    return static_cast<int>(::syscall(SYS_pidfd_open, pid, 0));
}

int SendSignal(int pidfd, int number)
{
    return static_cast<int>(::syscall(SYS_pidfd_send_signal, pidfd, number, nullptr, 0));
}

// Waits up to `milliseconds`, or without a limit for -1, for the end of the process. Returns
// whether it has ended.
bool PollEnd(int pidfd, int milliseconds)
{
    pollfd poll{pidfd, POLLIN, 0};
    int result = 0;
    do
        result = ::poll(&poll, 1, milliseconds);
    while (result < 0 && errno == EINTR);
    if (result < 0)
        ThrowFailed({"poll", errno});
    return result > 0;
}

// Returns whether this is a child of this process that wasn't reaped.
bool IsOwnChild(::pid_t pid)
{
    siginfo_t info = {};
    return ::waitid(P_PID, static_cast<id_t>(pid), &info, WEXITED | WNOHANG | WNOWAIT) == 0;
}

// Children that no thread waits for. They are reaped from time to time, so that they don't stay
// zombies.
class Orphans {
public:
    static Orphans& Get()
    {
        static Orphans& orphans = *new Orphans; // never destroyed: threads may use it until the end
        return orphans;
    }

    void Add(boost::shared_ptr<PosixHandle> pidfd)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fPidfds.push_back(std::move(pidfd));
    }

    void Reap()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        const auto hasEnded = [](const boost::shared_ptr<PosixHandle>& pidfd) {
            siginfo_t info = {};
            return ::waitid(P_PIDFD, static_cast<id_t>(pidfd->GetHandle()), &info,
                            WEXITED | WNOHANG) != 0 ||
                   info.si_pid != 0;
        };
        fPidfds.erase(std::remove_if(fPidfds.begin(), fPidfds.end(), hasEnded), fPidfds.end());
    }

private:
    boost::mutex fMutex;
    std::vector<boost::shared_ptr<PosixHandle>> fPidfds;
};

} // namespace

ChildProcess::ChildProcess()
    : fPidfd(boost::make_shared<PosixHandle>(PosixCalls::GetInvalid(), false))
{}

ChildProcess::~ChildProcess()
{
    if (!fPidfd->IsOpen())
        return;
    try {
        Orphans::Get().Add(fPidfd);
        Orphans::Get().Reap();
    } catch (...) {
        // Out of memory: the child stays a zombie until this process ends.
    }
}

void ChildProcess::Adopt(::pid_t pid)
{
    const int pidfd = OpenPidfd(pid);
    const int error = errno;
    if (pidfd >= 0)
        fPidfd->Reset(pidfd, true);
    if (!IsOwnChild(pid)) {
        fPidfd->Close();
        fError = ECHILD;
    } else if (pidfd < 0) {
        ::kill(pid, SIGKILL);
        ::waitpid(pid, nullptr, 0);
        throw CallFailure{"pidfd_open", error};
    }
}

WaitResult ChildProcess::Wait(int* exitCode)
{
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fHasWaiter = true;
    }
    if (fPidfd->IsOpen())
        PollEnd(fPidfd->GetHandle(), -1);
    const boost::lock_guard<boost::mutex> lock(fMutex);
    ReapLocked();
    if (fError != 0)
        ThrowFailed({"waitid", fError});
    if (fEnd.si_code == CLD_EXITED) {
        *exitCode = fEnd.si_status;
        return kEndedNormally;
    }
    return fKilled ? kEndedByKill : kEndedByCrash;
}

void ChildProcess::Kill()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fKilled = true;
    if (!fPidfd->IsOpen())
        return;
    if (SendSignal(fPidfd->GetHandle(), SIGKILL) != 0 && errno != ESRCH)
        ThrowFailed({"pidfd_send_signal", errno});
    if (!fHasWaiter && PollEnd(fPidfd->GetHandle(), kMaxReapMilliseconds))
        ReapLocked();
}

int ChildProcess::GetTermSignal() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fEnd.si_code == CLD_KILLED || fEnd.si_code == CLD_DUMPED ? fEnd.si_status : 0;
}

// Reaps the child, which has ended, and closes the descriptor.
void ChildProcess::ReapLocked()
{
    if (!fPidfd->IsOpen())
        return;
    if (::waitid(P_PIDFD, static_cast<id_t>(fPidfd->GetHandle()), &fEnd, WEXITED) != 0)
        fError = errno;
    fPidfd->Close();
}

void ReapOrphans()
{
    Orphans::Get().Reap();
}

} // namespace pmutil
