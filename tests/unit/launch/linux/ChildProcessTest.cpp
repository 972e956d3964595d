#include "linux/ChildProcess.h"

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include "Throws.h"
#include "linux/CallFailure.h"
#include "pmutil/PosixHandle.h"
#include "support/OpenThings.h"

using namespace pmutil;

namespace {

::pid_t StartSleeper()
{
    const ::pid_t pid = ::fork();
    if (pid == 0)
        for (;;)
            ::pause();
    return pid;
}

// While it exists, no descriptor can be opened.
class NoDescriptors {
public:
    NoDescriptors()
    {
        ::getrlimit(RLIMIT_NOFILE, &fBefore);
        rlimit none = fBefore;
        none.rlim_cur = 0;
        ::setrlimit(RLIMIT_NOFILE, &none);
    }
    ~NoDescriptors() { ::setrlimit(RLIMIT_NOFILE, &fBefore); }
    NoDescriptors(const NoDescriptors&) = delete;
    NoDescriptors& operator=(const NoDescriptors&) = delete;

private:
    rlimit fBefore = {};
};

// A process that isn't this one's child, as one that got the reused id of an ended child. It echoes
// its input to the end.
class Stranger {
public:
    Stranger()
    {
        int toIt[2];
        int fromIt[2];
        EXPECT_EQ(::pipe2(toIt, O_CLOEXEC), 0);
        EXPECT_EQ(::pipe2(fromIt, O_CLOEXEC), 0);
        const ::pid_t parent = ::fork();
        if (parent == 0) {
            const ::pid_t pid = ::fork();
            if (pid != 0)
                ::_exit(::write(fromIt[1], &pid, sizeof pid) == sizeof pid ? 0 : 1);
            ::close(toIt[1]);
            ::close(fromIt[0]);
            char byte = 0;
            while (::read(toIt[0], &byte, 1) == 1 && ::write(fromIt[1], &byte, 1) == 1) {
            }
            ::_exit(0);
        }
        ::close(toIt[0]);
        ::close(fromIt[1]);
        fToIt.Reset(toIt[1], true);
        fFromIt.Reset(fromIt[0], true);
        int status = -1;
        ::waitpid(parent, &status, 0);
        EXPECT_EQ(status, 0);
        fFromIt.ReadAll(&fPid, sizeof fPid);
    }

    ::pid_t GetPid() const { return fPid; }

    // It couldn't answer if it had been killed.
    bool Lives()
    {
        char answer = 0;
        fToIt.WriteAll("?", 1);
        return fFromIt.ReadSome(&answer, 1) == 1 && answer == '?';
    }

private:
    PosixHandle fToIt{PosixCalls::GetInvalid(), false};
    PosixHandle fFromIt{PosixCalls::GetInvalid(), false};
    ::pid_t fPid = 0;
};

testing::AssertionResult IsLost(ChildProcess& child)
{
    int exitCode = -1;
    for (int round = 0; round < 2; ++round) {
        const auto result =
            ThrowsRuntimeError("waitid failed: No child processes", [&] { child.Wait(&exitCode); });
        if (!result)
            return result;
        child.Kill();
    }
    if (exitCode != -1 || child.GetTermSignal() != 0)
        return testing::AssertionFailure() << "has an end";
    return testing::AssertionSuccess();
}

TEST(ChildProcess, OneWhoseEndIsTakenBeforeItIsAdoptedIsLost)
{
    const ::pid_t pid = StartSleeper();
    ::kill(pid, SIGKILL);
    ::waitpid(pid, nullptr, 0);
    ChildProcess child;
    child.Adopt(pid);
    EXPECT_TRUE(IsLost(child));
}

TEST(ChildProcess, OneWhoseEndIsTakenLaterIsLost)
{
    const ::pid_t pid = StartSleeper();
    ChildProcess child;
    child.Adopt(pid);
    ::kill(pid, SIGKILL);
    ::waitpid(pid, nullptr, 0);
    child.Kill();
    EXPECT_TRUE(IsLost(child));
}

TEST(ChildProcess, AnotherProcessWithItsNumberIsLeftAlone)
{
    Stranger stranger;
    ChildProcess child;
    child.Adopt(stranger.GetPid());
    child.Kill();
    EXPECT_TRUE(stranger.Lives());
    EXPECT_TRUE(IsLost(child));
    EXPECT_TRUE(stranger.Lives());
}

TEST(ChildProcess, AnotherProcessIsLeftAloneWithoutADescriptorToo)
{
    Stranger stranger;
    ChildProcess child;
    {
        const NoDescriptors none;
        child.Adopt(stranger.GetPid());
    }
    EXPECT_TRUE(stranger.Lives());
    EXPECT_TRUE(IsLost(child));
}

TEST(ChildProcess, OneThatCannotBeFollowedIsEnded)
{
    const ::pid_t pid = StartSleeper();
    ChildProcess child;
    {
        const NoDescriptors none;
        try {
            child.Adopt(pid);
            FAIL() << "adopted";
        } catch (const CallFailure& failure) {
            EXPECT_STREQ(failure.call, "pidfd_open");
            EXPECT_EQ(failure.error, EMFILE);
        }
    }
    EXPECT_FALSE(HasChildren());
}

} // namespace
