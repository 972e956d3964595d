#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "FakeElf.h"
#include "MachineTree.h"
#include "identity/linux/LibraryCache.h"
#include "identity/linux/LibrarySearch.h"

namespace assay_host {
namespace {

using Names = std::vector<std::string>;

TEST(LibraryCache, FindsEveryPathOfAName)
{
    const LibraryCache cache(MakeLibraryCache({{"libb.so.1", "/usr/lib/libb.so.1"},
                                               {"liba.so.1", "/usr/lib/hw/liba.so.1"},
                                               {"liba.so.1", "/usr/lib/liba.so.1"}},
                                              kCacheFlags));
    EXPECT_EQ(cache.Find("libb.so.1"), Names{"/usr/lib/libb.so.1"});
    EXPECT_EQ(cache.Find("liba.so.1"), (Names{"/usr/lib/hw/liba.so.1", "/usr/lib/liba.so.1"}));
    EXPECT_EQ(cache.Find("liba.so"), Names());
    EXPECT_EQ(cache.Find("libc.so.1"), Names());
}

TEST(LibraryCache, LeavesOutOtherMachines)
{
    EXPECT_EQ(LibraryCache(MakeLibraryCache({{"a", "/a"}}, 0x0803)).Find("a"), Names());
    constexpr unsigned char kBig = 3;
    EXPECT_EQ(LibraryCache(MakeLibraryCache({{"a", "/a"}}, kCacheFlags, kBig)).Find("a"), Names());
    EXPECT_EQ(LibraryCache(MakeLibraryCache({{"a", "/a"}}, kCacheFlags, 0)).Find("a"), Names{"/a"});
}

TEST(LibraryCache, ReadsTheTableAfterAnOldOne)
{
    std::string old = "ld.so-1.7.0";
    old.resize(16);
    old[12] = 1;
    old.resize(16 + 12);
    old.resize(32); // the new table is at a multiple of 8
    const std::string file = old + MakeLibraryCache({{"a", "/a"}}, kCacheFlags);
    EXPECT_EQ(LibraryCache(file).Find("a"), Names{"/a"});
    EXPECT_EQ(LibraryCache(old).Find("a"), Names());
    for (const char count : {'\2', 'd'}) {
        std::string wrong = file;
        wrong[12] = count; // the new table isn't where the old one ends
        EXPECT_EQ(LibraryCache(wrong).Find("a"), Names()) << int{count};
    }
}

TEST(LibraryCache, HasNoMoreEntriesThanItsFileHolds)
{
    std::string file = MakeLibraryCache({{"a", "/a"}, {"b", "/b"}}, kCacheFlags);
    constexpr std::size_t kCount = 20;
    ASSERT_EQ(file[kCount], 2);
    file[kCount] = 3;
    EXPECT_EQ(LibraryCache(file).Find("a"), Names());
    file[kCount] = 1;
    EXPECT_EQ(LibraryCache(file).Find("a"), Names{"/a"});
    EXPECT_EQ(LibraryCache(file).Find("b"), Names());
}

TEST(LibraryCache, MayBeDamaged)
{
    const std::string whole = MakeLibraryCache({{"a", "/a"}, {"b", "/b"}}, kCacheFlags);
    for (std::size_t size = 0; size < whole.size(); ++size) {
        const Names found = LibraryCache(whole.substr(0, size)).Find("b");
        EXPECT_EQ(found, Names()) << size;
    }
    std::string changed = whole;
    for (char& byte : changed) {
        const char old = byte;
        byte = static_cast<char>(~old);
        EXPECT_LE(LibraryCache(changed).Find("b").size(), 1U);
        byte = old;
    }
}

class LibrarySearchTest : public testing::Test {
protected:
    Names Find(const std::string& name, const ElfFile& from = {}) const
    {
        const Files files = fTree.GetFiles();
        Names paths;
        for (const FileStatus& status : LibrarySearch(files, fProcess).Find(name, from))
            paths.push_back(status.fPath);
        return paths;
    }

