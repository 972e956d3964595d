#include "pmutil/LauncherPosix.h"

#include <algorithm>
#include <atomic>
#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>
#include <boost/thread/thread.hpp>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <fstream>
#include <gmock/gmock.h>
#include <malloc.h>
#include <memory>
#include <spawn.h>
#include <sstream>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

#include "RecordingLogger.h"
#include "TestChild.h"
#include "Throws.h"
#include "pmutil/PosixHandle.h"
#include "support/OpenThings.h"
#include "support/Waits.h"

using namespace pmutil;

namespace {

std::string ReadRest(Reader& reader)
{
    std::string all;
    char block[4096];
    for (auto count = reader.ReadSome(block, sizeof block); count > 0;
         count = reader.ReadSome(block, sizeof block))
        all.append(block, count);
    return all;
}

std::string Hex(const std::string& text)
{
    std::string hex;
    for (const char byte : text) {
        char digits[3];
        std::snprintf(digits, sizeof digits, "%02x",
                      static_cast<unsigned>(static_cast<unsigned char>(byte)));
        hex += digits;
    }
    return hex;
}

struct Outcome {
    WaitResult result = kEndedNormally;
    int exitCode = -1;
    std::string out;
};

// The ids of the process group of a shell, and of the shell.
std::vector<::pid_t> LaunchForGroup(LauncherPosix&& launcher)
{
    LaunchResult ends = launcher.Launch(
        L"/bin/sh", {"-c", "read -r pid name state parent group rest </proc/self/stat\n"
                           "echo $group $pid"});
    std::istringstream text(ReadRest(*ends.fAppOutput[1]));
    int exitCode = 0;
    launcher.Wait(&exitCode);
    std::vector<::pid_t> numbers(2);
    text >> numbers[0] >> numbers[1];
    return numbers;
}

Outcome RunChild(const std::deque<std::string>& args)
{
    LauncherPosix launcher;
    Outcome run;
    LaunchResult ends = launcher.Launch(TEST_CHILD, args);
    ends.fAppInput.reset();
    run.out = ReadRest(*ends.fAppOutput[1]);
    run.result = launcher.Wait(&run.exitCode);
    return run;
}

TEST(LauncherPosix, TheChildHasTheHostsGroupOrItsOwn)
{
    const std::vector<::pid_t> shared = LaunchForGroup(LauncherPosix());
    EXPECT_EQ(shared[0], ::getpgrp());
    EXPECT_NE(shared[0], shared[1]);
    const std::vector<::pid_t> own = LaunchForGroup(LauncherPosix(LauncherPosix::Group::kOwn));
    EXPECT_GT(own[0], 0);
    EXPECT_EQ(own[0], own[1]);
}

TEST(LauncherPosix, ArgumentsArriveByteByByte)
{
    std::string every;
    for (int code = 1; code < 256; ++code)
        every += static_cast<char>(code);
    const std::deque<std::string> args{every, "", " ", "\"", "'", "\\"};
    std::deque<std::string> all = args;
    all.emplace_front("args");
    std::string expected;
    for (const std::string& arg : args)
        expected += Hex(arg) + "\n";
    EXPECT_EQ(RunChild(all).out, expected);
}

TEST(LauncherPosix, AnArgumentAboveTheSystemsLimitFailsTheStart)
{
    // The maximum size of an argument is 32 pages, including its zero byte.
    const std::string fits(131'071, 'x');
    EXPECT_EQ(RunChild({"args", fits}).out.size(), 2 * fits.size() + 1);
    LauncherPosix launcher;
    try {
        launcher.Launch(TEST_CHILD, {"args", std::string(1'000'000, 'x')});
        FAIL() << "started";
    } catch (const std::runtime_error& error) {
        EXPECT_THAT(error.what(), testing::StartsWith("posix_spawn failed: "));
        EXPECT_THAT(error.what(), testing::EndsWith(": Argument list too long"));
    }
    EXPECT_FALSE(HasChildren());
}

TEST(LauncherPosix, ManyArgumentsArrive)
{
    const std::deque<std::string> args(1000, std::string(1000, 'y'));
    std::deque<std::string> all = args;
    all.emplace_front("args");
    EXPECT_EQ(RunChild(all).out.size(), 1000U * 2001);
}

TEST(LauncherPosix, TextWithAZeroByteFailsTheStart)
{
    LauncherPosix launcher;
    EXPECT_TRUE(ThrowsRuntimeError("posix_spawn failed: /bin/p: Invalid argument",
                                   [&] { launcher.Launch(L"/bin/p", {std::string("a\0b", 3)}); }));
    EXPECT_TRUE(ThrowsRuntimeError("posix_spawn failed: /bin/p: Invalid argument",
                                   [&] { launcher.Launch(std::wstring(L"/bin/p\0q", 8), {}); }));
}

TEST(LauncherPosix, FailedStartsTellCallPathAndText)
{
    const long before = CountOpenThings();
    char script[] = "/tmp/pmutil_notexecXXXXXX";
    const PosixHandle file(::mkostemp(script, O_CLOEXEC), true);
    char foreign[] = "/tmp/pmutil_foreignXXXXXX";
    {
        PosixHandle binary(::mkostemp(foreign, O_CLOEXEC), true);
        binary.WriteAll("\x7F"
                        "ELF\x02\x02\x01",
                        7);
        ::fchmod(binary.GetHandle(), 0700);
    }
    const struct {
        std::string path;
        const char* text;
    } kRows[] = {
        {"/nonexistent/program", "No such file or directory"},
        {"/tmp", "Permission denied"},
        {script, "Permission denied"},
        {foreign, "Exec format error"},
        {"/dev/null/x", "Not a directory"},
    };
    for (const auto& row : kRows) {
        LauncherPosix launcher;
        EXPECT_TRUE(ThrowsRuntimeError("posix_spawn failed: " + row.path + ": " + row.text, [&] {
            launcher.Launch(std::wstring(row.path.begin(), row.path.end()), {});
        }));
        EXPECT_FALSE(HasChildren()) << "a zombie is left";
    }
    ::unlink(script);
    ::unlink(foreign);
    EXPECT_EQ(CountOpenThings(), before + 1);
}

TEST(LauncherPosix, PathIsPassedInUTF8)
{
    LauncherPosix launcher;
    EXPECT_TRUE(ThrowsRuntimeError(
        "posix_spawn failed: /nonexistent/\xC3\xBC\xE2\x82\xAC: No such file or directory",
        [&] { launcher.Launch(L"/nonexistent/\u00FC\u20AC", {}); }));
    EXPECT_TRUE(ThrowsRuntimeError(
        "posix_spawn failed: Invalid or incomplete multibyte or wide character",
        [&] { launcher.Launch(std::wstring(1, static_cast<wchar_t>(0xD800)), {}); }));
}

TEST(LauncherPosix, EndsAreMapped)
{
    EXPECT_EQ(RunChild({"exit", "255"}).exitCode, 255);
    const Outcome crash = RunChild({"abort"});
    EXPECT_EQ(crash.result, kEndedByCrash);
    EXPECT_EQ(crash.exitCode, -1) << "left alone";
}

TEST(LauncherPosix, KillBeforeDuringAndAfter)
{
    LauncherPosix launcher;
    launcher.Kill();
    int exitCode = -1;
    {
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"sleep", "60000"});
        boost::thread killer([&] {
            launcher.Kill();
            launcher.Kill();
        });
        EXPECT_EQ(launcher.Wait(&exitCode), kEndedByKill);
        killer.join();
    }
    EXPECT_EQ(exitCode, -1);
    launcher.Kill();
    {
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"sleep", "60000"});
        launcher.Kill();
        EXPECT_FALSE(HasChildren()) << "a killed child that nobody waits for is seen off at once";
        EXPECT_EQ(launcher.Wait(&exitCode), kEndedByKill);
    }
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "4"});
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedNormally) << "the kill is forgotten";
    EXPECT_EQ(exitCode, 4);
}

