// Keepers that are stopped, that can't be started, and calls that signals interrupt.
#include "linux/KeeperProcess.h"
#include "pmutil/KeptLauncher.h"

#include <atomic>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <fstream>
#include <gmock/gmock.h>
#include <iterator>
#include <pthread.h>
#include <sched.h>
#include <sstream>
#include <string>
#include <sys/resource.h>
#include <thread>
#include <unistd.h>
#include <vector>

#include "TestChild.h"
#include "Throws.h"
#include "pmutil/LauncherPosix.h"
#include "pmutil/Reader.h"
#include "support/Allocations.h"
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
    char fState = '-'; // '-' if there is no such process
    ::pid_t fParent = 0;
};

Status ReadStatus(::pid_t process)
{
    Status status;
    std::ifstream file("/proc/" + std::to_string(process) + "/stat");
    const std::string text((std::istreambuf_iterator<char>(file)), {});
    const std::size_t end = text.rfind(')');
    if (end != std::string::npos)
        std::istringstream(text.substr(end + 1)) >> status.fState >> status.fParent;
    return status;
}

// Starts a shell that prints its process id and waits. Returns its keeper's.
::pid_t LaunchSleeper(KeptLauncher& launcher, LaunchResult& ends)
{
    ends = launcher.Launch(L"/bin/sh", {"-c", "echo $$; exec sleep 1000"});
    return ReadStatus(std::atoi(ReadLine(*ends.fAppOutput[1]).c_str())).fParent;
}

bool Runs()
{
    KeptLauncher launcher;
    const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "exit 3"});
    int exitCode = -1;
    return launcher.Wait(&exitCode) == kEndedNormally && exitCode == 3;
}

TEST(LateKeeper, IsReapedByALaterLaunchOnceItHasEnded)
{
    ::pid_t keeper = 0;
    {
        KeptLauncher launcher;
        LaunchResult ends;
        keeper = LaunchSleeper(launcher, ends);
        ASSERT_GT(keeper, 1);
        ::kill(keeper, SIGSTOP);
        ASSERT_TRUE(Eventually([&] { return ReadStatus(keeper).fState == 'T'; }));
        launcher.Leave();
        EXPECT_EQ(ReadStatus(keeper).fState, 'T') << "not waited for without end";
    }
    EXPECT_TRUE(Runs()) << "a launch doesn't wait for it either";
    EXPECT_EQ(ReadStatus(keeper).fState, 'T');
    ::kill(keeper, SIGCONT);
    siginfo_t end = {}; // unlike the state, it isn't there before all threads have ended
    ASSERT_EQ(::waitid(P_PID, static_cast<::id_t>(keeper), &end, WEXITED | WNOWAIT | __WALL), 0);
    EXPECT_TRUE(Runs());
    EXPECT_EQ(ReadStatus(keeper).fState, '-');
}

// It still has its stack then.
TEST(LateKeeper, IsLeftAsItIsWhenMemoryIsShort)
{
    ::pid_t keeper = 0;
    {
        KeptLauncher launcher;
        LaunchResult ends;
        keeper = LaunchSleeper(launcher, ends);
        ASSERT_GT(keeper, 1);
        ::kill(keeper, SIGSTOP);
        ASSERT_TRUE(Eventually([&] { return ReadStatus(keeper).fState == 'T'; }));
        const assay_test::FailingAllocation failing(0);
        launcher.Leave();
        EXPECT_TRUE(failing.HasFailed());
    }
    ::kill(keeper, SIGCONT);
    siginfo_t end = {};
    ASSERT_EQ(::waitid(P_PID, static_cast<::id_t>(keeper), &end, WEXITED | __WALL), 0);
    EXPECT_EQ(end.si_code, CLD_EXITED);
}

std::atomic<int> gSignals{0};

// While it exists, SIGUSR1 is counted, and interrupts calls.
class CountedSignal {
public:
    CountedSignal()
    {
        struct sigaction action = {};
        action.sa_handler = [](int) { ++gSignals; }; // without SA_RESTART
        ::sigaction(SIGUSR1, &action, &fBefore);
    }
    ~CountedSignal() { ::sigaction(SIGUSR1, &fBefore, nullptr); }
    CountedSignal(const CountedSignal&) = delete;
    CountedSignal& operator=(const CountedSignal&) = delete;

private:
    struct sigaction fBefore = {};
};

// Calls on a thread of its own, and interrupts it many times, each time once it has handled the
// last signal. Then `release` lets the call return.
template <typename Call, typename Release>
void Interrupt(Call call, Release release)
{
    const CountedSignal counted;
    std::atomic<bool> isOver{false};
    std::thread thread([&] {
        call();
        isOver = true;
    });
    for (int shot = 0; shot < 200 && !isOver; ++shot) {
        const int before = gSignals;
        ::pthread_kill(thread.native_handle(), SIGUSR1);
        while (gSignals == before && !isOver)
            ::sched_yield();
    }
    EXPECT_FALSE(isOver) << "a signal ended the call";
    release();
    thread.join();
}

