#include "pmutil/KeptLauncher.h"

#include <atomic>
#include <boost/filesystem/directory.hpp>
#include <boost/filesystem/operations.hpp>
#include <boost/make_shared.hpp>
#include <boost/thread/thread.hpp>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <fstream>
#include <gmock/gmock.h>
#include <poll.h>
#include <sstream>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

#include "TestChild.h"
#include "Throws.h"
#include "pmutil/LauncherPosix.h"
#include "pmutil/PosixHandle.h"
#include "support/OpenThings.h"
#include "support/Waits.h"

using namespace pmutil;

namespace {

std::string ReadLine(Reader& reader)
{
    std::string line;
    char byte = 0;
    while (reader.ReadSome(&byte, 1) == 1 && byte != '\n')
        line += byte;
    return line;
}

struct Status {
    std::string fName;
    char fState = '-'; // '-' if there is no such process
    ::pid_t fParent = 0;
    ::pid_t fGroup = 0;
};

Status ReadStatus(::pid_t process)
{
    Status status;
    std::ifstream file("/proc/" + std::to_string(process) + "/stat");
    std::string text((std::istreambuf_iterator<char>(file)), {});
    const std::size_t end = text.rfind(')');
    if (end == std::string::npos)
        return status;
    const std::size_t begin = text.find('(') + 1;
    status.fName = text.substr(begin, end - begin);
    std::istringstream(text.substr(end + 1)) >> status.fState >> status.fParent >> status.fGroup;
    return status;
}

bool IsLiving(::pid_t process)
{
    const char state = ReadStatus(process).fState;
    return state != '-' && state != 'Z' && state != 'X';
}

// A launch of a shell that prints a line, usually process ids, and may then live on.
struct Shell {
    explicit Shell(const std::string& script) : fEnds(fLauncher.Launch(L"/bin/sh", {"-c", script}))
    {
        fEnds.fAppInput.reset();
        fLine = ReadLine(*fEnds.fAppOutput[1]);
    }

    WaitResult Wait()
    {
        fExitCode = -1;
        return fLauncher.Wait(&fExitCode);
    }

