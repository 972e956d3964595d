#include "memory/Folder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <fstream>
#include <functional>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <boost/filesystem/operations.hpp>

#include "support/Allocations.h"
#include "support/OpenThings.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

constexpr std::size_t kLimit = 1000;

class FolderTest : public testing::Test {
protected:
    FolderTest()
    {
        boost::filesystem::create_directory(fParent);
        fFolder = OpenFolder(fPath.native(), FolderUse::kWrite);
    }
    ~FolderTest() override { boost::filesystem::remove_all(fParent); }

    std::string File(const std::string& name) const { return (fPath / name).native(); }

    // As another program would.
    void Put(const std::string& name, const std::string& text, ::mode_t mode = 0600) const
    {
        std::ofstream(File(name)) << text;
        ::chmod(File(name).c_str(), mode);
    }

    std::vector<std::string> GetNames() const
    {
        std::vector<std::string> names;
        for (const auto& entry : boost::filesystem::directory_iterator(fPath))
            names.push_back(entry.path().filename().native());
        return names;
    }

    const boost::filesystem::path fParent =
        boost::filesystem::temp_directory_path() /
        boost::filesystem::unique_path("assay-memory-%%%%-%%%%");
    const boost::filesystem::path fPath = fParent / "state";
    std::unique_ptr<Folder> fFolder;
};

TEST_F(FolderTest, IsOfTheUserAlone)
{
    ASSERT_EQ(fFolder->Write("file", "text"), "");
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kHeld);
    struct stat found = {};
    ASSERT_EQ(::stat(fPath.c_str(), &found), 0);
    EXPECT_EQ(found.st_mode & 07777u, 0700u);
    for (const char* const name : {"file", "lock"}) {
        ASSERT_EQ(::stat(File(name).c_str(), &found), 0);
        EXPECT_EQ(found.st_mode & 07777u, 0600u);
    }
}

TEST_F(FolderTest, ReadsWhatItWrote)
{
    EXPECT_EQ(fFolder->Read("file", kLimit).fState, FileState::kMissing);
    const std::string text("a\0b\n", 4);
    EXPECT_EQ(fFolder->Write("file", "longer text"), "");
    EXPECT_EQ(fFolder->Write("file", text), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, text);
    EXPECT_EQ(fFolder->Read("file", text.size()).fText, text);
    EXPECT_EQ(fFolder->Read("file", text.size() - 1).fReason, "it is too large");
    EXPECT_THAT(GetNames(), ElementsAre("file"));
    EXPECT_EQ(fFolder->Remove("file"), "");
    EXPECT_EQ(fFolder->Remove("file"), "");
    EXPECT_THAT(GetNames(), IsEmpty());
}

TEST_F(FolderTest, RefusesLinksAndReplacesThem)
{
    std::ofstream(fParent.native() + "/target") << "target";
    ASSERT_EQ(::symlink("../target", File("file").c_str()), 0);
    EXPECT_EQ(fFolder->Read("file", kLimit).fState, FileState::kRefused);
    EXPECT_EQ(fFolder->Read("file", kLimit).fReason, "it is a link");
    EXPECT_THAT(fFolder->List(), IsEmpty());
    EXPECT_EQ(fFolder->Write("file", "text"), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "text");
    std::string target;
    std::ifstream(fParent.native() + "/target") >> target;
    EXPECT_EQ(target, "target");
    ASSERT_EQ(::symlink("../lock", File("lock").c_str()), 0);
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kFailed);
    EXPECT_FALSE(boost::filesystem::exists(fParent / "lock"));
}

TEST_F(FolderTest, RefusesWhatIsNoFileOrOthersCanChange)
{
    ASSERT_EQ(::mkfifo(File("pipe").c_str(), 0600), 0);
    EXPECT_EQ(fFolder->Read("pipe", kLimit).fReason, "it is not a file");
    boost::filesystem::create_directory(fPath / "folder");
    EXPECT_EQ(fFolder->Read("folder", kLimit).fState, FileState::kRefused);
    EXPECT_NE(fFolder->Write("folder", "text"), "");
    Put("shared", "text", 0620);
    EXPECT_EQ(fFolder->Read("shared", kLimit).fReason, "other users can change it");
    Put("open", "text", 0602);
    EXPECT_EQ(fFolder->Read("open", kLimit).fReason, "other users can change it");
    Put("readable", "text", 0644);
    EXPECT_EQ(fFolder->Read("readable", kLimit).fText, "text");
    ASSERT_EQ(fFolder->List().size(), 1u);
    EXPECT_EQ(fFolder->List()[0].fName, "readable");
    EXPECT_THAT(GetNames(), UnorderedElementsAre("pipe", "folder", "shared", "open", "readable"));
}

