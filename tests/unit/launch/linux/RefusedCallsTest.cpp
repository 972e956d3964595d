// Launches while the kernel refuses single calls, as older kernels, emulators and containers do.
#include "pmutil/KeptLauncher.h"

#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstdlib>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <iterator>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <string>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

#include <boost/filesystem/directory.hpp>

#include "FreshProcess.h"
#include "TestChild.h"
#include "pmutil/LauncherPosix.h"
#include "pmutil/Reader.h"
#include "support/Waits.h"

using namespace pmutil;

namespace {

// From now on a call fails with an errno; if `argument` isn't negative, only one whose argument of
// this number has the value.
void Refuse(long call, int argument, unsigned value, int error)
{
    const auto load = [](std::size_t offset) {
        return sock_filter BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<unsigned>(offset));
    };
    const auto unlessEqual = [](unsigned expected, std::size_t skipped) {
        return sock_filter BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, expected, 0,
                                    static_cast<unsigned char>(skipped));
    };
    const auto end = [](unsigned result) { return sock_filter BPF_STMT(BPF_RET | BPF_K, result); };
    std::vector<sock_filter> checks;
    if (argument >= 0)
        checks = {load(offsetof(seccomp_data, args) + 8 * static_cast<unsigned>(argument)),
                  unlessEqual(value, 1)};
    std::vector<sock_filter> filter = {load(offsetof(seccomp_data, nr)),
                                       unlessEqual(static_cast<unsigned>(call), checks.size() + 1)};
    filter.insert(filter.end(), checks.begin(), checks.end());
    filter.push_back(end(SECCOMP_RET_ERRNO | static_cast<unsigned>(error)));
    filter.push_back(end(SECCOMP_RET_ALLOW));
    const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
    REQUIRE_SO(::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0);
    REQUIRE_SO(::prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0);
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

std::string FailLaunch()
{
    KeptLauncher launcher;
    try {
        launcher.Launch(L"/bin/true", {});
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

// More descriptors than one read of their list holds, from `first` on.
void OpenMany(int first)
{
    for (int number = first; number < first + 500; ++number)
        REQUIRE_SO(::fcntl(1, F_DUPFD, number) >= 0); // NOLINT: no O_CLOEXEC
}

TEST_F(KeptLauncherRefusal, OfARangeToCloseLeavesTheChildItsStreamsOnly)
{
    ExpectInFreshProcess([] {
        OpenMany(100);
        RefuseCloseRange();
        KeptLauncher launcher;
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"state"});
        REQUIRE_SO(ReadLine(*ends.fAppOutput[1]) == "descriptors 0 1 2");
    });
}

TEST_F(KeptLauncherRefusal, OfARangeToCloseLeavesTheKeeperItsOwnDescriptorsOnly)
{
    ExpectInFreshProcess([] {
        OpenMany(100);
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

#ifdef SYS_poll // newer processors have ppoll only
TEST_F(LauncherPosixRefusal, OfAWaitIsNamed)
{
    ExpectInFreshProcess([] {
        LauncherPosix launcher;
        const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", kReading});
        Refuse(SYS_poll, -1, 0, EPERM);
        int exitCode = 0;
        REQUIRE_SO(Fail([&] { launcher.Wait(&exitCode); }) ==
                   "poll failed: Operation not permitted");
    });
}
#endif

} // namespace