    KeptLauncher fLauncher;
    LaunchResult fEnds;
    std::string fLine;
    int fExitCode = -1;
};

// Sets the disposition of SIGCHLD while it exists.
class ChildSignal {
public:
    explicit ChildSignal(void (*handler)(int)) : fBefore(std::signal(SIGCHLD, handler)) {}
    ~ChildSignal() { std::signal(SIGCHLD, fBefore); }

private:
    void (*const fBefore)(int);
};

std::atomic<int> gChildSignals{0};

TEST(KeptLauncher, ReportsTheExitCodeToAHostThatIgnoresChildren)
{
    const ChildSignal ignored(SIG_IGN);
    Shell shell("echo; exit 7");
    EXPECT_EQ(shell.Wait(), kEndedNormally);
    EXPECT_EQ(shell.fExitCode, 7);
    EXPECT_EQ(GetTerminationText(shell.fLauncher), "");
}

TEST(KeptLauncher, TheHostSeesNeitherASignalNorAChild)
{
    gChildSignals = 0;
    const ChildSignal counted([](int) { ++gChildSignals; });
    std::atomic<bool> done{false};
    std::atomic<int> reaped{0};
    boost::thread waiting([&] {
        while (!done)
            if (::waitpid(-1, nullptr, 0) > 0)
                ++reaped;
    });
    for (int run = 0; run < 20; ++run) {
        Shell shell("echo; exit 9");
        EXPECT_EQ(shell.Wait(), kEndedNormally);
        EXPECT_EQ(shell.fExitCode, 9);
    }
    done = true;
    waiting.join();
    EXPECT_EQ(reaped, 0);
    EXPECT_EQ(gChildSignals, 0);
}

TEST(KeptLauncher, ReportsTheSignalThatEndedTheChild)
{
    Shell shell("echo; kill -SEGV $$");
    EXPECT_EQ(shell.Wait(), kEndedByCrash);
    EXPECT_EQ(shell.fExitCode, -1);
    EXPECT_EQ(GetTerminationText(shell.fLauncher), "signal 11 (Segmentation fault)");
}

TEST(KeptLauncher, KillsTheChildBeforeDuringAndAfterItsEnd)
{
    {
        KeptLauncher launcher;
        launcher.Kill();
        EXPECT_TRUE(launcher.EndAll(0));
    }
    Shell shell("echo; sleep 1000");
    boost::thread killer([&] { shell.fLauncher.Kill(); });
    EXPECT_EQ(shell.Wait(), kEndedByKill);
    killer.join();
    shell.fLauncher.Kill();
    shell.fLauncher.Leave();
    shell.fLauncher.Kill();
}

TEST(KeptLauncher, EndsDescendantsInOtherSessionsAndNoOtherChildOfTheHost)
{
    LauncherPosix other;
    const LaunchResult otherEnds = other.Launch(L"/bin/sh", {"-c", "echo $$; exec sleep 1000"});
    const ::pid_t others = std::atoi(ReadLine(*otherEnds.fAppOutput[1]).c_str());
    Shell shell("(setsid sh -c 'echo $$; exec sleep 1000' &); exec sleep 1000");
    const ::pid_t daemon = std::atoi(shell.fLine.c_str());
    EXPECT_TRUE(IsLiving(daemon));
    shell.fLauncher.Kill();
    EXPECT_EQ(shell.Wait(), kEndedByKill);
    EXPECT_TRUE(shell.fLauncher.EndAll(kLong));
    EXPECT_FALSE(IsLiving(daemon));
    EXPECT_TRUE(IsLiving(others));
    other.Kill();
}

TEST(KeptLauncher, LeavingEndsWhatIsLeft)
{
    Shell shell("sh -c 'echo $$; exec sleep 1000' & wait");
    const ::pid_t grandchild = std::atoi(shell.fLine.c_str());
    const ::pid_t child = ReadStatus(grandchild).fParent;
    const ::pid_t keeper = ReadStatus(child).fParent;
    shell.fLauncher.Leave();
    EXPECT_EQ(ReadStatus(grandchild).fState, '-');
    EXPECT_EQ(ReadStatus(child).fState, '-');
    EXPECT_EQ(ReadStatus(keeper).fState, '-') << "not reaped";
    EXPECT_EQ(shell.Wait(), kEndedByCrash) << "it wasn't Kill that ended it";
}

TEST(KeptLauncher, TheKeeperHasItsOwnNameAndGroupAndNoDescriptorOfTheHost)
{
    const PosixHandle open(::open("/dev/null", O_RDONLY | O_CLOEXEC), true);
    Shell shell("echo $$; exec sleep 1000");
    const ::pid_t child = std::atoi(shell.fLine.c_str());
    const ::pid_t keeper = ReadStatus(child).fParent;
    const Status status = ReadStatus(keeper);
    EXPECT_EQ(status.fName, "child-keeper");
    EXPECT_EQ(status.fGroup, keeper);
    EXPECT_EQ(status.fParent, ::getpid());
    EXPECT_EQ(ReadStatus(child).fGroup, child);
    const std::string folder = "/proc/" + std::to_string(keeper) + "/fd";
    // The link, the pipe of the end, and the process descriptors of the host and the child. The
    // others are closed after the child has started.
    EXPECT_TRUE(Eventually(
        [&] { return std::distance(boost::filesystem::directory_iterator(folder), {}) == 4; }));
}

TEST(KeptLauncher, TheChildEndsWithAKilledKeeper)
{
    Shell shell("echo $$; exec sleep 1000");
    const ::pid_t child = std::atoi(shell.fLine.c_str());
    ::kill(ReadStatus(child).fParent, SIGKILL);
    errno = EINTR; // of an earlier call
    EXPECT_EQ(shell.Wait(), kEndedByCrash);
    EXPECT_EQ(GetTerminationText(shell.fLauncher), "signal 9 (Killed)");
    EXPECT_EQ(ReadLine(*shell.fEnds.fAppOutput[1]), "") << "its output is closed";
    errno = EINTR;
    EXPECT_FALSE(shell.fLauncher.EndAll(0)) << "nobody knows the descendants now";
}

TEST(KeptLauncher, AllEndsWithAKilledHost)
{
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_CLOEXEC), 0);
    PosixHandle out(ends[0], true);
    PosixHandle in(ends[1], true);
    const ::pid_t host = ::fork();
    if (host == 0) {
        const Shell shell("setsid sh -c 'echo $$; exec sleep 1000' & wait");
        in.WriteAll((shell.fLine + "\n").c_str(), shell.fLine.size() + 1);
        ::pause();
        std::_Exit(0);
    }
    in.Close();
    const ::pid_t grandchild = std::atoi(ReadLine(out).c_str());
    ASSERT_TRUE(IsLiving(grandchild));
    const PosixHandle end(static_cast<int>(::syscall(SYS_pidfd_open, grandchild, 0)), true);
    ::kill(host, SIGKILL);
    pollfd poll{end.GetHandle(), POLLIN, 0};
    EXPECT_EQ(::poll(&poll, 1, static_cast<int>(1000 * kLong)), 1) << "it lives on";
    ::waitpid(host, nullptr, 0);
}

