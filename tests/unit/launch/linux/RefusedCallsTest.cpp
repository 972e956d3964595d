// Launches while the kernel refuses single calls, as older kernels, emulators and containers do.
#include "pmutil/KeptLauncher.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <iterator>
#include <sched.h>
#include <string>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <boost/filesystem/directory.hpp>

#include "FreshProcess.h"
#include "TestChild.h"
#include "pmutil/LauncherPosix.h"
#include "pmutil/Reader.h"
#include "support/Waits.h"
#include "support/linux/RefusedCalls.h"

using namespace pmutil;

namespace {

void Filter(long call, int argument, unsigned value, unsigned result)
{
    REQUIRE_SO(FilterCall(call, argument, value, result));
}

void Refuse(long call, int argument, unsigned value, int error)
{
    REQUIRE_SO(RefuseCall(call, argument, value, error));
}

void RefuseCloseRange()
{
    Refuse(SYS_close_range, -1, 0, ENOSYS);
}

std::string ReadLine(Reader& reader)
{
    std::string line;
    char byte = 0;
    while (reader.ReadSome(&byte, 1) == 1 && byte != '\n')
        line += byte;
    return line;
}

// Keepers too, whose end sends no signal.
bool HasAnyChild()
{
    siginfo_t info = {};
    return ::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT | __WALL) == 0;
}

std::string FailLaunch(const wchar_t* program = L"/bin/true")
{
    KeptLauncher launcher;
    try {
        launcher.Launch(program, {});
    } catch (const std::runtime_error& failure) {
        return failure.what();
    }
    return {};
}

// The launchers' tests are left out by this name where the keeper can't run.
class KeptLauncherRefusal : public testing::Test {
protected:
    void SetUp() override
    {
        if (::prctl(PR_GET_SECCOMP) < 0)
            GTEST_SKIP() << "the kernel has no filters of system calls";
    }
};

TEST_F(KeptLauncherRefusal, OfAStackIsNamed)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_mmap, 3, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE | MAP_STACK, ENOMEM);
        REQUIRE_SO(FailLaunch() == "mmap failed: /bin/true: Cannot allocate memory");
    });
}

TEST_F(KeptLauncherRefusal, OfTheGuardBelowAStackIsNamed)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_mprotect, 2, PROT_NONE, EPERM);
        REQUIRE_SO(FailLaunch() == "mprotect failed: /bin/true: Operation not permitted");
    });
}

TEST_F(KeptLauncherRefusal, OfAProcessIsNamed)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_clone, 0, CLONE_VM | CLONE_PIDFD, EAGAIN);
        REQUIRE_SO(FailLaunch() == "clone failed: /bin/true: Resource temporarily unavailable");
        REQUIRE_SO(!HasAnyChild());
    });
}

TEST_F(KeptLauncherRefusal, AKeeperThatDiesBeforeItsReplyFailsTheLaunch)
{
    ExpectInFreshProcess([] {
        // Before Linux 5.16 a core dump ends all processes that share the memory.
        REQUIRE_SO(::prctl(PR_SET_DUMPABLE, 0) == 0);
        Filter(SYS_setpgid, -1, 0, SECCOMP_RET_KILL_PROCESS); // the keeper's first call
        REQUIRE_SO(FailLaunch() == "execve failed: /bin/true: No child processes");
        REQUIRE_SO(!HasAnyChild());
    });
}

TEST_F(KeptLauncherRefusal, OfADescriptorWithTheChildsProcessIsMadeUpFor)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_clone, 0, CLONE_VM | CLONE_VFORK | CLONE_PIDFD | SIGCHLD, EINVAL);
        KeptLauncher launcher;
        LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "read line; exit 3"});
        ends.fAppInput.reset();
        int exitCode = -1;
        REQUIRE_SO(launcher.Wait(&exitCode) == kEndedNormally);
        REQUIRE_SO(exitCode == 3);
        KeptLauncher killed;
        ends = killed.Launch(L"/bin/sh", {"-c", "exec sleep 1000"});
        killed.Kill();
        REQUIRE_SO(killed.Wait(&exitCode) == kEndedByKill);
    });
}

