// What the system rarely says: this program has functions of the C library of its own, which pass
// on what a test doesn't set.
#include "pmutil/System.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <dlfcn.h>
#include <fcntl.h>
#include <fstream>
#include <functional>
#include <pwd.h>
#include <string>
#include <unistd.h>

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include "TempFolder.h"
#include "Throws.h"

namespace {

std::function<int(passwd*, char*, std::size_t, passwd**)> gFindUser;
[[maybe_unused]] std::function<long(int)> gAskSystem; // returns 1 for what it doesn't know

template <typename Function>
Function FindNext(const char* name)
{
    return reinterpret_cast<Function>(::dlsym(RTLD_NEXT, name));
}

} // namespace

extern "C" int getpwuid_r(uid_t user, passwd* entry, char* buffer, std::size_t size, passwd** found)
{
    static const auto gNext = FindNext<decltype(&getpwuid_r)>("getpwuid_r");
    return gFindUser ? gFindUser(entry, buffer, size, found)
                     : gNext(user, entry, buffer, size, found);
}

// The sanitizers ask it before they can watch anybody.
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
#define HAS_SYSCONF
extern "C" long sysconf(int name) noexcept
{
    static const auto gNext = FindNext<decltype(&sysconf)>("sysconf");
    const long answer = gAskSystem ? gAskSystem(name) : 1;
    return answer == 1 ? gNext(name) : answer;
}
#endif

namespace pmutil {
namespace {

class DesktopFolderTest : public testing::Test {
protected:
    ~DesktopFolderTest() override { gFindUser = nullptr; }

    // Gives the user this home folder, with an entry that needs so much room.
    static void SetHome(const std::string& home, std::size_t room = 1)
    {
        gFindUser = [home, room](passwd* entry, char* buffer, std::size_t size, passwd** found) {
            *found = nullptr;
            if (size < std::max(room, home.size() + 1))
                return ERANGE;
            buffer[home.copy(buffer, home.size())] = '\0';
            entry->pw_dir = buffer;
            *found = entry;
            return 0;
        };
    }

    const TempFolder fFolder;
    const std::string fHome = fFolder.Path().native();
};

TEST_F(DesktopFolderTest, IsInTheHomeFolder)
{
    for (const std::size_t room : {1U, 1000U, 100000U}) {
        SetHome(fHome, room);
        EXPECT_EQ(GetDesktopFolder(), (fFolder.Path() / "Desktop").wstring()) << room;
    }
}

TEST_F(DesktopFolderTest, IsTheOneThatTheUserNames)
{
    SetHome(fHome);
    boost::filesystem::create_directory(fFolder.Path() / ".config");
    std::ofstream(fHome + "/.config/user-dirs.dirs") << "XDG_DESKTOP_DIR=\"$HOME/Table\"\n";
    EXPECT_EQ(GetDesktopFolder(), (fFolder.Path() / "Table").wstring());
    boost::filesystem::remove_all(fFolder.Path() / ".config");
}

TEST_F(DesktopFolderTest, IsNoneWithoutAHomeFolder)
{
    gFindUser = [](passwd* /*entry*/, char* /*buffer*/, std::size_t /*size*/, passwd** found) {
        *found = nullptr;
        return 0;
    };
    EXPECT_EQ(GetDesktopFolder(), L"") << "there is no such user";
    gFindUser = [](passwd* entry, char* /*buffer*/, std::size_t /*size*/, passwd** found) {
        entry->pw_dir = nullptr;
        *found = entry;
        return 0;
    };
    EXPECT_EQ(GetDesktopFolder(), L"");
    static char gHome[] = "/home";
    gFindUser = [](passwd* entry, char* /*buffer*/, std::size_t /*size*/, passwd** found) {
        entry->pw_dir = gHome;
        *found = entry;
        return EIO;
    };
    EXPECT_EQ(GetDesktopFolder(), L"") << "the database can't be read";
    SetHome("");
    EXPECT_EQ(GetDesktopFolder(), L"");
    SetHome("/\xFF");
    EXPECT_EQ(GetDesktopFolder(), L"") << "a name that isn't UTF-8";
}

#ifdef HAS_SYSCONF
TEST(PhysicalMemoryTest, ThatIsUnknownThrows)
{
    for (const int asked : {_SC_PHYS_PAGES, _SC_PAGESIZE})
        for (const long answer : {-1L, 0L}) {
            gAskSystem = [=](int name) { return name == asked ? answer : 1; };
            EXPECT_TRUE(ThrowsRuntimeError("GlobalMemoryStatusEx failed", [] {
                GetPhysicalMemoryBytes();
            })) << asked;
            gAskSystem = nullptr;
        }
}
#endif

TEST(SharedAppendTest, IsNotInherited)
{
    const TempFolder folder;
    std::FILE* const file = OpenSharedAppend(folder.File("log"));
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(::fcntl(::fileno(file), F_GETFD), FD_CLOEXEC);
    std::fclose(file);
}

} // namespace
} // namespace pmutil