TEST(KeptLauncher, TheChildHasDefaultSignalsAndItsStreamsOnly)
{
    const ChildSignal ignored(SIG_IGN);
    const PosixHandle forgotten(::open("/dev/null", O_RDONLY), true); // NOLINT: no O_CLOEXEC
    sigset_t some;
    sigset_t oldMask;
    ::sigemptyset(&some);
    ::sigaddset(&some, SIGTERM);
    ::pthread_sigmask(SIG_BLOCK, &some, &oldMask);
    KeptLauncher launcher;
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"state"});
    std::string text;
    for (std::string line = ReadLine(*ends.fAppOutput[1]); !line.empty();
         line = ReadLine(*ends.fAppOutput[1]))
        text += line + "\n";
    sigset_t mask;
    ::pthread_sigmask(SIG_SETMASK, &oldMask, &mask);
    EXPECT_EQ(::sigismember(&mask, SIGTERM), 1);
    EXPECT_EQ(::sigismember(&mask, SIGUSR1), 0) << "the host's mask is as before";
    EXPECT_THAT(text, testing::HasSubstr("descriptors 0 1 2\n"));
    EXPECT_THAT(text, testing::HasSubstr("signals blocked 0 changed 0\n"));
}

TEST(KeptLauncher, AFailedStartLeavesNothing)
{
    const long before = CountOpenThings();
    const struct {
        std::wstring fPath;
        std::string fText;
    } kRows[] = {
        {L"/nonexistent/\u00FC", "execve failed: /nonexistent/\xC3\xBC: No such file or directory"},
        {L"/tmp", "execve failed: /tmp: Permission denied"},
        {std::wstring(L"/bin/p\0q", 8), "execve failed: /bin/p: Invalid argument"},
        {std::wstring(1, static_cast<wchar_t>(0xD800)),
         "execve failed: Invalid or incomplete multibyte or wide character"},
    };
    for (const auto& row : kRows) {
        KeptLauncher launcher;
        EXPECT_TRUE(ThrowsRuntimeError(row.fText, [&] { launcher.Launch(row.fPath, {}); }));
    }
    KeptLauncher launcher;
    EXPECT_TRUE(ThrowsRuntimeError("execve failed: /bin/true: Invalid argument", [&] {
        launcher.Launch(L"/bin/true", {std::string("a\0b", 3)});
    }));
    siginfo_t info = {};
    EXPECT_NE(::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT | __WALL), 0)
        << "a keeper is left";
    EXPECT_EQ(CountOpenThings(), before);
}

TEST(KeptLauncher, ManyLaunchesAtOnceLeaveNothing)
{
    const long before = CountOpenThings();
    boost::thread_group threads;
    std::atomic<int> right{0};
    for (int thread = 0; thread < 8; ++thread)
        threads.create_thread([&, thread] {
            for (int run = 0; run < 10; ++run) {
                const int code = 10 * thread + run;
                Shell shell("echo " + std::to_string(code) + "; exit " + std::to_string(code));
                if (shell.Wait() == kEndedNormally && shell.fExitCode == code &&
                    shell.fLine == std::to_string(code))
                    ++right;
            }
        });
    threads.join_all();
    EXPECT_EQ(right, 80);
    EXPECT_EQ(CountOpenThings(), before);
    siginfo_t info = {};
    EXPECT_NE(::waitid(P_ALL, 0, &info, WEXITED | WNOHANG | WNOWAIT | __WALL), 0);
}

} // namespace
