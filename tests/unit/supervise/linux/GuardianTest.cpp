// A process that is guarded, and one that can't be.
#include "supervise/Guardian.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <sched.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include "supervise/linux/Guarded.h"
#include "support/linux/RefusedCalls.h"

namespace assay_host {
namespace {

struct Started {
    ::pid_t fGuardian = 0;
    ::pid_t fWorker = 0;
    ::pid_t fChild = 0;
};

// A guarded process that starts a child, kills its guardian, and ends the child.
[[noreturn]] void RunGuarded(int out)
{
    GuardProcess();
    Started started{::getppid(), ::getpid(), ::fork()};
    if (started.fChild == 0)
        for (;;)
            ::pause();
    if (::write(out, &started, sizeof started) != sizeof started || !IsGuarded())
        ::_exit(1);
    EndUnguarded(); // does nothing yet
    const char lives = ::kill(started.fChild, 0) == 0 ? 'y' : 'n';
    ::kill(started.fGuardian, SIGKILL);
    while (IsGuarded())
        ::sched_yield();
    EndUnguarded();
    const char left = ::kill(started.fChild, 0) == 0 ? 'y' : 'n';
    const char answers[] = {lives, left};
    ::_exit(::write(out, answers, sizeof answers) == sizeof answers ? 0 : 1);
}

TEST(Guardian, ItsWorkerEndsWhatItStartedWhenTheGuardianIsKilled)
{
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_CLOEXEC), 0);
    const ::pid_t host = ::fork();
    ASSERT_GE(host, 0);
    if (host == 0)
        RunGuarded(ends[1]);
    ::close(ends[1]);
    Started started;
    ASSERT_EQ(::read(ends[0], &started, sizeof started), ::ssize_t{sizeof started});
    EXPECT_EQ(started.fGuardian, host);
    char answers[2] = {'?', '?'};
    EXPECT_EQ(::read(ends[0], answers, sizeof answers), ::ssize_t{sizeof answers});
    ::close(ends[0]);
    EXPECT_EQ(answers[0], 'y') << "its child lives while there is a guardian";
    EXPECT_EQ(answers[1], 'n');
    if (answers[1] != 'n')
        ::kill(started.fChild, SIGKILL);
    int status = 0;
    EXPECT_EQ(::waitpid(host, &status, 0), host);
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    ::waitpid(started.fWorker, nullptr, 0); // only if this process adopts orphans
}

// From now on this process can't start another one.
bool ForbidProcesses()
{
    return RefuseCall(SYS_clone, -1, 0, EAGAIN) && RefuseCall(SYS_clone3, -1, 0, EAGAIN);
}

constexpr int kNoFilter = 77;

int GuardWithoutProcesses()
{
    sigset_t some;
    ::sigemptyset(&some);
    ::sigaddset(&some, SIGUSR1);
    ::pthread_sigmask(SIG_SETMASK, &some, nullptr);
    if (!ForbidProcesses())
        return kNoFilter;
    GuardProcess();
    sigset_t after;
    ::pthread_sigmask(SIG_SETMASK, nullptr, &after);
    if (::sigismember(&after, SIGUSR1) != 1 || ::sigismember(&after, SIGTERM) != 0)
        return 1;
    EndUnguarded();
    return IsGuarded() ? 0 : 2;
}

int GuardWithoutParent()
{
    if (!RefuseCall(SYS_getppid, -1, 0, EPERM))
        return kNoFilter;
    GuardProcess();
    return 0;
}

// The worker sees another parent, and ends as if it had been killed; so does its guardian then.
TEST(Guardian, AWorkerWhoseGuardianHasEndedDoesNotBegin)
{
    const ::pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0)
        ::_exit(GuardWithoutParent());
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    if (WEXITSTATUS(status) == kNoFilter)
        GTEST_SKIP() << "this system has no filters of system calls";
    EXPECT_EQ(WEXITSTATUS(status), 128 + SIGKILL);
}

TEST(Guardian, AProcessThatCannotForkRunsOnByItself)
{
    const ::pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0)
        ::_exit(GuardWithoutProcesses());
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    if (WEXITSTATUS(status) == kNoFilter)
        GTEST_SKIP() << "this system has no filters of system calls";
    EXPECT_EQ(WEXITSTATUS(status), 0);
}

} // namespace
} // namespace assay_host