TEST(LauncherPosix, TellsWhichSignalEndedTheChild)
{
    LauncherPosix launcher;
    EXPECT_EQ(launcher.GetTermSignal(), 0) << "no child yet";
    int exitCode = -1;
    {
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"abort"});
        launcher.Wait(&exitCode);
        EXPECT_EQ(launcher.GetTermSignal(), SIGABRT);
        EXPECT_EQ(GetTerminationText(launcher), "signal 6 (Aborted)");
    }
    {
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"sleep", "60000"});
        EXPECT_EQ(GetTerminationText(launcher), "") << "that of the child before is forgotten";
        launcher.Kill();
        launcher.Wait(&exitCode);
        EXPECT_EQ(GetTerminationText(launcher), "signal 9 (Killed)");
    }
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "6"});
    launcher.Wait(&exitCode);
    EXPECT_EQ(launcher.GetTermSignal(), 0) << "a code is no signal";
    EXPECT_EQ(GetTerminationText(launcher), "");
}

TEST(LauncherPosix, ASignalWithoutADescriptionIsToldByItsNumber)
{
    LauncherPosix launcher;
    const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "kill -40 $$"});
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedByCrash);
    EXPECT_EQ(GetTerminationText(launcher), "signal 40");
}

// Allows core dumps while it exists, and puts them into a folder of its own.
class CoreDumps {
public:
    CoreDumps()
    {
        ::getrlimit(RLIMIT_CORE, &fBefore);
        const rlimit allowed{fBefore.rlim_max, fBefore.rlim_max};
        ::setrlimit(RLIMIT_CORE, &allowed);
        boost::filesystem::create_directory(fFolder);
        boost::filesystem::current_path(fFolder);
    }
    ~CoreDumps()
    {
        ::setrlimit(RLIMIT_CORE, &fBefore);
        boost::filesystem::current_path(fOldFolder);
        boost::filesystem::remove_all(fFolder);
    }
    CoreDumps(const CoreDumps&) = delete;
    CoreDumps& operator=(const CoreDumps&) = delete;

private:
    rlimit fBefore = {};
    const boost::filesystem::path fOldFolder = boost::filesystem::current_path();
    const boost::filesystem::path fFolder =
        boost::filesystem::temp_directory_path() / boost::filesystem::unique_path();
};

