#include "bugreport/KernelLog.h"

#include <algorithm>
#include <cerrno>
#include <deque>
#include <fstream>
#include <string>
#include <vector>

#include <boost/filesystem/operations.hpp>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "support/OpenThings.h"

namespace {

struct Read {
    int fError;
    std::string fBytes;
};

// What the next reads return; without any, they are those of the system.
std::deque<Read>& GetReads()
{
    static std::deque<Read> reads;
    return reads;
}

} // namespace

// Called instead of that of the C library.
extern "C" ::ssize_t read(int file, void* bytes, std::size_t size)
{
    if (GetReads().empty())
        return ::syscall(SYS_read, file, bytes, size);
    const Read next = GetReads().front();
    GetReads().pop_front();
    errno = next.fError;
    std::copy_n(next.fBytes.data(), std::min(size, next.fBytes.size()), static_cast<char*>(bytes));
    return next.fError != 0 ? -1 : static_cast<::ssize_t>(std::min(size, next.fBytes.size()));
}

namespace assay_host {
namespace {

namespace fs = boost::filesystem;

class KernelLogTest : public testing::Test {
protected:
    KernelLogTest() { fs::create_directory(fFolder); }
    ~KernelLogTest() override { fs::remove_all(fFolder); }

    std::string Write(const char* name, const std::string& text, fs::perms permissions)
    {
        const fs::path path = fFolder / name;
        std::ofstream(path.native()) << text;
        fs::permissions(path, permissions);
        return path.native();
    }

    std::string WriteProgram(const std::string& body)
    {
        return Write("program", "#!/bin/sh\n" + body, fs::owner_all);
    }

