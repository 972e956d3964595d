#include "qgf/SystemFiles.h"

#include <filesystem>
#include <iterator>
#include <string>
#include <vector>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "support/AdapterTree.h"

namespace QGF {
namespace {

using ::testing::Test;

class SystemFilesTest : public Test {
protected:
    AdapterTree fTree{"empty"};
    std::string fText = "old";
};

TEST_F(SystemFilesTest, ReadsAFileUnderTheRoot)
{
    fTree.write("/sys/a", "one\ntwo\n");
    EXPECT_TRUE(ReadSystemFile("/sys/a", fText));
    EXPECT_EQ(fText, "one\ntwo\n");
}

TEST_F(SystemFilesTest, AMissingFileIsAbsent)
{
    EXPECT_FALSE(ReadSystemFile("/sys/none", fText));
    EXPECT_EQ(fText, "");
}

TEST_F(SystemFilesTest, AnOversizedFileIsReadUpToTheLimit)
{
    fTree.write("/sys/a", std::string(100000, 'x'));
    EXPECT_TRUE(ReadSystemFile("/sys/a", fText));
    EXPECT_EQ(fText, std::string(4096, 'x'));
    EXPECT_TRUE(ReadSystemFile("/sys/a", fText, 10));
    EXPECT_EQ(fText, std::string(10, 'x'));
}

TEST_F(SystemFilesTest, ABinaryFileIsReadUnchanged)
{
    const std::string bytes("\0\xff\n\x01", 4);
    fTree.write("/sys/a", bytes);
    EXPECT_TRUE(ReadSystemFile("/sys/a", fText));
    EXPECT_EQ(fText, bytes);
}

TEST_F(SystemFilesTest, AFolderIsAbsent)
{
    std::filesystem::create_directories(fTree.root() + "/sys/a");
    EXPECT_FALSE(ReadSystemFile("/sys/a", fText));
}

TEST_F(SystemFilesTest, ADanglingLinkIsAbsent)
{
    fTree.write("/sys/b", "");
    std::filesystem::create_symlink("gone", fTree.root() + "/sys/a");
    EXPECT_FALSE(ReadSystemFile("/sys/a", fText));
}

TEST_F(SystemFilesTest, ALinkToAFileIsFollowed)
{
    fTree.write("/sys/b", "text");
    std::filesystem::create_symlink("b", fTree.root() + "/sys/a");
    EXPECT_TRUE(ReadSystemFile("/sys/a", fText));
    EXPECT_EQ(fText, "text");
}

// /proc/self/mem is a regular file that can be opened; reading at address 0 fails.
TEST_F(SystemFilesTest, AFileThatOpensButCannotBeReadIsAbsent)
{
    std::filesystem::create_symlink("/proc/self/mem", fTree.root() + "/a");
    EXPECT_FALSE(ReadSystemFile("/a", fText));
    EXPECT_EQ(fText, "");
    EXPECT_EQ(ReadSystemLine("/a"), "");
}

// Opening the pipe would block.
TEST_F(SystemFilesTest, APipeIsAbsentAndNotOpened)
{
    ASSERT_EQ(mkfifo((fTree.root() + "/pipe").c_str(), 0600), 0);
    EXPECT_FALSE(ReadSystemFile("/pipe", fText));
}

// Reading the device would never end.
TEST_F(SystemFilesTest, ADeviceIsAbsent)
{
    std::filesystem::create_symlink("/dev/zero", fTree.root() + "/zero");
    EXPECT_FALSE(ReadSystemFile("/zero", fText, static_cast<std::size_t>(-1)));
}

TEST_F(SystemFilesTest, TheFirstLineIsTrimmed)
{
    fTree.write("/a", " \tNVIDIA H100  \r\nnext\n");
    EXPECT_EQ(ReadSystemLine("/a"), "NVIDIA H100");
    fTree.write("/a", "no end");
    EXPECT_EQ(ReadSystemLine("/a"), "no end");
    fTree.write("/a", "\nnext\n");
    EXPECT_EQ(ReadSystemLine("/a"), "");
    fTree.write("/a", "  \n");
    EXPECT_EQ(ReadSystemLine("/a"), "");
    EXPECT_EQ(ReadSystemLine("/none"), "");
}

TEST_F(SystemFilesTest, ALongFileOfManyLinesIsReadToItsEnd)
{
    const std::string line = std::string(10000, 'x') + '\n';
    fTree.write("/a", line + line + line);
    EXPECT_TRUE(ReadSystemFile("/a", fText, 100000));
    EXPECT_EQ(fText, line + line + line);
    EXPECT_EQ(ReadSystemLine("/a"), std::string(kMaxSystemFileSize, 'x'));
}

// A program that was started without a standard input gets its number for the next file.
TEST_F(SystemFilesTest, AFileMayHaveTheNumberOfTheStandardInput)
{
    fTree.write("/a", "text");
    const int saved = dup(STDIN_FILENO);
    ASSERT_EQ(close(STDIN_FILENO), 0);
    EXPECT_TRUE(ReadSystemFile("/a", fText));
    const int next = open("/dev/null", O_RDONLY | O_CLOEXEC);
    EXPECT_EQ(next, STDIN_FILENO);
    if (saved >= 0) {
        dup2(saved, STDIN_FILENO);
        close(saved);
    }
    EXPECT_EQ(fText, "text");
}

TEST_F(SystemFilesTest, AFolderListsItsNamesSorted)
{
    fTree.write("/d/b", "");
    fTree.write("/d/a", "");
    std::filesystem::create_symlink("gone", fTree.root() + "/d/c");
    EXPECT_EQ(ListSystemFolder("/d"), (std::vector<std::string>{"a", "b", "c"}));
}

TEST_F(SystemFilesTest, AFolderListsAtMost4096Names)
{
    std::filesystem::create_directories(fTree.root() + "/d");
    for (int name = 0; name < 4097; ++name)
        std::filesystem::create_symlink("gone", fTree.root() + "/d/" + std::to_string(name));
    EXPECT_EQ(ListSystemFolder("/d").size(), 4096U);
}

TEST_F(SystemFilesTest, NoFileStaysOpen)
{
    fTree.write("/d/a", "text");
    const auto countOpen = [] {
        return std::distance(std::filesystem::directory_iterator("/proc/self/fd"),
                             std::filesystem::directory_iterator());
    };
    const auto before = countOpen();
    EXPECT_TRUE(ReadSystemFile("/d/a", fText));
    EXPECT_EQ(ReadSystemLine("/d/a"), "text");
    EXPECT_EQ(ListSystemFolder("/d").size(), 1U);
    EXPECT_EQ(countOpen(), before);
}

TEST_F(SystemFilesTest, AFileOrMissingFolderListsNothing)
{
    fTree.write("/a", "");
    EXPECT_TRUE(ListSystemFolder("/a").empty());
    EXPECT_TRUE(ListSystemFolder("/none").empty());
}

TEST_F(SystemFilesTest, ALinkIsReadEvenIfItsTargetIsMissing)
{
    std::filesystem::create_symlink("../gone/nvidia", fTree.root() + "/driver");
    EXPECT_EQ(ReadSystemLink("/driver"), "../gone/nvidia");
    EXPECT_EQ(LastOfPath(ReadSystemLink("/driver")), "nvidia");
    std::filesystem::create_symlink("x", fTree.root() + "/short");
    EXPECT_EQ(ReadSystemLink("/short"), "x");
    EXPECT_EQ(ReadSystemLink("/none"), "");
    EXPECT_EQ(LastOfPath("nvidia"), "nvidia");
    EXPECT_EQ(LastOfPath(""), "");
}

} // namespace
} // namespace QGF
