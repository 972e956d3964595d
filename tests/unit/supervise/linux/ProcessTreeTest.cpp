#include "supervise/ProcessTree.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/Waits.h"

namespace assay_host {
namespace {

::pid_t StartSleeper()
{
    const ::pid_t pid = ::fork();
    if (pid == 0)
        for (;;)
            ::pause();
    return pid;
}

// Runs the checks in a new process, whose descendants are its own, and which must return 0.
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

bool IsGone(::pid_t process)
{
    return ::kill(process, 0) != 0 && errno == ESRCH;
}

TEST(ProcessTree, EndsWhatWasStartedLaterAndNothingElse)
{
    ExpectInChild([] {
        const ::pid_t before = StartSleeper();
        ProcessTree tree;
        const ::pid_t first = StartSleeper();
        const ::pid_t second = StartSleeper();
        if (!tree.EndAll(pmutil::kLong))
            return 1;
        if (!IsGone(first) || !IsGone(second))
            return 2;
        // It could have been killed, but it isn't reaped.
        int status = 0;
        if (::waitpid(before, &status, WNOHANG) != 0)
            return 3;
        ::kill(before, SIGTERM);
        ::waitpid(before, &status, 0);
        return WTERMSIG(status) == SIGTERM ? 0 : 4;
    });
}

TEST(ProcessTree, EndsOrphansWhoseParentItEnds)
{
    ExpectInChild([] {
        int ends[2];
        if (::pipe2(ends, O_CLOEXEC) != 0)
            return 1;
        ProcessTree tree;
        if (::fork() == 0) {
            const ::pid_t orphan = StartSleeper();
            ::_exit(::write(ends[1], &orphan, sizeof orphan) == sizeof orphan ? 0 : 1);
        }
        ::pid_t orphan = 0;
        if (::read(ends[0], &orphan, sizeof orphan) != sizeof orphan)
            return 2;
        if (!tree.EndAll(pmutil::kLong))
            return 3;
        if (IsGone(orphan))
            return 0;
        ::kill(orphan, SIGKILL);
        return 4;
    });
}

TEST(ProcessTree, HasNothingToEndWithoutAChild)
{
    ExpectInChild([] { return ProcessTree().EndAll(0) ? 0 : 1; });
}

// Without time the children are counted as they are.
TEST(ProcessTree, TellsWithoutTimeWhetherAChildIsLeft)
{
    ExpectInChild([] {
        ProcessTree tree;
        const ::pid_t child = StartSleeper();
        if (tree.EndAll(0))
            return 1;
        ::kill(child, SIGKILL);
        siginfo_t end = {};
        ::waitid(P_PID, static_cast<::id_t>(child), &end, WEXITED | WNOWAIT);
        return tree.EndAll(0) ? 0 : 2; // it has ended, and isn't reaped
    });
}

} // namespace
} // namespace assay_host