TEST_F(KeptLauncherRefusal, OfItsKeepersNumberKeepsTheChildFromTheProgram)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_getppid, -1, 0, EPERM); // as if the keeper had ended
        KeptLauncher launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "echo begun"});
        REQUIRE_SO(ReadLine(*ends.fAppOutput[1]).empty());
        int exitCode = -1;
        REQUIRE_SO(launcher.Wait(&exitCode) == kEndedNormally);
        REQUIRE_SO(exitCode == 1);
    });
}

TEST_F(KeptLauncherRefusal, OfTheChildsProcessIsNamed)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_clone, 0, CLONE_VM | CLONE_VFORK | CLONE_PIDFD | SIGCHLD, EAGAIN);
        REQUIRE_SO(FailLaunch() == "execve failed: /bin/true: Resource temporarily unavailable");
        REQUIRE_SO(!HasAnyChild());
    });
}

TEST_F(KeptLauncherRefusal, OfSharedMemoryLeavesAKeeperOfItsOwnMemory)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_clone, 0, CLONE_VM | CLONE_PIDFD, EINVAL);
        {
            KeptLauncher launcher;
            const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "exit 3"});
            int exitCode = -1;
            REQUIRE_SO(launcher.Wait(&exitCode) == kEndedNormally);
            REQUIRE_SO(exitCode == 3);
        }
        REQUIRE_SO(!HasAnyChild());
    });
}

TEST_F(KeptLauncherRefusal, OfSharedMemoryAndADescriptorLeavesNoKeeper)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_clone, 0, CLONE_VM | CLONE_PIDFD, EINVAL);
        // The undefined behaviour sanitizer opens a descriptor for its first check of a type.
        REQUIRE_SO(FailLaunch().empty());
        REQUIRE_SO(!FailLaunch(L"/no/such/program").empty());
        rlimit descriptors = {};
        ::getrlimit(RLIMIT_NOFILE, &descriptors);
        descriptors.rlim_cur = STDERR_FILENO;
        std::string failure;
        do {
            ++descriptors.rlim_cur;
            REQUIRE_SO(::setrlimit(RLIMIT_NOFILE, &descriptors) == 0);
            failure = FailLaunch();
            REQUIRE_SO(!HasAnyChild());
        } while (!failure.empty());
    });
}

// More descriptors than one read of their list holds, with each first digit, from `first` on.
void OpenMany(int first)
{
    for (int number = first; number < first + 500; ++number)
        REQUIRE_SO(::fcntl(1, F_DUPFD, number) >= 0); // NOLINT: no O_CLOEXEC
}

TEST_F(KeptLauncherRefusal, OfARangeToCloseLeavesTheChildItsStreamsOnly)
{
    ExpectInFreshProcess([] {
        OpenMany(90);
        RefuseCloseRange();
        KeptLauncher launcher;
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"state"});
        REQUIRE_SO(ReadLine(*ends.fAppOutput[1]) == "descriptors 0 1 2");
    });
}

TEST_F(KeptLauncherRefusal, OfAListOfDescriptorsLeavesTheChildItsStreamsOnly)
{
    ExpectInFreshProcess([] {
        OpenMany(90);
        Refuse(SYS_openat, 2, O_RDONLY | O_DIRECTORY, EACCES);
        KeptLauncher launcher;
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"state"});
        REQUIRE_SO(ReadLine(*ends.fAppOutput[1]) == "descriptors 0 1 2");
    });
}

TEST_F(KeptLauncherRefusal, OfARangeToCloseLeavesTheKeeperItsOwnDescriptorsOnly)
{
    ExpectInFreshProcess([] {
        OpenMany(90);
        RefuseCloseRange();
        KeptLauncher launcher;
        const LaunchResult ends =
            launcher.Launch(L"/bin/sh", {"-c", "echo $PPID; exec sleep 1000"});
        const std::string folder = "/proc/" + ReadLine(*ends.fAppOutput[1]) + "/fd";
        // The link, the pipe of the end, and the process descriptors of the host and the child.
        REQUIRE_SO(Eventually(
            [&] { return std::distance(boost::filesystem::directory_iterator(folder), {}) == 4; }));
        launcher.Kill();
        int exitCode = -1;
        REQUIRE_SO(launcher.Wait(&exitCode) == kEndedByKill);
    });
}

