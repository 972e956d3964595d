#include "memory/Folder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <windows.h>

#include <boost/filesystem/operations.hpp>
#include <boost/nowide/convert.hpp>

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
        fFolder = Open(fPath, FolderUse::kWrite);
    }
    ~FolderTest() override
    {
        boost::system::error_code ignored;
        boost::filesystem::remove_all(fParent, ignored);
    }

    static std::unique_ptr<Folder> Open(const boost::filesystem::path& path, FolderUse use)
    {
        return OpenFolder(boost::nowide::narrow(path.native()), use);
    }

    void Put(const std::string& name, const std::string& text) const
    {
        const HANDLE file = ::CreateFileW((fPath / name).c_str(), GENERIC_WRITE, 0, nullptr,
                                          CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
        DWORD wrote = 0;
        ASSERT_NE(::WriteFile(file, text.data(), static_cast<DWORD>(text.size()), &wrote, nullptr),
                  0);
        ::CloseHandle(file);
    }

    std::vector<std::string> GetNames() const
    {
        std::vector<std::string> names;
        for (const auto& entry : boost::filesystem::directory_iterator(fPath))
            names.push_back(entry.path().filename().string());
        return names;
    }

    // The name of a user may have any letters.
    const boost::filesystem::path fParent =
        boost::filesystem::temp_directory_path() /
        (boost::filesystem::unique_path("assay-memory-%%%%-%%%%-").native() +
         L"\u017B\u00F3\u0142\u0107");
    const boost::filesystem::path fPath = fParent / "state";
    std::unique_ptr<Folder> fFolder;
};

TEST_F(FolderTest, ReadsWhatItWrote)
{
    EXPECT_EQ(fFolder->Read("file", kLimit).fState, FileState::kMissing);
    const std::string text("a\0b\r\n\n", 6);
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

TEST_F(FolderTest, ListsFilesWithTheirTimes)
{
    boost::filesystem::create_directory(fPath / "folder");
    Put("old", "text");
    boost::filesystem::last_write_time(fPath / "old", 1'700'000'000);
    ASSERT_EQ(fFolder->Write("new", "text"), "");
    std::vector<std::string> names;
    for (const FolderEntry& entry : fFolder->List()) {
        names.push_back(entry.fName);
        if (entry.fName == "old")
            EXPECT_EQ(entry.fTime, 1'700'000'000);
        else
            EXPECT_GT(entry.fTime, 1'700'000'000);
    }
    EXPECT_THAT(names, UnorderedElementsAre("old", "new"));
}

TEST_F(FolderTest, RefusesWhatIsNoFile)
{
    boost::filesystem::create_directory(fPath / "folder");
    EXPECT_EQ(fFolder->Read("folder", kLimit).fState, FileState::kRefused);
    EXPECT_NE(fFolder->Write("folder", "text"), "");
    EXPECT_THAT(GetNames(), ElementsAre("folder"));
    boost::filesystem::create_directory(fPath / "lock");
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kFailed);
}

TEST_F(FolderTest, RefusesLinks)
{
    Put("target", "target");
    if (::CreateSymbolicLinkW((fPath / "file").c_str(), (fPath / "target").c_str(), 0) == 0)
        GTEST_SKIP() << "this user or system can't make links to files";
    BY_HANDLE_FILE_INFORMATION found = {};
    const HANDLE link =
        ::CreateFileW((fPath / "file").c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr,
                      OPEN_EXISTING, FILE_FLAG_OPEN_REPARSE_POINT, nullptr);
    const bool isKnown = ::GetFileInformationByHandle(link, &found) != 0 &&
                         (found.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0;
    ::CloseHandle(link);
    if (!isKnown)
        GTEST_SKIP() << "this system opens what a link leads to, as Wine does";
    EXPECT_EQ(fFolder->Read("file", kLimit).fReason, "it is a link");
    ASSERT_EQ(fFolder->List().size(), 1u);
    EXPECT_EQ(fFolder->List()[0].fName, "target");
}

TEST_F(FolderTest, CreatesOnlyTheFolderItself)
{
    const auto missing = fParent / "new";
    EXPECT_NE(Open(missing, FolderUse::kRead)->Write("file", ""), "");
    EXPECT_FALSE(boost::filesystem::exists(missing));
    EXPECT_NE(Open(missing / "new", FolderUse::kWrite)->Write("file", ""), "");
    EXPECT_FALSE(boost::filesystem::exists(missing));
    EXPECT_EQ(Open(missing, FolderUse::kWrite)->Write("file", ""), "");
    EXPECT_EQ(Open(missing, FolderUse::kRead)->Read("file", kLimit).fState, FileState::kRead);
    const auto none = Open(missing / "file", FolderUse::kWrite);
    EXPECT_NE(none->Write("file", ""), "");
    EXPECT_EQ(none->Read("file", kLimit).fState, FileState::kMissing);
    EXPECT_NE(none->Remove("file"), "");
    EXPECT_EQ(none->TryLock().fState, LockState::kFailed);
    EXPECT_THAT(none->List(), IsEmpty());
}

TEST_F(FolderTest, AWriteThatFailsLeavesTheOldFile)
{
    ASSERT_EQ(fFolder->Write("file", "old"), "");
    // Another program has the file open, and shares it with nobody.
    const HANDLE held = ::CreateFileW((fPath / "file").c_str(), GENERIC_READ, 0, nullptr,
                                      OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
    ASSERT_NE(held, INVALID_HANDLE_VALUE);
    EXPECT_NE(fFolder->Write("file", "new"), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fState, FileState::kRefused);
    EXPECT_NE(fFolder->Remove("file"), "");
    ::CloseHandle(held);
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "old");
    EXPECT_THAT(GetNames(), ElementsAre("file"));
}

TEST_F(FolderTest, AReaderDoesNotStopAWrite)
{
    ASSERT_EQ(fFolder->Write("file", "old"), "");
    const HANDLE reader = ::CreateFileW((fPath / "file").c_str(), GENERIC_READ,
                                        FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                        nullptr, OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
    ASSERT_NE(reader, INVALID_HANDLE_VALUE);
    // The system may refuse it, but then there is still the old file.
    const std::string reason = fFolder->Write("file", "new");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, reason.empty() ? "new" : "old");
    ::CloseHandle(reader);
    EXPECT_EQ(fFolder->Write("file", "newer"), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "newer");
}

TEST_F(FolderTest, TheLockIsOfOneHolder)
{
    const auto other = Open(fPath, FolderUse::kWrite);
    LockTry held = fFolder->TryLock();
    EXPECT_EQ(held.fState, LockState::kHeld);
    EXPECT_EQ(fFolder->TryLock().fState, LockState::kBusy);
    EXPECT_EQ(other->TryLock().fState, LockState::kBusy);
    held.fLock.reset();
    EXPECT_EQ(other->TryLock().fState, LockState::kHeld);
}

TEST_F(FolderTest, ListsManyEntries)
{
    constexpr std::size_t kEntries = 500; // Wine takes minutes for thousands
    for (std::size_t number = 0; number < kEntries; ++number)
        Put("entry" + std::to_string(number), "");
    EXPECT_EQ(fFolder->List().size(), kEntries);
    EXPECT_EQ(fFolder->Write("file", "text"), "");
    EXPECT_EQ(fFolder->Read("file", kLimit).fText, "text");
}

} // namespace
} // namespace assay_host