TEST(KeeperProcess, WaitsOnWhenSignalsInterruptIt)
{
    KeptLauncher launcher;
    LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "read line; exit 5"});
    int exitCode = -1;
    std::atomic<int> result{-1};
    Interrupt([&] { result = launcher.Wait(&exitCode); }, [&] { ends.fAppInput.reset(); });
    EXPECT_EQ(result, kEndedNormally);
    EXPECT_EQ(exitCode, 5);
}

TEST(LauncherPosix, WaitsOnWhenSignalsInterruptIt)
{
    LauncherPosix launcher;
    LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "read line; exit 5"});
    int exitCode = -1;
    std::atomic<int> result{-1};
    Interrupt([&] { result = launcher.Wait(&exitCode); }, [&] { ends.fAppInput.reset(); });
    EXPECT_EQ(result, kEndedNormally);
    EXPECT_EQ(exitCode, 5);
}

TEST(KeeperProcess, LimitsAreWholeMillisecondsUpToTenSeconds)
{
    const struct {
        double fSeconds;
        int fMilliseconds;
    } kRows[] = {{-1, 0}, {0, 0}, {0.0019, 1}, {2.5, 2500}, {10, 10000}, {10.5, 10000}};
    for (const auto& row : kRows)
        EXPECT_EQ(GetLimitMilliseconds(row.fSeconds), row.fMilliseconds) << row.fSeconds;
}

