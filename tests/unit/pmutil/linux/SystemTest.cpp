#include "pmutil/System.h"

#include <fcntl.h>
#include <pwd.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <ctime>
#include <fstream>
#include <stdexcept>

#include <boost/thread/thread.hpp>
#include <gmock/gmock.h>

#include "FreshProcess.h"
#include "TempFolder.h"
#include "all/PathCodecvt.h"
#include "pmutil/LogSinks.h"
#include "pmutil/Threads.h"

namespace pmutil {
namespace {

using testing::EndsWith;
using testing::StartsWith;

DebugValue gOn{"SystemTest.on", 1};

// A stream whose reader can be opened and closed.
class FifoTest : public testing::Test {
protected:
    void SetUp() override
    {
        fOldHandler = std::signal(SIGPIPE, SIG_IGN);
        ASSERT_EQ(mkfifo(fPath.c_str(), 0600), 0);
        OpenReader();
        fWriter = std::fopen(fPath.c_str(), "w");
        ASSERT_NE(fWriter, nullptr);
    }
    void TearDown() override
    {
        if (fWriter != nullptr)
            std::fclose(fWriter);
        CloseReader();
        std::signal(SIGPIPE, fOldHandler);
    }

    void OpenReader()
    {
        fReader = open(fPath.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
        ASSERT_GE(fReader, 0);
    }
    void CloseReader()
    {
        if (fReader >= 0)
            close(fReader);
        fReader = -1;
    }
    std::string Read() const
    {
        char bytes[4096];
        const ssize_t size = read(fReader, bytes, sizeof(bytes));
        return size > 0 ? std::string(bytes, static_cast<std::size_t>(size)) : std::string();
    }

    TempFolder fFolder;
    std::string fPath = fFolder.File("fifo");
    std::FILE* fWriter = nullptr;
    int fReader = -1;
    void (*fOldHandler)(int) = SIG_DFL;
};

TEST_F(FifoTest, DiscardedLineNeverTurnsUpAndALaterOneDoes)
{
    ASSERT_GE(std::fputs("one\n", fWriter), 0);
    ASSERT_EQ(std::fflush(fWriter), 0);
    EXPECT_EQ(Read(), "one\n");
    CloseReader();
    ASSERT_GE(std::fputs("lost\n", fWriter), 0);
    ASSERT_NE(std::fflush(fWriter), 0);
    ASSERT_NE(std::ferror(fWriter), 0);
    DiscardUnwritten(fWriter);
    EXPECT_EQ(std::ferror(fWriter), 0);
    OpenReader();
    ASSERT_GE(std::fputs("later\n", fWriter), 0);
    ASSERT_EQ(std::fflush(fWriter), 0);
    EXPECT_EQ(Read(), "later\n");
    ASSERT_EQ(std::fclose(fWriter), 0);
    fWriter = nullptr;
    EXPECT_EQ(Read(), "");
}

TEST_F(FifoTest, LogLineThatIsLostNeverTurnsUpAndALaterOneDoes)
{
    InitLogging();
    PMStdioLogger logger(fWriter);
    CloseReader();
    PM_LOG(gOn, "lost");
    OpenReader();
    ASSERT_GE(std::fputs("report\n", fWriter), 0);
    PM_LOG(gOn, "later");
    const std::string text = Read();
    EXPECT_THAT(text, StartsWith("report\n00001."));
    EXPECT_THAT(text, EndsWith("] later\n"));
}

// Each test runs in a process of its own: the settings can't be undone.

rlimit GetLimit(__rlimit_resource resource)
{
    rlimit limit{};
    getrlimit(resource, &limit);
    return limit;
}

bool IsIgnored(int number)
{
    struct sigaction action = {};
    return sigaction(number, nullptr, &action) == 0 && action.sa_handler == SIG_IGN;
}

void BlockAllSignals()
{
    sigset_t all;
    sigfillset(&all);
    pthread_sigmask(SIG_BLOCK, &all, nullptr);
}

TEST(PrepareConsoleProcessDeathTest, LeavesNoCoreDump)
{
    ExpectInFreshProcess([] {
        // Core dumps may be disabled already: enable them first.
        const rlimit unlimited{RLIM_INFINITY, RLIM_INFINITY};
        if (setrlimit(RLIMIT_CORE, &unlimited) != 0) {
            const rlim_t most = GetLimit(RLIMIT_CORE).rlim_max;
            const rlimit allowed{most, most};
            REQUIRE_SO(setrlimit(RLIMIT_CORE, &allowed) == 0);
        }
        const rlim_t hardBefore = GetLimit(RLIMIT_CORE).rlim_max;
        PrepareConsoleProcess();
        REQUIRE_SO(GetLimit(RLIMIT_CORE).rlim_cur == 1);
        REQUIRE_SO(GetLimit(RLIMIT_CORE).rlim_max >= hardBefore);
    });
}

TEST(PrepareConsoleProcessDeathTest, LeavesAHardCoreLimitOfZeroThatItMayNotRaise)
{
    ExpectInFreshProcess([] {
        constexpr uid_t kNobody = 65534;
        const rlimit none{0, 0};
        REQUIRE_SO(setrlimit(RLIMIT_CORE, &none) == 0);
        REQUIRE_SO(geteuid() != 0 || seteuid(kNobody) == 0);
        PrepareConsoleProcess();
        REQUIRE_SO(GetLimit(RLIMIT_CORE).rlim_cur == 0);
        REQUIRE_SO(GetLimit(RLIMIT_CORE).rlim_max == 0);
    });
}

TEST(PrepareConsoleProcessDeathTest, RaisesAHardCoreLimitOfZeroIfItMay)
{
    ExpectInFreshProcess([] {
        const rlimit none{0, 0};
        REQUIRE_SO(setrlimit(RLIMIT_CORE, &none) == 0);
        const rlimit one{1, 1};
        const bool mayRaise = setrlimit(RLIMIT_CORE, &one) == 0;
        REQUIRE_SO(!mayRaise || setrlimit(RLIMIT_CORE, &none) == 0);
        PrepareConsoleProcess();
        REQUIRE_SO(GetLimit(RLIMIT_CORE).rlim_cur == (mayRaise ? 1 : 0));
        REQUIRE_SO(GetLimit(RLIMIT_CORE).rlim_max == (mayRaise ? 1 : 0));
    });
}

TEST(PrepareConsoleProcessDeathTest, LetsAWriteToAClosedPipeFail)
{
    ExpectInFreshProcess([] {
        PrepareConsoleProcess();
        int ends[2];
        REQUIRE_SO(pipe(ends) == 0 && close(ends[0]) == 0);
        REQUIRE_SO(write(ends[1], "x", 1) == -1 && errno == EPIPE);
    });
}

TEST(PrepareConsoleProcessDeathTest, LetsAWriteBeyondTheFileSizeLimitFail)
{
    ExpectInFreshProcess([] {
        PrepareConsoleProcess();
        const int file = fileno(std::tmpfile());
        const rlimit one{1, GetLimit(RLIMIT_FSIZE).rlim_max};
        REQUIRE_SO(setrlimit(RLIMIT_FSIZE, &one) == 0);
        REQUIRE_SO(write(file, "ab", 2) == 1);
        REQUIRE_SO(write(file, "b", 1) == -1 && errno == EFBIG);
    });
}

TEST(PrepareConsoleProcessDeathTest, UndoesInheritedSignalSettings)
{
    ExpectInFreshProcess([] {
        for (const int number : {SIGABRT, SIGCHLD, SIGHUP, SIGSEGV})
            std::signal(number, SIG_IGN);
        BlockAllSignals();
        PrepareConsoleProcess();
        sigset_t blocked;
        pthread_sigmask(SIG_BLOCK, nullptr, &blocked);
        REQUIRE_SO(sigisemptyset(&blocked) == 1);
        for (const int number : {SIGABRT, SIGCHLD, SIGSEGV})
            REQUIRE_SO(!IsIgnored(number));
        for (const int number : {SIGHUP, SIGPIPE, SIGTTOU, SIGXFSZ})
            REQUIRE_SO(IsIgnored(number));
    });
}

TEST(PrepareConsoleProcessDeathTest, LetsACrashSignalThatWasIgnoredEndTheProcess)
{
    testing::GTEST_FLAG(death_test_style) = "threadsafe";
    const auto crash = [] {
        std::signal(SIGBUS, SIG_IGN);
        BlockAllSignals();
        PrepareConsoleProcess();
        kill(getpid(), SIGBUS);
        std::_Exit(0);
    };
    EXPECT_EXIT(crash(), testing::KilledBySignal(SIGBUS), "^$");
}

TEST(PrepareConsoleProcessDeathTest, OccupiesClosedStreamsWithWhatFails)
{
    ExpectInFreshProcess([] {
        for (const int stream : {STDIN_FILENO, STDOUT_FILENO})
            close(stream);
        PrepareConsoleProcess();
        REQUIRE_SO(open("/dev/null", O_RDWR | O_CLOEXEC) > STDERR_FILENO);
        char byte = 0;
        for (const int stream : {STDIN_FILENO, STDOUT_FILENO}) {
            REQUIRE_SO(read(stream, &byte, 1) == -1 && errno == EBADF);
            REQUIRE_SO(write(stream, &byte, 1) == -1 && errno == EBADF);
        }
    });
}

TEST(PrepareConsoleProcessDeathTest, OccupiesAClosedStandardErrorAndNothingElse)
{
    ExpectInFreshProcess([] {
        const int next = dup(STDIN_FILENO);
        close(next);
        PrepareConsoleProcess();
        REQUIRE_SO(dup(STDIN_FILENO) == next);
        close(STDERR_FILENO);
        PrepareConsoleProcess();
        REQUIRE_SO(fcntl(STDERR_FILENO, F_GETFL) >= 0);
    });
}

TEST(SystemTest, ClockIsUniversalTimeSince1970)
{
    timespec before{};
    clock_gettime(CLOCK_REALTIME, &before);
    const double now = GetClockSeconds();
    timespec after{};
    clock_gettime(CLOCK_REALTIME, &after);
    EXPECT_GE(now, static_cast<double>(before.tv_sec));
    EXPECT_LE(now, static_cast<double>(after.tv_sec) + 1);
    EXPECT_GE(GetClockSeconds(), now);
}

TEST(SystemTest, ThreadIDTextIsTheKernelsIDInHexadecimal)
{
    const auto check = [] {
        char text[32];
        std::snprintf(text, sizeof(text), "%lx", syscall(SYS_gettid));
        EXPECT_EQ(GetCurrentThreadIDString(), text);
        EXPECT_EQ(GetCurrentThreadIDString(), text);
    };
    check();
    boost::thread thread(check);
    thread.join();
}

TEST(SystemTest, ForkedChildKnowsItsOwnThreadID)
{
    ASSERT_EQ(GetCurrentThreadNumber(), static_cast<std::uint64_t>(getpid()));
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0)
        _exit(GetCurrentThreadNumber() == static_cast<std::uint64_t>(getpid()) ? 0 : 1);
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
}

TEST(SystemTest, ThreadNameIsShownToTheSystemsTools)
{
    boost::thread thread([] {
        SetCurrentThreadName("a-name-longer-than-the-kernel-keeps");
        char name[64] = {};
        ASSERT_EQ(pthread_getname_np(pthread_self(), name, sizeof(name)), 0);
        EXPECT_STREQ(name, "a-name-longer-t");
    });
    thread.join();
}

TEST(SystemTest, NamingTheFirstThreadDoesNotRenameTheProcess)
{
    const std::string before = ReadWhole("/proc/self/comm");
    ShowThreadName("other");
    EXPECT_EQ(ReadWhole("/proc/self/comm"), before);
}

TEST(SystemTest, PhysicalMemoryAgreesWithTheKernel)
{
    unsigned long long kilobytes = 0;
    ASSERT_EQ(std::sscanf(ReadWhole("/proc/meminfo").c_str(), "MemTotal: %llu", &kilobytes), 1);
    EXPECT_EQ(GetPhysicalMemoryBytes() / 1024, kilobytes);
}

class CurrentDirectoryTest : public testing::Test {
protected:
    void SetUp() override { fOld = open(".", O_RDONLY | O_DIRECTORY | O_CLOEXEC); }
    void TearDown() override
    {
        EXPECT_EQ(fchdir(fOld), 0);
        close(fOld);
    }
    int fOld = -1;
};

TEST_F(CurrentDirectoryTest, IsTheProcesssOwn)
{
    const TempFolder folder;
    const auto inner = folder.Path() / "\xC3\xA9t\xC3\xA9";
    boost::filesystem::create_directory(inner);
    ASSERT_EQ(chdir(inner.c_str()), 0);
    EXPECT_THAT(GetCurrentDirectoryPath(), EndsWith(L"/\u00e9t\u00e9"));
}

TEST_F(CurrentDirectoryTest, ThatIsGoneThrows)
{
    const auto gone = std::make_unique<TempFolder>();
    ASSERT_EQ(chdir(gone->Path().c_str()), 0);
    ASSERT_EQ(rmdir(gone->Path().c_str()), 0);
    try {
        GetCurrentDirectoryPath();
        FAIL() << "nothing thrown";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "GetCurrentDirectoryW failed");
    }
}

TEST(SystemTest, DesktopFolderIsTheOneOfThePasswordDatabase)
{
    const passwd* const user = getpwuid(getuid()); // NOLINT(concurrency-mt-unsafe)
    if (user == nullptr || user->pw_dir == nullptr || *user->pw_dir == '\0')
        GTEST_SKIP() << "the user has no home folder";
    const std::string home = user->pw_dir;
    std::ifstream file(home + "/.config/user-dirs.dirs");
    if (file)
        GTEST_SKIP() << "the user has named another folder";
    EXPECT_EQ(GetDesktopFolder(), boost::filesystem::path(home + "/Desktop").wstring());
}

TEST(SystemTest, DesktopFolderIsNoneOfAUserWhoIsNotInThePasswordDatabase)
{
    constexpr uid_t kUnknown = 4'242'424;
    if (geteuid() != 0 || getpwuid(kUnknown) != nullptr) // NOLINT(concurrency-mt-unsafe)
        GTEST_SKIP() << "only root can become a user who isn't there";
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0)
        _exit(setuid(kUnknown) == 0 && GetDesktopFolder().empty() ? 0 : 1);
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
}