TEST_F(FolderTest, RefusesAnotherUsersFiles)
{
    if (::geteuid() != 0)
        GTEST_SKIP() << "only root can give files away";
    Put("file", "text");
    ASSERT_EQ(::chown(File("file").c_str(), 1, 1), 0);
    EXPECT_EQ(fFolder->Read("file", kLimit).fReason, "it belongs to another user");
    EXPECT_THAT(fFolder->List(), IsEmpty());
    Put("lock", "");
    ASSERT_EQ(::chown(File("lock").c_str(), 1, 1), 0);
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kFailed);
    ASSERT_EQ(::chown(fPath.c_str(), 1, 1), 0);
    EXPECT_EQ(OpenFolder(fPath.native(), FolderUse::kWrite)->Write("file", ""),
              "it belongs to another user");
}

TEST_F(FolderTest, RefusesAFolderThatAllCanChange)
{
    ASSERT_EQ(::chmod(fPath.c_str(), 0777), 0);
    EXPECT_EQ(OpenFolder(fPath.native(), FolderUse::kWrite)->Write("file", ""),
              "all users can change it");
    ASSERT_EQ(::chmod(fPath.c_str(), 01777), 0);
    EXPECT_EQ(OpenFolder(fPath.native(), FolderUse::kWrite)->Write("file", ""), "");
    ASSERT_EQ(::chmod(fPath.c_str(), 0770), 0);
    EXPECT_EQ(OpenFolder(fPath.native(), FolderUse::kWrite)->Write("file", ""), "");
}

TEST_F(FolderTest, FollowsALinkOfTheUserToIt)
{
    const std::string link = (fParent / "link").native();
    ASSERT_EQ(::symlink("state", link.c_str()), 0);
    EXPECT_EQ(OpenFolder(link, FolderUse::kWrite)->Write("file", "text"), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "text");
    EXPECT_EQ(OpenFolder(link + "/", FolderUse::kWrite)->Write("file", "text"), "");
}

TEST_F(FolderTest, FollowsNoLinkOfAnotherUserToIt)
{
    if (::geteuid() != 0)
        GTEST_SKIP() << "only root can give links away";
    const std::string link = (fParent / "link").native();
    ASSERT_EQ(::symlink("state", link.c_str()), 0);
    ASSERT_EQ(::lchown(link.c_str(), 1, 1), 0);
    for (const FolderUse use : {FolderUse::kRead, FolderUse::kWrite})
        for (const char* const end : {"", "/", "//"})
            EXPECT_EQ(OpenFolder(link + end, use)->Write("file", "text"),
                      "it is a link of another user");
    EXPECT_EQ(fFolder->Read("file", kLimit).fState, FileState::kMissing);
    // A loop of links is no folder.
    ASSERT_EQ(::symlink("loop", (fParent / "loop").c_str()), 0);
    EXPECT_NE(OpenFolder((fParent / "loop").native(), FolderUse::kWrite)->Write("file", ""), "");
}

TEST_F(FolderTest, CreatesOnlyTheFolderItself)
{
    const std::string missing = (fParent / "new").native();
    EXPECT_NE(OpenFolder(missing, FolderUse::kRead)->Write("file", ""), "");
    EXPECT_FALSE(boost::filesystem::exists(missing));
    EXPECT_NE(OpenFolder(missing + "/new", FolderUse::kWrite)->Write("file", ""), "");
    EXPECT_EQ(OpenFolder(missing, FolderUse::kWrite)->Write("file", ""), "");
    EXPECT_EQ(OpenFolder(missing, FolderUse::kRead)->Read("file", kLimit).fState, FileState::kRead);
    const auto none = OpenFolder(missing + "/file", FolderUse::kWrite);
    EXPECT_EQ(none->Write("file", ""), "Not a directory");
    EXPECT_EQ(none->Read("file", kLimit).fState, FileState::kMissing);
    EXPECT_EQ(none->Remove("file"), "Not a directory");
    EXPECT_EQ(none->TryLock().fState, LockState::kFailed);
    EXPECT_THAT(none->List(), IsEmpty());
}

