// The folder of the state while the kernel refuses single calls, as a failing disk does.
#include <gtest/gtest.h>

#include <cerrno>
#include <fcntl.h>
#include <string>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <boost/filesystem/operations.hpp>

#include "memory/Folder.h"
#include "support/linux/RefusedCalls.h"

namespace assay_host {
namespace {

constexpr std::size_t kLimit = 1000;

class RefusedFolderTest : public testing::Test {
protected:
    RefusedFolderTest()
    {
        const int next = ::dup(STDIN_FILENO);
        ::close(next);
        fFolder = OpenFolder(fPath.native(), FolderUse::kWrite);
        fNumber = static_cast<unsigned>(next);
        fFolder->Write("file", "old");
    }
    ~RefusedFolderTest() override { boost::filesystem::remove_all(fPath); }

    void SetUp() override
    {
        if (::prctl(PR_GET_SECCOMP) < 0)
            GTEST_SKIP() << "the kernel has no filters of system calls";
    }

    // Returns the text that the function returns in a process of its own.
    template <typename Function>
    static std::string Ask(const Function& function)
    {
        int ends[2];
        if (::pipe2(ends, O_CLOEXEC) != 0)
            return "no pipe";
        const ::pid_t child = ::fork();
        if (child == 0) {
            const std::string text = function();
            ::_exit(::write(ends[1], text.data(), text.size()) < 0 ? 1 : 0);
        }
        ::close(ends[1]);
        char text[1000];
        const ::ssize_t size = ::read(ends[0], text, sizeof text);
        ::close(ends[0]);
        int status = -1;
        ::waitpid(child, &status, 0);
        return status != 0 || size < 0 ? "failed"
                                       : std::string(text, static_cast<std::size_t>(size));
    }

    // Returns the reason of a write while a call is refused.
    std::string Write(long call, int argument, unsigned value, int error) const
    {
        return Ask([&]() -> std::string {
            if (!RefuseCall(call, argument, value, error))
                return "no filter";
            return fFolder->Write("file", "new");
        });
    }

    const boost::filesystem::path fPath = boost::filesystem::temp_directory_path() /
                                          boost::filesystem::unique_path("assay-memory-%%%%-%%%%");
    std::unique_ptr<Folder> fFolder;
    unsigned fNumber = 0; // the folder's descriptor
};

TEST_F(RefusedFolderTest, AFileThatCannotReachTheDiskIsNotUsed)
{
    EXPECT_EQ(Write(SYS_fsync, -1, 0, EIO), "Input/output error");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "old");
    EXPECT_EQ(fFolder->List().size(), 1U) << "the new file is removed";
}

TEST_F(RefusedFolderTest, ANameThatCannotReachTheDiskIsAFailure)
{
    EXPECT_EQ(Write(SYS_fsync, 0, fNumber, EIO), "Input/output error");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "new");
}

TEST_F(RefusedFolderTest, AFolderMayHaveNothingToBringToTheDisk)
{
    EXPECT_EQ(Write(SYS_fsync, 0, fNumber, EINVAL), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "new");
}

TEST_F(RefusedFolderTest, NothingIsRemovedWithoutAReason)
{
    EXPECT_EQ(Ask([&]() -> std::string {
                  if (!RefuseCall(SYS_unlinkat, -1, 0, EROFS))
                      return "no filter";
                  return fFolder->Remove("file");
              }),
              "Read-only file system");
}

TEST_F(RefusedFolderTest, AFileWhoseStatusIsUnknownIsRefused)
{
#ifdef SYS_newfstatat
    EXPECT_EQ(Ask([&]() -> std::string {
                  if (!RefuseCall(SYS_newfstatat, -1, 0, EIO) || !RefuseCall(SYS_fstat, -1, 0, EIO))
                      return "no filter";
                  const FileRead read = fFolder->Read("file", kLimit);
                  const LockTry lock = fFolder->TryLock();
                  const std::string problem =
                      OpenFolder(fPath.native(), FolderUse::kRead)->GetProblem();
                  return std::to_string(static_cast<int>(read.fState)) + read.fReason + ", " +
                         std::to_string(static_cast<int>(lock.fState)) + lock.fReason + ", " +
                         problem;
              }),
              "2Input/output error, 2Input/output error, Input/output error");
#endif
}

TEST_F(RefusedFolderTest, ALockThatTheFileSystemDoesNotHaveFails)
{
    EXPECT_EQ(Ask([&]() -> std::string {
                  if (!RefuseCall(SYS_flock, -1, 0, ENOLCK))
                      return "no filter";
                  const LockTry lock = fFolder->TryLock();
                  return lock.fState == LockState::kFailed ? lock.fReason : "another state";
              }),
              "No locks available");
}

// The kernel gives 0 as the size of these.
TEST(FolderOfAProcess, HasFilesThatAreLongerThanTheirSize)
{
    const auto folder = OpenFolder("/proc/self", FolderUse::kRead);
    const FileRead read = folder->Read("comm", kLimit);
    if (read.fState != FileState::kRead)
        GTEST_SKIP() << "this process's files are another user's: " << read.fReason;
    EXPECT_EQ(read.fText, "memory_tests\n");
    EXPECT_EQ(folder->Read("comm", 13).fText, "memory_tests\n");
    EXPECT_EQ(folder->Read("comm", 12).fReason, "it is too large");
}

} // namespace
} // namespace assay_host
