// What an interrupt does, and the signals that are one. Each test changes its whole process, so
// that it runs in one of its own.
#include "supervise/Interrupt.h"

#include <gtest/gtest.h>

#include <csignal>
#include <initializer_list>
#include <sys/wait.h>
#include <unistd.h>

#include "supervise/InterruptNotes.h"
#include "supervise/ThreadSignals.h"
#include "supervise/linux/Signals.h"

namespace assay_host {
namespace {

// Runs the checks in a new process, which must return 0.
template <typename Checks>
void ExpectInChild(const Checks& checks)
{
    const ::pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0)
        ::_exit(checks());
    int status = -1;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status)) << status;
    EXPECT_EQ(WEXITSTATUS(status), 0);
}

TEST(NoteInterrupt, RaisesTheStopUntilThereIsAnEnd)
{
    ExpectInChild([] {
        NoteInterrupt(); // nobody wants it yet, and it counts
        const auto stop = std::make_shared<pmutil::StopRequest>();
        SetInterruptStop(stop);
        if (stop->IsRaised())
            return 1;
        NoteInterrupt();
        if (!stop->IsRaised())
            return 2;
        int calls = 0;
        if (SetInterruptEnd([&calls] { ++calls; }) != 2 || calls != 0)
            return 3;
        const auto other = std::make_shared<pmutil::StopRequest>();
        SetInterruptStop(other);
        NoteInterrupt();
        if (calls != 1 || other->IsRaised())
            return 4;
        return SetInterruptEnd(nullptr) == 3 ? 0 : 5;
    });
}

TEST(EndSignals, AreThoseThatEndAProcessByDefault)
{
    ExpectInChild([] {
        for (int number = 1; number <= SIGRTMAX; ++number)
            std::signal(number, SIG_DFL);
        const sigset_t signals = GetEndSignals();
        for (const int number :
             {SIGHUP, SIGINT, SIGQUIT, SIGTERM, SIGUSR1, SIGUSR2, SIGALRM, SIGVTALRM, SIGPROF,
              SIGPOLL, SIGPWR, SIGSTKFLT, SIGXCPU, SIGRTMIN, SIGRTMAX})
            if (::sigismember(&signals, number) != 1)
                return number;
        for (const int number :
             {SIGKILL, SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGTRAP, SIGABRT, SIGSYS, SIGPIPE, SIGXFSZ,
              SIGSTOP, SIGTSTP, SIGTTIN, SIGTTOU, SIGCONT, SIGCHLD, SIGURG, SIGWINCH})
            if (::sigismember(&signals, number) != 0)
                return number;
        return 0;
    });
}

TEST(EndSignals, AreNoneThatAreIgnored)
{
    ExpectInChild([] {
        for (const int number : {SIGHUP, SIGRTMAX})
            std::signal(number, SIG_IGN);
        const sigset_t signals = GetEndSignals();
        for (const int number : {SIGHUP, SIGRTMAX})
            if (::sigismember(&signals, number) != 0)
                return number;
        return ::sigismember(&signals, SIGTERM) == 1 ? 0 : SIGTERM;
    });
}

void (*GetHandler(int number))(int)
{
    struct sigaction action = {};
    ::sigaction(number, nullptr, &action);
    return action.sa_handler;
}

TEST(PrepareSignals, UndoesWhatWasInherited)
{
    ExpectInChild([] {
        std::signal(SIGCHLD, SIG_IGN);
        for (const int number : {SIGPIPE, SIGXFSZ, SIGTERM})
            std::signal(number, SIG_DFL);
        sigset_t all;
        ::sigfillset(&all);
        ::pthread_sigmask(SIG_SETMASK, &all, nullptr);
        PrepareSignals();
        if (GetHandler(SIGCHLD) != SIG_DFL || GetHandler(SIGTERM) != SIG_DFL)
            return 1;
        if (GetHandler(SIGPIPE) != SIG_IGN || GetHandler(SIGXFSZ) != SIG_IGN)
            return 2;
        ::pthread_sigmask(SIG_SETMASK, nullptr, &all);
        return ::sigisemptyset(&all) == 1 ? 0 : 3;
    });
}

TEST(SignalBlock, BlocksAllSignalsAndRestoresTheMask)
{
    ExpectInChild([] {
        sigset_t mask;
        ::sigemptyset(&mask);
        ::sigaddset(&mask, SIGUSR1);
        ::pthread_sigmask(SIG_SETMASK, &mask, nullptr);
        {
            const SignalBlock block;
            ::pthread_sigmask(SIG_SETMASK, nullptr, &mask);
            if (::sigismember(&mask, SIGTERM) != 1 || ::sigismember(&mask, SIGRTMAX) != 1)
                return 1;
        }
        ::pthread_sigmask(SIG_SETMASK, nullptr, &mask);
        if (::sigismember(&mask, SIGUSR1) != 1)
            return 2;
        ::sigdelset(&mask, SIGUSR1);
        return ::sigisemptyset(&mask) == 1 ? 0 : 3;
    });
}

} // namespace
} // namespace assay_host