TEST(SystemTest, DesktopFolderAsksNoEnvironment)
{
    const std::wstring before = GetDesktopFolder();
    const char* const home = std::getenv("HOME"); // NOLINT(concurrency-mt-unsafe)
    const std::string oldHome = home != nullptr ? home : "";
    setenv("HOME", "/nowhere", 1);            // NOLINT(concurrency-mt-unsafe)
    setenv("XDG_CONFIG_HOME", "/nowhere", 1); // NOLINT(concurrency-mt-unsafe)
    EXPECT_EQ(GetDesktopFolder(), before);
    unsetenv("XDG_CONFIG_HOME"); // NOLINT(concurrency-mt-unsafe)
    if (home != nullptr)
        setenv("HOME", oldHome.c_str(), 1); // NOLINT(concurrency-mt-unsafe)
    else
        unsetenv("HOME"); // NOLINT(concurrency-mt-unsafe)
}

TEST(SystemTest, SharedAppendAppendsAndGivesNullForWhatCannotBeOpened)
{
    const TempFolder folder;
    const std::string path = folder.File("log");
    for (const char* text : {"one\n", "two\n"}) {
        std::FILE* const file = OpenSharedAppend(path);
        ASSERT_NE(file, nullptr);
        std::fputs(text, file);
        std::fclose(file);
    }
    EXPECT_EQ(ReadWhole(path), "one\ntwo\n");
    EXPECT_EQ(OpenSharedAppend(folder.File("missing/log")), nullptr);
}