    MachineTree fTree;
    Process fProcess;
};

TEST_F(LibrarySearchTest, KeepsTheOrderOfTheLoader)
{
    fTree.Write("/etc/ld.so.cache",
                MakeLibraryCache({{"libx.so", "/cached/libx.so"}}, kCacheFlags));
    for (const char* folder : {"/first", "/own", "/cached", "/usr/lib"})
        fTree.Write(std::string(folder) + "/libx.so", "");
    fProcess.fVariables["LD_LIBRARY_PATH"] = "/missing;/first";
    ElfFile from;
    from.fRunPath = {"/own"};
    EXPECT_EQ(Find("libx.so", from), Names{"/first/libx.so"});
    from.fIsRunPathFirst = true;
    EXPECT_EQ(Find("libx.so", from), Names{"/own/libx.so"});
    from.fIsRunPathFirst = false;
    fTree.Remove("/first");
    EXPECT_EQ(Find("libx.so", from), Names{"/own/libx.so"});
    EXPECT_EQ(Find("libx.so"), Names{"/cached/libx.so"});
    fTree.Remove("/cached");
    EXPECT_EQ(Find("libx.so"), Names{"/usr/lib/libx.so"});
    EXPECT_EQ(Find("liby.so"), Names());
    EXPECT_EQ(Find(""), Names());
}

TEST_F(LibrarySearchTest, ReadsTheCacheUpTo16MiB)
{
    constexpr std::size_t kLimit = 16777216;
    const std::string path("/b\0", 3);
    fTree.Write("/b", "");
    for (const std::size_t size : {kLimit, kLimit + 1}) {
        std::string cache = MakeLibraryCache({{"libx.so", "/a"}}, kCacheFlags);
        const auto place = static_cast<std::uint32_t>(size - path.size());
        std::memcpy(&cache[48 + 8], &place, sizeof place); // of the first entry's path
        cache.resize(place);
        fTree.Write("/etc/ld.so.cache", cache + path);
        EXPECT_EQ(Find("libx.so"), size == kLimit ? Names{"/b"} : Names()) << size;
    }
}

TEST_F(LibrarySearchTest, TakesANameWithASlashForAPath)
{
    fTree.Write("/home/me/libx.so", "");
    fTree.Write("/usr/lib/libx.so", "");
    fProcess.fFolder = "/home";
    EXPECT_EQ(Find("me/libx.so"), Names{"/home/me/libx.so"});
    EXPECT_EQ(Find("./me/../me/libx.so"), Names{"/home/me/libx.so"});
    EXPECT_EQ(Find("/usr/lib/libx.so"), Names{"/usr/lib/libx.so"});
    EXPECT_EQ(Find("/usr/libx.so"), Names());
    fProcess.fVariables["LD_LIBRARY_PATH"] = "me";
    EXPECT_EQ(Find("libx.so"), Names{"/home/me/libx.so"});
}

TEST_F(LibrarySearchTest, LooksLastInTheFoldersOfTheSystem)
{
#if defined(__x86_64__)
    const std::string machine = "x86_64-linux-gnu";
#elif defined(__aarch64__)
    const std::string machine = "aarch64-linux-gnu";
#else
    const std::string machine = "unknown";
#endif
    for (const std::string& folder :
         {"/lib/" + machine, std::string("/lib64"), std::string("/lib"), "/usr/lib/" + machine,
          std::string("/usr/lib64"), std::string("/usr/lib")}) {
        fTree.Write(folder + "/libx.so", "");
        EXPECT_EQ(Find("libx.so"), Names{folder + "/libx.so"});
        fTree.Remove(folder + "/libx.so");
    }
    EXPECT_EQ(Find("libx.so"), Names());
}

TEST_F(LibrarySearchTest, FindsVariantsForNewerProcessors)
{
    fTree.Write("/usr/lib/glibc-hwcaps/x86-64-v3/libx.so", "");
    fTree.Write("/usr/lib/libx.so", "");
    EXPECT_EQ(Find("libx.so"),
              (Names{"/usr/lib/glibc-hwcaps/x86-64-v3/libx.so", "/usr/lib/libx.so"}));
}

TEST_F(LibrarySearchTest, FollowsLinksInsideTheRoot)
{
    fTree.Write("/opt/driver/libx.so.1.2", "1234");
    fTree.Link("/etc/alternatives/libx", "/opt/current/libx.so.1.2");
    fTree.Link("/opt/current", "driver");
    fTree.Link("/usr/lib/libx.so.1", "../../etc/alternatives/libx");
    EXPECT_EQ(Find("libx.so.1"), Names{"/opt/driver/libx.so.1.2"});
    fTree.Link("/usr/lib/loop.so", "loop.so");
    fTree.Link("/usr/lib/a", "b/x");
    fTree.Link("/usr/lib/b", "a/x");
    fTree.Link("/usr/lib/gone.so", "nowhere/gone.so");
    for (const char* name : {"loop.so", "a", "b", "gone.so"})
        EXPECT_EQ(Find(name), Names()) << name;
    EXPECT_EQ(Find("/usr/lib"), Names());
    EXPECT_EQ(Find(std::string(100000, '/') + "x"), Names());
}

} // namespace
} // namespace assay_host
