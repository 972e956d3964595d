#include "bugreport/KernelLog.h"

#include <fstream>

#include <boost/filesystem/operations.hpp>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

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