// Where the machine dumps cores, the system reports another kind of end.
TEST(LauncherPosix, TellsTheSignalOfAChildThatMayDumpItsCore)
{
    const CoreDumps dumps;
    LauncherPosix launcher;
    const LaunchResult ends = launcher.Launch(L"/bin/sh", {"-c", "kill -SEGV $$"});
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedByCrash);
    EXPECT_EQ(launcher.GetTermSignal(), SIGSEGV);
}

TEST(LauncherPosix, AFailedStartFreesItsMemory)
{
    const auto fail = [] {
        LauncherPosix launcher;
        EXPECT_THROW(launcher.Launch(L"/nonexistent/program", {}), std::runtime_error);
    };
    for (int run = 0; run < 3; ++run)
        fail();
    constexpr std::size_t kRuns = 50;
    const std::size_t before = ::mallinfo2().uordblks;
    for (std::size_t run = 0; run < kRuns; ++run)
        fail();
    EXPECT_LT(::mallinfo2().uordblks, before + 100 * kRuns);
}

TEST(LauncherPosix, WaitWithoutALaunchFails)
{
    LauncherPosix launcher;
    int exitCode = -1;
    EXPECT_TRUE(
        ThrowsRuntimeError("waitid failed: No child processes", [&] { launcher.Wait(&exitCode); }));
}

TEST(LauncherPosix, ChildHasItsStreamsAndNoOtherDescriptor)
{
    // A descriptor that the host forgot to protect isn't inherited either.
    const PosixHandle forgotten(::open("/dev/null", O_RDONLY), true); // NOLINT: no O_CLOEXEC
    EXPECT_THAT(RunChild({"state"}).out, testing::HasSubstr("descriptors 0 1 2\n"));
}

// The output of a child that another part of the host starts, which inherits every open descriptor.
std::string RunForeignChild()
{
    int ends[2];
    EXPECT_EQ(::pipe2(ends, O_CLOEXEC), 0);
    PosixHandle out(ends[0], true);
    PosixHandle in(ends[1], true);
    posix_spawn_file_actions_t actions;
    ::posix_spawn_file_actions_init(&actions);
    ::posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
    std::string program = boost::filesystem::path(std::wstring(TEST_CHILD)).string();
    std::string word = "pipes";
    char* argv[] = {program.data(), word.data(), nullptr};
    ::pid_t pid = 0;
    EXPECT_EQ(::posix_spawn(&pid, argv[0], &actions, nullptr, argv, ::environ), 0);
    ::posix_spawn_file_actions_destroy(&actions);
    in.Close();
    const std::string text = ReadRest(out);
    ::waitpid(pid, nullptr, 0);
    return text;
}

TEST(LauncherPosix, DescriptorsAreTheHostsFromTheirBirth)
{
    const std::string alone = RunForeignChild();
    EXPECT_THAT(alone, testing::StartsWith("pipes "));
    std::atomic<bool> done{false};
    boost::thread_group launching;
    for (int thread = 0; thread < 8; ++thread)
        launching.create_thread([&] {
            while (!done)
                RunChild({"exit", "0"});
        });
    for (int round = 0; round < 50; ++round)
        EXPECT_EQ(RunForeignChild(), alone);
    done = true;
    launching.join_all();
}