TEST(SystemTest, APathThatHasNoNarrowFormIsRejectedAsAWhole)
{
    for (const wchar_t bad :
         {wchar_t{0xD800}, wchar_t{0xDFFF}, wchar_t{0x110000}, static_cast<wchar_t>(-1)}) {
        const std::wstring path = {L'a', bad, L'b'};
        char bytes[32] = {};
        std::mbstate_t state = {};
        const wchar_t* next = nullptr;
        char* end = nullptr;
        EXPECT_EQ(GetPathCodecvt().out(state, path.data(), path.data() + path.size(), next, bytes,
                                       bytes + sizeof bytes, end),
                  std::codecvt_base::error);
        EXPECT_EQ(next, path.data());
        EXPECT_EQ(end, bytes);
    }
    for (const wchar_t good : {wchar_t{0xD7FF}, wchar_t{0xE000}, wchar_t{0x10FFFF}}) {
        const std::wstring path(1, good);
        char bytes[32] = {};
        std::mbstate_t state = {};
        const wchar_t* next = nullptr;
        char* end = nullptr;
        EXPECT_EQ(GetPathCodecvt().out(state, path.data(), path.data() + path.size(), next, bytes,
                                       bytes + sizeof bytes, end),
                  std::codecvt_base::ok);
        EXPECT_GT(end, bytes + 2);
    }
}

TEST(PMFileLoggerOnLinuxTest, PathThatHasNoNarrowFormRaisesInWrite)
{
    const std::wstring folder(1, static_cast<wchar_t>(0xD800));
    PMFileLogger logger(folder, "log.txt");
    try {
        logger.WriteText("x", 1);
        FAIL() << "nothing thrown";
    } catch (const boost::system::system_error& error) {
        EXPECT_THAT(error.what(), StartsWith("boost::filesystem::path codecvt to string"));
    }
}

} // namespace
} // namespace pmutil
