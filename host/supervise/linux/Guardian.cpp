#include "supervise/Guardian.h"

#include <cerrno>
#include <csignal>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include "supervise/Interrupt.h"
#include "supervise/ProcessTree.h"
#include "supervise/linux/Children.h"
#include "supervise/linux/Guarded.h"

namespace assay_host {

namespace {

// The time to kill descendants after the worker exited: it has tried to kill them itself.
constexpr double kRestSeconds = 0.2;

// The same after a sudden end. Killing usually takes some milliseconds, but longer on a busy
// machine, and no other process tries again.
constexpr double kLastSeconds = 10;

// A shell reports a signal that ended a process as this plus the signal's number.
constexpr int kSignalStatus = 128;

// Differs from the program's name, so that killall doesn't kill the worker along with the guardian.
constexpr char kWorkerName[] = "assay-worker";

// The signal that the kernel sends to the worker when the guardian has ended. Rarely used
// otherwise.
int GetDeathSignal()
{
    return SIGRTMAX;
}

::pid_t gGuardian = 0;

// All processes that the worker starts, in any run. Never deleted.
ProcessTree* gStarted = nullptr;

// Waits for its worker, and ends with its status or signal.
class Guardian {
public:
    Guardian(::pid_t worker, ProcessTree& tree) : fWorker(worker), fTree(tree) {}

    [[noreturn]] void Watch(const sigset_t& awaited)
    {
        siginfo_t end = {};
        while (end.si_pid == 0) {
            const int number = ::sigwaitinfo(&awaited, nullptr);
            if (number == SIGCHLD)
                end = TakeChange();
            else if (number == SIGTSTP)
                ::kill(fWorker, SIGSTOP); // Suspend follows once it has stopped
            else
                // Not waited for yet, so no other process has the number. The call refuses -1,
                // which an interrupted wait returned.
                ::kill(fWorker, number);
        }
        fTree.EndAll(end.si_code == CLD_EXITED ? kRestSeconds : kLastSeconds);
        if (end.si_code != CLD_EXITED)
            EndBy(end.si_status);
        EndProcess(end.si_status);
    }

private:
    // Returns the worker's end; zeros if it hasn't ended.
    siginfo_t TakeChange() const
    {
        siginfo_t change = {};
        ::waitid(P_PID, static_cast<id_t>(fWorker), &change, WEXITED | WSTOPPED | WNOHANG);
        if (change.si_code != CLD_STOPPED)
            return change;
        Suspend();
        return {};
    }

    // Ctrl-Z stops only this process: the worker and the child have process groups of their own.
    // The worker must have stopped, so that it starts no child and reaps none: no process id is
    // reused meanwhile.
    void Suspend() const
    {
        SignalChildren(SIGSTOP);
        ::kill(::getpid(), SIGSTOP);
        SignalChildren(SIGCONT);
        ::kill(fWorker, SIGCONT);
    }

    // Signals the worker's children and the process groups that they lead.
    void SignalChildren(int number) const
    {
        for (const auto& [child, state] : ListChildren(fWorker)) {
            ::kill(child, number);
            ::kill(-child, number);
        }
    }

    [[noreturn]] static void EndBy(int number)
    {
        std::signal(number, SIG_DFL);
        sigset_t only;
        ::sigemptyset(&only);
        ::sigaddset(&only, number);
        ::pthread_sigmask(SIG_UNBLOCK, &only, nullptr);
        ::kill(::getpid(), number);
        EndProcess(kSignalStatus + number);
    }

    const ::pid_t fWorker;
    ProcessTree& fTree;
};

// Returns all signals except those that are ignored, which would be delivered if they were blocked,
// and those that keep their default action.
sigset_t GetGuardianSignals()
{
    sigset_t result;
    ::sigfillset(&result);
    for (int number = 1; number <= SIGRTMAX; ++number) {
        struct sigaction action = {};
        ::sigaction(number, nullptr, &action);
        if (action.sa_handler == SIG_IGN)
            ::sigdelset(&result, number);
    }
    for (const int number : {SIGCONT, SIGURG, SIGWINCH})
        ::sigdelset(&result, number);
    return result;
}

void BecomeWorker()
{
    ::setpgid(0, 0);
    ::prctl(PR_SET_NAME, kWorkerName);
    std::signal(GetDeathSignal(), SIG_DFL); // the parent may have ignored it
    ::prctl(PR_SET_PDEATHSIG, GetDeathSignal());
    if (!IsGuarded())
        EndProcess(kSignalStatus +
                   SIGKILL); // the guardian has ended already; nothing is started yet
    gStarted = new ProcessTree;
}

} // namespace

bool IsGuarded()
{
    return gGuardian == 0 || ::getppid() == gGuardian;
}

void EndUnguarded()
{
    if (gStarted != nullptr && !IsGuarded())
        gStarted->EndAll(kLastSeconds);
}

void GuardProcess()
{
    const sigset_t awaited = GetGuardianSignals();
    sigset_t before;
    ::pthread_sigmask(SIG_SETMASK, &awaited, &before);
    ProcessTree tree;
    gGuardian = ::getpid();
    const ::pid_t worker = ::fork();
    if (worker == 0) {
        BecomeWorker();
        return;
    }
    if (worker > 0) {
        ::setpgid(worker, worker); // here too, in case the worker has not run yet
        Guardian(worker, tree).Watch(awaited);
    }
    // fork failed. Other processes can't be started either, so there is nothing to guard.
    gGuardian = 0;
    ::pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

} // namespace assay_host