// A shell that ends with its input.
constexpr char kReading[] = "read line";

// Returns what the call throws; empty if it throws nothing.
template <typename Call>
std::string Fail(const Call& call)
{
    try {
        call();
    } catch (const std::runtime_error& failure) {
        return failure.what();
    }
    return {};
}

class LauncherPosixRefusal : public KeptLauncherRefusal {};

TEST_F(LauncherPosixRefusal, OfADescriptorOfTheChildEndsIt)
{
    ExpectInFreshProcess([] {
        Refuse(SYS_pidfd_open, -1, 0, ENOSYS);
        LauncherPosix launcher;
        REQUIRE_SO(Fail([&] {
                       launcher.Launch(L"/bin/sh", {"-c", "exec sleep 1000"});
                   }) == "pidfd_open failed: /bin/sh: Function not implemented");
        REQUIRE_SO(!HasAnyChild());
    });
}

TEST_F(LauncherPosixRefusal, OfANumberAboveTheStreamsIsNamed)
{
    ExpectInFreshProcess([] {
        ::close(STDIN_FILENO);
        Refuse(SYS_fcntl, 1, F_DUPFD_CLOEXEC, EMFILE);
        LauncherPosix launcher;
        REQUIRE_SO(Fail([&] {
                       launcher.Launch(L"/bin/sh", {"-c", kReading});
                   }) == "fcntl failed: /bin/sh: Too many open files");
    });
}

TEST_F(LauncherPosixRefusal, OfAKillIsNamed)
{
    ExpectInFreshProcess([] {
        LauncherPosix launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_pidfd_send_signal, -1, 0, EPERM);
        REQUIRE_SO(Fail([&] { launcher.Kill(); }) ==
                   "pidfd_send_signal failed: Operation not permitted");
    });
}

TEST_F(LauncherPosixRefusal, OfAnEndIsNamed)
{
    ExpectInFreshProcess([] {
        LauncherPosix launcher;
        launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_waitid, 0, P_PIDFD, EPERM);
        int exitCode = 0;
        REQUIRE_SO(Fail([&] { launcher.Wait(&exitCode); }) ==
                   "waitid failed: Operation not permitted");
    });
}

#ifdef SYS_poll             // newer processors have ppoll only
constexpr int kTimeout = 2; // the argument of poll, in milliseconds
constexpr unsigned kNoLimit = ~0U;
constexpr unsigned kSecond = 1000;

TEST_F(LauncherPosixRefusal, OfAWaitIsNamed)
{
    ExpectInFreshProcess([] {
        LauncherPosix launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_poll, kTimeout, kNoLimit, EPERM);
        Refuse(SYS_poll, kTimeout, kSecond, EIO);
        int exitCode = 0;
        REQUIRE_SO(Fail([&] { launcher.Wait(&exitCode); }) ==
                   "poll failed: Operation not permitted");
        launcher.Kill(); // doesn't wait, because Wait was called
    });
}

TEST_F(LauncherPosixRefusal, OfTheWaitOfAKillIsNamed)
{
    ExpectInFreshProcess([] {
        LauncherPosix launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_poll, kTimeout, kSecond, EPERM);
        REQUIRE_SO(Fail([&] { launcher.Kill(); }) == "poll failed: Operation not permitted");
    });
}

TEST_F(LauncherPosixRefusal, AKillWhoseWaitTimesOutLeavesTheEndToWait)
{
    ExpectInFreshProcess([] {
        LauncherPosix launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_poll, kTimeout, kSecond, 0);
        errno = EINTR; // of an earlier call
        launcher.Kill();
        REQUIRE_SO(HasAnyChild());
        int exitCode = 0;
        REQUIRE_SO(launcher.Wait(&exitCode) == kEndedByKill);
        REQUIRE_SO(!HasAnyChild());
    });
}

TEST_F(KeptLauncherRefusal, AKeeperThatDoesNotEndInASecondIsLeft)
{
    ExpectInFreshProcess([] {
        KeptLauncher launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_poll, kTimeout, kSecond, 0);
        errno = EINTR;
        launcher.Leave();
        REQUIRE_SO(HasAnyChild());
    });
}
#endif

} // namespace