TEST(LauncherPosix, ChildHasDefaultSignals)
{
    struct sigaction ignore = {};
    struct sigaction before = {};
    ignore.sa_handler = SIG_IGN;
    ::sigaction(SIGPIPE, &ignore, &before);
    sigset_t some;
    sigset_t oldMask;
    ::sigemptyset(&some);
    ::sigaddset(&some, SIGTERM);
    ::pthread_sigmask(SIG_BLOCK, &some, &oldMask);
    const std::string out = RunChild({"state"}).out;
    ::pthread_sigmask(SIG_SETMASK, &oldMask, nullptr);
    ::sigaction(SIGPIPE, &before, nullptr);
    EXPECT_THAT(out, testing::HasSubstr("signals blocked 0 changed 0\n"));
}

TEST(LauncherPosix, HostWithClosedStandardStreamsCanLaunch)
{
    for (const int closed : {1, 2, 3}) { // the first of them, and those after it
        int kept[3];
        for (int stream = 0; stream < closed; ++stream) {
            kept[stream] = ::fcntl(stream, F_DUPFD_CLOEXEC, 10);
            ::close(stream);
        }
        const Outcome run = RunChild({"out", "fine", "exit", "3"});
        for (int stream = 0; stream < closed; ++stream) {
            if (kept[stream] < 0)
                continue;
            ::dup2(kept[stream], stream);
            ::close(kept[stream]);
        }
        EXPECT_EQ(run.out, "fine\n");
        EXPECT_EQ(run.exitCode, 3);
    }
}

int CountLoggedPipes(const RecordingLogger& recorder)
{
    int pipes = 0;
    for (const std::string& line : recorder.lines)
        pipes += MessageOf(line).rfind("childStd", 0) == 0 ? 1 : 0;
    return pipes;
}

TEST(LauncherPosix, DescriptorExhaustionAtEachStepLeavesNothing)
{
    rlimit before = {};
    ::getrlimit(RLIMIT_NOFILE, &before);
    const long used = CountOpenThings();
    const DebugValueSetter log("BINIO_LOG", 1);
    int failures = 0;
    for (int room = 0; room < 8; ++room) {
        const RecordingLogger recorder;
        // Fills the descriptor table except for `room` entries.
        rlimit narrow = before;
        narrow.rlim_cur = 256;
        ::setrlimit(RLIMIT_NOFILE, &narrow);
        std::vector<std::unique_ptr<PosixHandle>> fill;
        for (int fd = ::open("/dev/null", O_RDONLY | O_CLOEXEC); fd >= 0;
             fd = ::open("/dev/null", O_RDONLY | O_CLOEXEC))
            fill.push_back(std::make_unique<PosixHandle>(fd, true));
        fill.resize(fill.size() - static_cast<std::size_t>(room));
        try {
            LauncherPosix launcher;
            const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "0"});
            int exitCode = -1;
            EXPECT_EQ(launcher.Wait(&exitCode), kEndedNormally);
        } catch (const std::runtime_error& error) {
            ++failures;
            EXPECT_THAT(error.what(), testing::EndsWith(": Too many open files"));
        }
        fill.clear();
        ::setrlimit(RLIMIT_NOFILE, &before);
        EXPECT_EQ(CountOpenThings(), used) << "with room for " << room;
        EXPECT_FALSE(HasChildren());
        EXPECT_EQ(CountLoggedPipes(recorder), std::min(room / 2, 3)) << "with room for " << room;
    }
    EXPECT_EQ(failures, 6) << "three pipes need six places, and the child no other";
}

// Ignores SIGCHLD while it exists.
class IgnoreChildren {
public:
    explicit IgnoreChildren(int flags = 0)
    {
        struct sigaction ignore = {};
        ignore.sa_handler = flags == 0 ? SIG_IGN : SIG_DFL;
        ignore.sa_flags = flags;
        ::sigaction(SIGCHLD, &ignore, &fBefore);
    }
    ~IgnoreChildren() { ::sigaction(SIGCHLD, &fBefore, nullptr); }
    IgnoreChildren(const IgnoreChildren&) = delete;
    IgnoreChildren& operator=(const IgnoreChildren&) = delete;

private:
    struct sigaction fBefore = {};
};