TEST(KeeperProcess, CountsTheKernelsTimeInMilliseconds)
{
    EXPECT_EQ(ToMilliseconds(0, 999'999), 0);
    EXPECT_EQ(ToMilliseconds(0, 1'000'000), 1);
    EXPECT_EQ(ToMilliseconds(3, 999'999'999), 3999);
}

TEST(KeeperProcess, HasAllSignalsBlocked)
{
    KeptLauncher launcher;
    LaunchResult ends;
    const ::pid_t keeper = LaunchSleeper(launcher, ends);
    std::ifstream file("/proc/" + std::to_string(keeper) + "/status");
    const std::string text((std::istreambuf_iterator<char>(file)), {});
    // All but SIGKILL, SIGSTOP and the two that the C library keeps for itself.
    EXPECT_THAT(text, testing::HasSubstr("SigBlk:\tfffffffe7ffbfeff\n"));
}

TEST(KeeperProcess, SleepsAfterTheEndOfTheChild)
{
    KeptLauncher launcher;
    LaunchResult ends;
    const ::pid_t keeper = LaunchSleeper(launcher, ends);
    launcher.Kill();
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedByKill);
    // One that polls without end is seen running, if not at each look.
    EXPECT_TRUE(Eventually([&] {
        for (int look = 0; look < 200; ++look)
            if (ReadStatus(keeper).fState != 'S')
                return false;
        return true;
    }));
    EXPECT_NE(launcher.Wait(&exitCode), kEndedNormally) << "its end can be taken only once";
}

TEST(KeeperProcess, HasNotEndedAllBeforeTheyAreReaped)
{
    KeptLauncher launcher;
    LaunchResult ends;
    LaunchSleeper(launcher, ends);
    EXPECT_FALSE(launcher.EndAll(0));
    EXPECT_TRUE(launcher.EndAll(kLong));
    EXPECT_TRUE(launcher.EndAll(0)) << "none is left";
    launcher.Leave();
    EXPECT_TRUE(launcher.EndAll(0)) << "nor is the keeper";
}

TEST(KeeperProcess, EndsOneWhoseFirstThreadHasEnded)
{
    KeptLauncher launcher;
    const std::wstring path = TEST_CHILD;
    const LaunchResult ends = launcher.Launch(
        L"/bin/sh", {"-c", "echo $$; exec \"$0\" thread", std::string(path.begin(), path.end())});
    const ::pid_t child = std::atoi(ReadLine(*ends.fAppOutput[1]).c_str());
    ASSERT_TRUE(Eventually([&] { return ReadStatus(child).fState == 'Z'; }));
    EXPECT_TRUE(launcher.EndAll(kLong));
    EXPECT_EQ(ReadStatus(child).fState, '-');
}

TEST(KeeperProcess, LeavesNoDescriptorButThatOfTheEnd)
{
    KeptLauncher launcher;
    const long before = CountOpenThings();
    {
        LaunchResult ends;
        LaunchSleeper(launcher, ends);
    }
    launcher.Leave();
    EXPECT_EQ(CountOpenThings(), before + 1);
}

TEST(KeptLauncher, TheChildHasThreeStreamsAndTheHostsEnvironment)
{
    ::setenv("KEPT_LAUNCHER_TEST", "told", 1);
    KeptLauncher launcher;
    LaunchResult ends = launcher.Launch(
        L"/bin/sh", {"-c", "read line; echo $line $KEPT_LAUNCHER_TEST; echo error >&2"});
    ::unsetenv("KEPT_LAUNCHER_TEST");
    ends.fAppInput->WriteAll("in\n", 3);
    EXPECT_EQ(ReadLine(*ends.fAppOutput[1]), "in told");
    EXPECT_EQ(ReadLine(*ends.fAppOutput[2]), "error");
}

TEST(KeptLauncher, AHostWithClosedStandardStreamsCanLaunch)
{
    for (const int closed : {1, 2, 3}) {
        int kept[3];
        for (int stream = 0; stream < closed; ++stream) {
            kept[stream] = ::fcntl(stream, F_DUPFD_CLOEXEC, 10);
            ::close(stream);
        }
        const bool runs = Runs();
        for (int stream = 0; stream < closed; ++stream) {
            if (kept[stream] < 0)
                continue;
            ::dup2(kept[stream], stream);
            ::close(kept[stream]);
        }
        EXPECT_TRUE(runs) << closed;
    }
}

TEST(KeeperProcess, LeavesWhenSignalsInterruptIt)
{
    KeptLauncher launcher;
    LaunchResult ends;
    const ::pid_t keeper = LaunchSleeper(launcher, ends);
    ::kill(keeper, SIGSTOP);
    Interrupt([&] { launcher.EndAll(kLong); }, [&] { ::kill(keeper, SIGCONT); });
    launcher.Leave();
    EXPECT_EQ(ReadStatus(keeper).fState, '-');
}

// While it exists, no descriptor from `limit` on can be opened.
class DescriptorLimit {
public:
    explicit DescriptorLimit(::rlim_t limit)
    {
        ::getrlimit(RLIMIT_NOFILE, &fBefore);
        rlimit set = fBefore;
        set.rlim_cur = limit;
        ::setrlimit(RLIMIT_NOFILE, &set);
    }
    ~DescriptorLimit() { ::setrlimit(RLIMIT_NOFILE, &fBefore); }
    DescriptorLimit(const DescriptorLimit&) = delete;
    DescriptorLimit& operator=(const DescriptorLimit&) = delete;

private:
    rlimit fBefore = {};
};

// Returns the failure of a launch with this limit; empty if it succeeds.
std::string FailAtLimit(::rlim_t limit)
{
    KeptLauncher launcher;
    try {
        const DescriptorLimit limited(limit);
        launcher.Launch(L"/bin/true", {});
    } catch (const std::runtime_error& failure) {
        return failure.what();
    }
    return {};
}

// Counts the guards below the stacks of keepers.
int CountGuards()
{
    int count = 0;
    std::ifstream maps("/proc/self/maps");
    for (std::string line; std::getline(maps, line);) {
        char* end = nullptr;
        const unsigned long begin = std::strtoul(line.c_str(), &end, 16);
        const unsigned long bytes = std::strtoul(end + 1, &end, 16) - begin;
        count += bytes == 65536 &&
                         line.compare(static_cast<std::size_t>(end - line.c_str()), 5, " ---p") == 0
                     ? 1
                     : 0;
    }
    return count;
}

TEST(KeeperProcess, HasAGuardBelowItsStack)
{
    const int before = CountGuards();
    KeptLauncher launcher;
    LaunchResult ends;
    LaunchSleeper(launcher, ends);
    EXPECT_EQ(CountGuards(), before + 1);
    launcher.Leave();
}

TEST(KeeperProcess, EachCallThatFailsForLackOfADescriptorIsNamed)
{
    const long before = CountOpenThings();
    const int guards = CountGuards();
    std::vector<std::string> failures;
    for (::rlim_t limit = 3; limit < 100; ++limit) {
        const std::string failure = FailAtLimit(limit);
        EXPECT_EQ(CountOpenThings(), before) << limit;
        EXPECT_EQ(CountGuards(), guards) << failure;
        if (failure.empty())
            break;
        if (failures.empty() || failures.back() != failure)
            failures.push_back(failure);
    }
    const std::string end = " failed: /bin/true: Too many open files";
    EXPECT_THAT(failures, testing::ElementsAre("pipe2" + end, "socketpair" + end, "pipe2" + end,
                                               "pidfd_open" + end, "clone" + end));
    EXPECT_FALSE(HasChildren());
}

// Ignores all signals that a process can ignore while it exists.
class AllIgnored {
public:
    AllIgnored()
    {
        struct sigaction ignored = {};
        ignored.sa_handler = SIG_IGN;
        for (int number = 1; number <= kSignals; ++number)
            ::sigaction(number, &ignored, &fBefore[number]);
    }
    ~AllIgnored()
    {
        for (int number = 1; number <= kSignals; ++number)
            ::sigaction(number, &fBefore[number], nullptr);
    }
    AllIgnored(const AllIgnored&) = delete;
    AllIgnored& operator=(const AllIgnored&) = delete;

private:
    static constexpr int kSignals = 64;

    struct sigaction fBefore[kSignals + 1] = {};
};

TEST(KeptLauncher, TheChildHasTheDefaultOfEachSignal)
{
    const AllIgnored ignored;
    KeptLauncher launcher;
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"state"});
    std::string text;
    for (std::string line = ReadLine(*ends.fAppOutput[1]); !line.empty();
         line = ReadLine(*ends.fAppOutput[1]))
        text += line + "\n";
    EXPECT_THAT(text, testing::HasSubstr("signals blocked 0 changed 0\n"));
}

} // namespace
