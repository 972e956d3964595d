#include "output/linux/WriteAll.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <string>
#include <sys/ioctl.h>
#include <thread>
#include <unistd.h>

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

} // namespace
} // namespace assay_host
