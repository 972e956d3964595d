#include "output/linux/WriteAll.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <stdexcept>
#include <string>
#include <sys/ioctl.h>
#include <thread>
#include <unistd.h>

#include "output/Output.h"

namespace assay_host {
namespace {

std::string ReadToEnd(int descriptor)
{
    std::string text;
    char block[4096];
    for (::ssize_t count = 1; count > 0;) {
        count = ::read(descriptor, block, sizeof block);
        text.append(block, count > 0 ? static_cast<std::size_t>(count) : 0);
    }
    return text;
}

// The reader begins once the pipe is full.
TEST(WriteAll, WaitsForRoomInANonBlockingPipe)
{
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_CLOEXEC | O_NONBLOCK), 0);
    const std::string text(1 << 20, 'x');
    std::string read;
    std::thread reader([&] {
        const int size = ::fcntl(ends[0], F_GETPIPE_SZ);
        for (int filled = 0; filled < size; ::ioctl(ends[0], FIONREAD, &filled))
            std::this_thread::yield();
        ::fcntl(ends[0], F_SETFL, 0);
        read = ReadToEnd(ends[0]);
    });
    EXPECT_FALSE(WriteAll(ends[1], text));
    ::close(ends[1]);
    reader.join();
    ::close(ends[0]);
    EXPECT_EQ(read, text);
}

TEST(WriteAll, ReturnsTheSystemsError)
{
    EXPECT_EQ(WriteAll(-1, "text"), std::error_code(EBADF, std::generic_category()));
    EXPECT_FALSE(WriteAll(-1, "")) << "there is nothing to write";
    const int full = ::open("/dev/full", O_WRONLY | O_CLOEXEC);
    EXPECT_EQ(WriteAll(full, "text"), std::error_code(ENOSPC, std::generic_category()));
    ::close(full);
}

std::atomic<int> gSignals{0};

// The pipe is full, so that each signal interrupts the write before it has written a byte.
TEST(WriteAll, GoesOnAfterASignal)
{
    struct sigaction action = {};
    struct sigaction before = {};
    action.sa_handler = [](int) { ++gSignals; }; // without SA_RESTART
    ::sigaction(SIGUSR1, &action, &before);
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_CLOEXEC), 0);
    const std::string filling(static_cast<std::size_t>(::fcntl(ends[1], F_GETPIPE_SZ)), 'x');
    ASSERT_FALSE(WriteAll(ends[1], filling));
    std::atomic<bool> isOver{false};
    std::error_code error;
    std::thread writer([&] {
        error = WriteAll(ends[1], "text");
        isOver = true;
    });
    for (int shot = 0; shot < 200 && !isOver; ++shot) {
        const int count = gSignals;
        ::pthread_kill(writer.native_handle(), SIGUSR1);
        while (gSignals == count && !isOver)
            std::this_thread::yield();
    }
    EXPECT_FALSE(isOver) << "a signal ended the write";
    std::string read(filling.size() + 4, '?');
    for (std::size_t done = 0; done < read.size() && !(isOver && error);)
        done += static_cast<std::size_t>(::read(ends[0], &read[done], read.size() - done));
    writer.join();
    EXPECT_FALSE(error);
    EXPECT_EQ(read, filling + "text");
    ::close(ends[0]);
    ::close(ends[1]);
    ::sigaction(SIGUSR1, &before, nullptr);
}

// Standard output is a file of the test for as long as one call.
template <typename Call>
void WithOutput(int file, const Call& call)
{
    std::fflush(stdout);
    const int before = ::dup(STDOUT_FILENO);
    ::dup2(file, STDOUT_FILENO);
    call();
    ::dup2(before, STDOUT_FILENO);
    ::close(before);
    ::close(file);
}

TEST(StandardOutput, IsWrittenTo)
{
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_CLOEXEC), 0);
    WithOutput(ends[1], [] { OpenStandardOutput()->Write("text"); });
    EXPECT_EQ(ReadToEnd(ends[0]), "text");
    ::close(ends[0]);
}

TEST(StandardOutput, NamesItselfInItsFailures)
{
    std::string failure;
    WithOutput(::open("/dev/full", O_WRONLY | O_CLOEXEC), [&failure] {
        try {
            OpenStandardOutput()->Write("text");
        } catch (const std::runtime_error& caught) {
            failure = caught.what();
        }
    });
    EXPECT_EQ(failure, "cannot write to standard output: No space left on device");
}

} // namespace
} // namespace assay_host