TEST(LauncherPosix, HostThatIgnoresChildrenGetsAClearFailure)
{
    for (const int flags : {0, SA_NOCLDWAIT}) {
        const IgnoreChildren ignore(flags);
        LauncherPosix launcher;
        EXPECT_TRUE(ThrowsRuntimeError(
            "posix_spawn failed: /bin/p: SIGCHLD is ignored, so that no child can be waited for",
            [&] { launcher.Launch(L"/bin/p", {}); }));
    }
}

TEST(LauncherPosix, HostThatIgnoresChildrenLaterGetsAClearFailure)
{
    LauncherPosix launcher;
    LaunchResult ends = launcher.Launch(TEST_CHILD, {"echo", "exit", "3"});
    const IgnoreChildren ignore;
    ends.fAppInput.reset(); // now it ends
    int exitCode = -1;
    EXPECT_TRUE(
        ThrowsRuntimeError("waitid failed: No child processes", [&] { launcher.Wait(&exitCode); }));
    EXPECT_EQ(exitCode, -1) << "no wrong code";
}

TEST(LauncherPosix, OrphanIsSeenOffLater)
{
    LaunchResult ends;
    {
        LauncherPosix launcher;
        ends = launcher.Launch(TEST_CHILD, {"echo"});
    }
    EXPECT_TRUE(HasChildren());
    ends.fAppInput.reset(); // now it ends
    EXPECT_TRUE(Eventually([] {
        RunChild({"exit", "0"}); // a launch reaps earlier children
        return !HasChildren();
    }));
}

TEST(LauncherPosix, OneThatHasEndedIsReapedWithItsLauncher)
{
    {
        LauncherPosix launcher;
        const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "0"});
        siginfo_t info = {};
        ASSERT_EQ(::waitid(P_ALL, 0, &info, WEXITED | WNOWAIT), 0);
    }
    EXPECT_FALSE(HasChildren());
}

TEST(LauncherPosix, AnOrphanThatTheHostReapsLeavesNoDescriptor)
{
    const long before = CountOpenThings();
    LaunchResult ends;
    {
        LauncherPosix launcher;
        ends = launcher.Launch(TEST_CHILD, {"echo"});
    }
    ends = {}; // now it ends
    EXPECT_GT(::waitpid(-1, nullptr, 0), 0);
    RunChild({"exit", "0"});
    EXPECT_EQ(CountOpenThings(), before);
}

TEST(LauncherPosix, StandardOutputIsAWidePipe)
{
    LauncherPosix launcher;
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "0"});
    int exitCode = -1;
    launcher.Wait(&exitCode);
    const auto size = [](const auto& end) {
        return ::fcntl(dynamic_cast<const PosixHandle&>(*end).GetHandle(), F_GETPIPE_SZ);
    };
    EXPECT_GE(size(ends.fAppOutput[1]), size(ends.fAppOutput[2]));

    constexpr int kWide = 1 << 20;
    int own[2];
    ASSERT_EQ(::pipe2(own, O_CLOEXEC), 0);
    EXPECT_EQ(size(ends.fAppOutput[2]), ::fcntl(own[0], F_GETPIPE_SZ)) << "as any pipe";
    EXPECT_EQ(size(ends.fAppInput), ::fcntl(own[0], F_GETPIPE_SZ));
    const bool mayBeWide = ::fcntl(own[0], F_SETPIPE_SZ, kWide) >= kWide;
    ::close(own[0]);
    ::close(own[1]);
    if (!mayBeWide)
        GTEST_SKIP() << "this user gets no pipe of " << kWide << " bytes";
    EXPECT_EQ(size(ends.fAppOutput[1]), kWide);
}

TEST(LauncherPosix, BrokenInputPipeDoesNotKillTheHost)
{
    struct sigaction before = {};
    ::sigaction(SIGPIPE, nullptr, &before);
    ASSERT_EQ(before.sa_handler, SIG_DFL) << "the signal would kill";
    LauncherPosix launcher;
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"exit", "0"});
    int exitCode = -1;
    launcher.Wait(&exitCode);
    EXPECT_TRUE(
        ThrowsRuntimeError("write failed: Broken pipe", [&] { ends.fAppInput->WriteAll("x", 1); }));
    struct sigaction after = {};
    ::sigaction(SIGPIPE, nullptr, &after);
    EXPECT_EQ(after.sa_handler, SIG_DFL);
}

} // namespace