    const fs::path fFolder = fs::temp_directory_path() / fs::unique_path("kernel-log-%%%%%%%%");
};

TEST_F(KernelLogTest, IsReadFromTheDevice)
{
    KernelLogSource source;
    source.fDevice = Write("kmsg", "4,7,1000002,-;[drm] x\n", fs::owner_read | fs::owner_write);
    source.fProgram = "/no/such/program";
    const KernelLog log = ReadKernelLog(source);
    EXPECT_EQ(log.fReason, "");
    EXPECT_EQ(log.fLines, std::vector<std::string>{"[    1.000002] [drm] x"});
}

TEST_F(KernelLogTest, ReadsOnAfterAnInterruptAndALostRecord)
{
    const KernelLogSource source = {Write("kmsg", "", fs::owner_read), "/no/such/program", 60};
    GetReads() = {
        {0, "4,1,1,-;drm 1\n"}, {EPIPE, ""}, {0, "4,2,2,-;drm 2\n"}, {0, "no record"}, {EINTR, ""},
        {0, "4,3,3,-;drm 3\n"}, {EAGAIN, ""}};
    const KernelLog log = ReadKernelLog(source);
    EXPECT_EQ(log.fReason, "");
    EXPECT_EQ(log.fLines, (std::vector<std::string>{"[    0.000001] drm 1", "[    0.000002] drm 2",
                                                    "[    0.000003] drm 3"}));
    EXPECT_TRUE(GetReads().empty());
}

TEST_F(KernelLogTest, AReadThatFailsIsItsReason)
{
    const std::string device = Write("kmsg", "", fs::owner_read);
    GetReads() = {{0, "4,1,1,-;drm 1\n"}, {EIO, ""}};
    const KernelLog log = ReadKernelLog({device, "no-such-program", 60});
    EXPECT_EQ(log.fReason, device + ": Input/output error; no-such-program is not installed");
    EXPECT_TRUE(log.fLines.empty());
}

// A record is at most as long as the kernel makes one.
TEST_F(KernelLogTest, ReadsTheLongestRecord)
{
    const std::string prefix = "4,1,1,-;drm";
    for (const std::size_t size : {8191U, 8192U, 8193U}) {
        GetReads() = {{0, prefix + std::string(size - prefix.size(), 'x')}, {EAGAIN, ""}};
        const KernelLog log = ReadKernelLog({Write("kmsg", "", fs::owner_read), "none", 60});
        ASSERT_EQ(log.fLines.size(), 1U);
        EXPECT_EQ(log.fLines[0].size(), std::min<std::size_t>(size, 8192) - prefix.size() +
                                            std::string("[    0.000001] drm").size());
        fs::remove(fFolder / "kmsg");
    }
}

// Nobody writes to this one.
TEST_F(KernelLogTest, WaitsForNothing)
{
    const std::string device = (fFolder / "fifo").native();
    ASSERT_EQ(::mkfifo(device.c_str(), 0600), 0);
    const KernelLog log = ReadKernelLog({device, "/no/such/program", 60});
    EXPECT_EQ(log.fReason, "");
    EXPECT_TRUE(log.fLines.empty());
}

TEST_F(KernelLogTest, LeavesNothingOpen)
{
    const KernelLogSource source = {Write("kmsg", "4,7,2,-;drm", fs::owner_read), "none", 60};
    const long before = CountOpenThings();
    ReadKernelLog(source);
    EXPECT_EQ(CountOpenThings(), before);
}

TEST_F(KernelLogTest, HasUsualSources)
{
    const KernelLogSource source;
    EXPECT_EQ(source.fDevice, "/dev/kmsg");
    EXPECT_EQ(source.fProgram, "journalctl");
    EXPECT_EQ(source.fTimeoutSeconds, 10);
}

TEST_F(KernelLogTest, TheProgramIsAskedForTheMessagesSinceTheStart)
{
    const KernelLog log =
        ReadKernelLog({"/no/such/device", WriteProgram("echo \"drm $*\"; echo gpu"), 60});
    EXPECT_EQ(log.fReason, "");
    EXPECT_EQ(log.fLines,
              (std::vector<std::string>{
                  "drm --dmesg --boot --no-pager --quiet --output=short-monotonic", "gpu"}));
}

TEST_F(KernelLogTest, AProgramThatFailsIsNotBelieved)
{
    const std::string device = "/no/such/device: No such file or directory; ";
    const struct {
        const char* fBody;
        const char* fReason;
        double fTimeout;
    } programs[] = {
        {"echo drm; exit 1", "status 1", 60},
        {"echo drm; exit 255", "status 255", 60},
        {"echo drm; echo one >&2; echo two >&2; exit 3", "one", 60},
        {"echo drm; kill -KILL $$", "no messages", 60},
        {"echo why >&2", "why", 60},
        {"echo drm; echo why >&2; exec sleep 600000", "no end within its time", 0.01},
    };
    for (const auto& program : programs) {
        const std::string path = WriteProgram(program.fBody);
        const KernelLog log = ReadKernelLog({"/no/such/device", path, program.fTimeout});
        EXPECT_EQ(log.fReason, device + path + ": " + program.fReason) << program.fBody;
        EXPECT_TRUE(log.fLines.empty()) << program.fBody;
    }
    EXPECT_EQ(ReadKernelLog({"/no/such/device", "true", 60}).fReason, device + "true: no messages");
}

TEST_F(KernelLogTest, IsAskedOfTheProgramElse)
{
    const KernelLogSource source = {
        "/no/such/device", WriteProgram("echo '[ 1.0] box kernel: usb'; echo '[ 2.0] drm'"), 60};
    const KernelLog log = ReadKernelLog(source);
    EXPECT_EQ(log.fReason, "");
    EXPECT_EQ(log.fLines, std::vector<std::string>{"[ 2.0] drm"});
}

TEST_F(KernelLogTest, SaysWhyItIsNotKnown)
{
    const std::string device = "/no/such/device: No such file or directory; ";
    EXPECT_EQ(ReadKernelLog({"/no/such/device", "no-such-program", 60}).fReason,
              device + "no-such-program is not installed");
    const std::string program = WriteProgram("echo 'No journal files were opened.' >&2; exit 1");
    EXPECT_EQ(ReadKernelLog({"/no/such/device", program, 60}).fReason,
              device + program + ": No journal files were opened.");
    EXPECT_EQ(ReadKernelLog({"/no/such/device", WriteProgram("exit 7"), 60}).fReason,
              device + program + ": status 7");
    EXPECT_EQ(ReadKernelLog({"/no/such/device", WriteProgram("exit 0"), 60}).fReason,
              device + program + ": no messages");
    EXPECT_EQ(ReadKernelLog({"/no/such/device", WriteProgram("exec sleep 600000"), 0.01}).fReason,
              device + program + ": no end within its time");
    EXPECT_THAT(ReadKernelLog({fFolder.native(), "/no/such/program", 60}).fReason,
                testing::StartsWith(fFolder.native() + ": Is a directory; /no/such/program: "));
}

} // namespace
} // namespace assay_host