// Not even root can write there.
TEST_F(FolderTest, ReportsAFolderThatCannotBeWritten)
{
    const auto folder = OpenFolder("/proc", FolderUse::kWrite);
    EXPECT_NE(folder->Write("file", "text"), "");
    EXPECT_EQ(folder->Read("file", kLimit).fState, FileState::kMissing);
    EXPECT_EQ(folder->TryLock().fState, LockState::kFailed);
}

TEST_F(FolderTest, AWriteThatFailsLeavesTheOldFile)
{
    ASSERT_EQ(fFolder->Write("file", "old"), "");
    struct rlimit before = {};
    ::getrlimit(RLIMIT_FSIZE, &before);
    const auto handler = std::signal(SIGXFSZ, SIG_IGN);
    struct rlimit small = before;
    small.rlim_cur = 1000;
    ::setrlimit(RLIMIT_FSIZE, &small);
    const std::string reason = fFolder->Write("file", std::string(2000, 'x'));
    ::setrlimit(RLIMIT_FSIZE, &before);
    std::signal(SIGXFSZ, handler);
    EXPECT_EQ(reason, "File too large");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "old");
    EXPECT_THAT(GetNames(), ElementsAre("file"));
}

TEST_F(FolderTest, TheLockIsOfOneHolder)
{
    const auto other = OpenFolder(fPath.native(), FolderUse::kWrite);
    LockTry held = fFolder->TryLock();
    EXPECT_EQ(held.fState, LockState::kHeld);
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kBusy);
    EXPECT_EQ(other->TryLock().fState, LockState::kBusy);
    held.fLock.reset();
    EXPECT_EQ(other->TryLock().fState, LockState::kHeld);
}

TEST_F(FolderTest, TheLockEndsWithItsProcess)
{
    int held[2];
    ASSERT_EQ(::pipe(held), 0);
    const ::pid_t child = ::fork();
    if (child == 0) {
        const LockTry lock = fFolder->TryLock();
        const char byte = lock.fState == LockState::kHeld ? 'y' : 'n';
        if (::write(held[1], &byte, 1) == 1)
            ::pause();
        ::_exit(0);
    }
    char byte = 0;
    ASSERT_EQ(::read(held[0], &byte, 1), 1);
    EXPECT_EQ(byte, 'y');
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kBusy);
    ::kill(child, SIGKILL);
    ::waitpid(child, nullptr, 0);
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kHeld);
    ::close(held[0]);
    ::close(held[1]);
}

// Each allocation of each call fails once.
TEST_F(FolderTest, LeavesNothingOpenWhenMemoryIsShort)
{
    const std::string name = "a name that is too long for the memory of a string";
    const std::string link = (fParent / "link to the folder of the state").native();
    ASSERT_EQ(fFolder->Write(name, "text"), "");
    boost::filesystem::create_directory_symlink(fPath, link);
    const std::function<void()> calls[] = {
        [&] { OpenFolder(fPath.native(), FolderUse::kRead); },
        [&] { OpenFolder(link, FolderUse::kWrite); },
        [&] {
            OpenFolder(fParent.native() + "/no such folder, but a long name", FolderUse::kRead);
        },
        [&] { fFolder->TryLock(); },
        [&] { fFolder->Read(name, kLimit); },
        [&] { fFolder->Write(name, "another text"); },
        [&] { fFolder->List(); },
    };
    const long before = CountOpenThings();
    for (const auto& call : calls) {
        bool hasFailed = true;
        for (std::size_t number = 0; hasFailed; ++number) {
            const assay_test::FailingAllocation failing(number);
            try {
                call();
            } catch (const std::bad_alloc&) {
            }
            hasFailed = failing.HasFailed();
        }
        EXPECT_EQ(CountOpenThings(), before) << &call - calls;
    }
}

TEST_F(FolderTest, ListsManyEntries)
{
    for (int number = 0; number < 10000; ++number)
        std::ofstream(File("entry" + std::to_string(number))).flush();
    for (const auto& entry : boost::filesystem::directory_iterator(fPath))
        ::chmod(entry.path().c_str(), 0600);
    EXPECT_EQ(fFolder->List().size(), 10000u);
    EXPECT_EQ(fFolder->Write("file", "text"), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "text");
}

TEST(TemporaryNameTest, IsHidden)
{
    EXPECT_TRUE(IsTemporaryName(".name.1234.tmp"));
    for (const char* const name : {"", ".tmp", "name.tmp", ".name.tm", ".name.tmp2"})
        EXPECT_FALSE(IsTemporaryName(name)) << name;
}

} // namespace
} // namespace assay_host
