#include "pmutil/PosixHandle.h"

#include <atomic>
#include <cerrno>
#include <chrono>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <dirent.h>
#include <fcntl.h>
#include <memory>
#include <pthread.h>
#include <sys/ioctl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

#include "HandleChannelTests.h"

using namespace pmutil;

namespace {

struct Posix {
    using Channel = PosixHandle;
    using Calls = PosixCalls;

    static constexpr char kOpenFailed[] = "open failed: No such file or directory";
    static constexpr char kReadFailed[] = "read failed: Bad file descriptor";
    static constexpr char kWriteFailed[] = "write failed: Bad file descriptor";
    static constexpr char kBrokenPipe[] = "write failed: Broken pipe";
    static constexpr char kSeekFailed[] = "lseek failed: Invalid argument";
    static constexpr char kSetEndFailed[] = "ftruncate failed: Invalid argument";

    static void MakePipe(int& readEnd, int& writeEnd)
    {
        int ends[2];
        ASSERT_EQ(::pipe2(ends, O_CLOEXEC), 0);
        readEnd = ends[0];
        writeEnd = ends[1];
    }

    static bool Exists(const std::string& path) { return ::access(path.c_str(), F_OK) == 0; }
    static std::string PathOf(int handle)
    {
        char path[PATH_MAX] = {};
        const std::string link = "/proc/self/fd/" + std::to_string(handle);
        EXPECT_GT(::readlink(link.c_str(), path, sizeof path - 1), 0);
        return path;
    }
    static bool MakeSparse(PosixHandle&) { return true; }
    static std::string ClosingText(int handle)
    {
        return "PosixHandle::Reset closing " + std::to_string(handle) + "\n";
    }
};

INSTANTIATE_TYPED_TEST_SUITE_P(Posix, HandleChannelTest, Posix);

int CountDescriptors()
{
    int count = 0;
    DIR* const directory = ::opendir("/proc/self/fd");
    while (::readdir(directory) != nullptr)
        ++count;
    ::closedir(directory);
    return count;
}

TEST(PosixHandle, TruncatingNeedsTheRightToWrite)
{
    auto file = PosixHandle::MakeTemporaryFile("tst");
    file->WriteAll("abcdef", 6);
    const std::string path = "/proc/self/fd/" + std::to_string(file->GetHandle());
    EXPECT_THROW(PosixHandle::OpenFile(path, kOpenRead, kTruncateExisting, false),
                 std::runtime_error);
    file->SeekEnd();
    EXPECT_EQ(file->Tell(), 6U);
}

TEST(PosixHandle, LeavesNoDescriptorBehind)
{
    const int before = CountDescriptors();
    for (int round = 0; round < 20; ++round) {
        auto file = PosixHandle::MakeTemporaryFile("tst");
        EXPECT_EQ(CountDescriptors(), before + 1);
        EXPECT_THROW(PosixHandle::OpenFile("/nonexistent/file", 1, 0, false), std::runtime_error);
        EXPECT_THROW(PosixHandle::OpenFile("/", 1, 0, false), std::runtime_error);
    }
    EXPECT_EQ(CountDescriptors(), before);
}

TEST(PosixHandle, DescriptorsCloseOnExec)
{
    const auto file = PosixHandle::MakeTemporaryFile("tst");
    EXPECT_EQ(::fcntl(file->GetHandle(), F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
}

TEST(PosixHandle, DirectoryCannotBeOpened)
{
    EXPECT_TRUE(ThrowsRuntimeError("open failed: Is a directory",
                                   [] { PosixHandle::OpenFile("/", 1, 0, false); }));
}

TEST(PosixHandle, PathWithAZeroByteOpensNothing)
{
    EXPECT_TRUE(ThrowsRuntimeError("open failed: Invalid argument", [] {
        PosixHandle::OpenFile(std::string("/dev/null\0x", 11), 1, 0, false);
    }));
}

TEST(PosixHandle, OpenTellsTheSystemsText)
{
    EXPECT_TRUE(ThrowsRuntimeError("open failed: Not a directory",
                                   [] { PosixHandle::OpenFile("/dev/null/x", 1, 0, false); }));
}

TEST(PosixHandle, BareHandleWithoutAFileFailsWithTheCallsName)
{
    PosixHandle channel(1'000'000, false);
    char byte = 0;
    EXPECT_TRUE(ThrowsRuntimeError("read failed: Bad file descriptor",
                                   [&] { channel.ReadSome(&byte, 1); }));
    EXPECT_TRUE(ThrowsRuntimeError("lseek failed: Bad file descriptor", [&] { channel.SetEOF(); }));
    EXPECT_TRUE(ThrowsRuntimeError("lseek failed: Bad file descriptor", [&] { channel.Tell(); }));
}

TEST(PosixHandle, PipeCannotSeek)
{
    int readEnd = -1;
    int writeEnd = -1;
    Posix::MakePipe(readEnd, writeEnd);
    PosixHandle reader(readEnd, true);
    const PosixHandle writer(writeEnd, true);
    EXPECT_TRUE(ThrowsRuntimeError("lseek failed: Illegal seek", [&] { reader.Tell(); }));
    EXPECT_TRUE(ThrowsRuntimeError("lseek failed: Illegal seek", [&] { reader.SeekEnd(); }));
}

TEST(PosixHandle, RequestsAboveTheSystemsLimitComeBackShort)
{
#ifdef __SANITIZE_THREAD__
    GTEST_SKIP() << "the thread sanitizer's shadow of the 2 GiB that are read takes all memory";
#endif
    // Reads from /dev/zero into address space without memory: the read stops where memory ends.
    constexpr std::uint64_t kMaxPerCall = 0x7FFFF000;
    constexpr std::uint64_t kAsked = (1ULL << 33) + 5;
    auto null = PosixHandle::OpenFile("/dev/null", kOpenWrite, kOpenExisting, false);
    void* const space =
        ::mmap(nullptr, kAsked, PROT_READ, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    ASSERT_NE(space, MAP_FAILED);
    EXPECT_EQ(null->WriteSome(space, kAsked), kMaxPerCall);
    null->WriteAll(space, kAsked);
    EXPECT_EQ(null->WriteSome(space, UINT64_MAX), kMaxPerCall)
        << "no size is taken for a negative one";
    ::munmap(space, kAsked);
}

void OnSignal(int /*number*/) {}

TEST(PosixHandle, InterruptedCallsAreRepeated)
{
    struct sigaction action = {};
    struct sigaction before = {};
    action.sa_handler = OnSignal; // without SA_RESTART
    ::sigaction(SIGUSR1, &action, &before);
    int readEnd = -1;
    int writeEnd = -1;
    Posix::MakePipe(readEnd, writeEnd);
    PosixHandle reader(readEnd, true);
    PosixHandle writer(writeEnd, true);
    std::atomic<bool> done{false};
    std::string got(2, '?');
    std::string failure;
    std::thread thread([&] {
        try {
            reader.ReadAll(got.data(), 2);
        } catch (const std::exception& error) {
            failure = error.what();
        }
        done = true;
    });
    for (int shot = 0; shot < 20; ++shot) {
        ::pthread_kill(thread.native_handle(), SIGUSR1);
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    EXPECT_FALSE(done);
    writer.WriteAll("ok", 2);
    thread.join();
    EXPECT_EQ(failure, "");
    EXPECT_EQ(got, "ok");
    ::sigaction(SIGUSR1, &before, nullptr);
}

class BrokenPipe : public testing::Test {
protected:
    void SetUp() override
    {
        Posix::MakePipe(fReadEnd, fWriteEnd);
        ::close(fReadEnd);
    }
    void TearDown() override { ::close(fWriteEnd); }

    void ExpectFailedWrite() const
    {
        PosixHandle writer(fWriteEnd, false);
        EXPECT_TRUE(
            ThrowsRuntimeError("write failed: Broken pipe", [&] { writer.WriteSome("x", 1); }));
    }

    static bool IsPipeSignalPending()
    {
        sigset_t pending;
        ::sigpending(&pending);
        return ::sigismember(&pending, SIGPIPE) == 1;
    }

    int fReadEnd = -1;
    int fWriteEnd = -1;
};

int gPipeSignals = 0;

TEST_F(BrokenPipe, RaisesNoSignalAndLeavesTheDispositionAlone)
{
    struct sigaction counting = {};
    struct sigaction before = {};
    struct sigaction after = {};
    counting.sa_handler = [](int) { ++gPipeSignals; };
    ::sigaction(SIGPIPE, &counting, &before);
    gPipeSignals = 0;
    ExpectFailedWrite();
    EXPECT_EQ(gPipeSignals, 0);
    ::sigaction(SIGPIPE, &before, &after);
    EXPECT_EQ(after.sa_handler, counting.sa_handler);
    sigset_t mask;
    ::pthread_sigmask(SIG_BLOCK, nullptr, &mask);
    EXPECT_EQ(::sigismember(&mask, SIGPIPE), 0) << "the mask is as before";
}

TEST_F(BrokenPipe, KeepsASignalThatWasPendingBefore)
{
    sigset_t pipe;
    sigset_t before;
    ::sigemptyset(&pipe);
    ::sigaddset(&pipe, SIGPIPE);
    ::pthread_sigmask(SIG_BLOCK, &pipe, &before);
    ExpectFailedWrite();
    EXPECT_FALSE(IsPipeSignalPending());
    ::pthread_kill(::pthread_self(), SIGPIPE);
    ExpectFailedWrite();
    EXPECT_TRUE(IsPipeSignalPending());
    const timespec noWait{};
    EXPECT_EQ(::sigtimedwait(&pipe, nullptr, &noWait), SIGPIPE);
    ::pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

TEST(PosixHandle, ReaderThatGoesInTheMiddleOfAWriteRaisesNoSignal)
{
    struct sigaction counting = {};
    struct sigaction before = {};
    counting.sa_handler = [](int) { ++gPipeSignals; };
    ::sigaction(SIGPIPE, &counting, &before);
    gPipeSignals = 0;
    int readEnd = -1;
    int writeEnd = -1;
    Posix::MakePipe(readEnd, writeEnd);
    PosixHandle writer(writeEnd, true);
    std::thread leaver([readEnd] {
        for (int filled = 0; filled < 4096;) {
            ::ioctl(readEnd, FIONREAD, &filled);
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        ::close(readEnd);
    });
    const std::string text(1 << 20, 'x');
    EXPECT_LT(writer.WriteSome(text.data(), text.size()), text.size());
    leaver.join();
    EXPECT_TRUE(ThrowsRuntimeError("write failed: Broken pipe", [&] { writer.WriteSome("x", 1); }));
    EXPECT_EQ(gPipeSignals, 0);
    ::sigaction(SIGPIPE, &before, nullptr);
}

TEST(PosixHandle, TemporaryDirectoryFollowsTheEnvironment)
{
    const char* const old = ::getenv("TMPDIR");
    const std::string before = old != nullptr ? old : "";
    ::unsetenv("TMPDIR");
    EXPECT_EQ(PosixHandle::GetTemporaryDirectory(), "/tmp");
    ::setenv("TMPDIR", "", 1);
    EXPECT_EQ(PosixHandle::GetTemporaryDirectory(), "/tmp");
    ::setenv("TMPDIR", "/nonexistent", 1);
    EXPECT_EQ(PosixHandle::GetTemporaryDirectory(), "/nonexistent");
    EXPECT_TRUE(ThrowsRuntimeError("mkostemp failed: No such file or directory",
                                   [] { PosixHandle::MakeTemporaryFile("tst"); }));
    if (old != nullptr)
        ::setenv("TMPDIR", before.c_str(), 1);
    else
        ::unsetenv("TMPDIR");
}

TEST(PosixHandle, TemporaryFilesAreTheUsersOwn)
{
    const auto file = PosixHandle::MakeTemporaryFile("tst");
    struct stat status = {};
    ASSERT_EQ(::fstat(file->GetHandle(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
}

TEST(PosixHandle, OtherNewFilesHaveAllRightsThatTheProcessLeaves)
{
    const std::string path =
        PosixHandle::GetTemporaryDirectory() + "/rights" + std::to_string(::getpid());
    const ::mode_t before = ::umask(0);
    const struct {
        ::mode_t fMask;
        ::mode_t fMode;
    } kRows[] = {{0, 0666}, {027, 0640}, {077, 0600}};
    for (const auto& row : kRows) {
        ::umask(row.fMask);
        const auto file = PosixHandle::OpenFile(path, kOpenWrite, kOpenAlways, false);
        struct stat status = {};
        ASSERT_EQ(::fstat(file->GetHandle(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777U, row.fMode);
        EXPECT_EQ(::fcntl(file->GetHandle(), F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
        ::unlink(path.c_str());
    }
    ::umask(before);
}

TEST(PosixHandle, StandardChannelsStandOverTheFirstThreeDescriptors)
{
    EXPECT_EQ(dynamic_cast<PosixHandle&>(PosixHandle::GetStandardInput()).GetHandle(), 0);
    EXPECT_EQ(dynamic_cast<PosixHandle&>(PosixHandle::GetStandardOutput()).GetHandle(), 1);
    EXPECT_EQ(dynamic_cast<PosixHandle&>(PosixHandle::GetStandardError()).GetHandle(), 2);
}

} // namespace
