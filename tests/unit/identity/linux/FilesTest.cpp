// The files of a machine as its identity reads them.
#include "identity/linux/Files.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include <pthread.h>
#include <sys/stat.h>

#include "MachineTree.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(FilesTest, ReadsRegularFilesUpToASize)
{
    const MachineTree tree;
    tree.Write("/file", std::string(5000, 'x') + "y");
    tree.Link("/link", "file");
    const Files files = tree.GetFiles();
    EXPECT_EQ(files.Read("/file"), std::string(5000, 'x') + "y");
    EXPECT_EQ(files.Read("/file", 5001), std::string(5000, 'x') + "y");
    EXPECT_EQ(files.Read("/file", 5000), std::string(5000, 'x'));
    EXPECT_EQ(files.Read("/file", 1), "x");
    EXPECT_EQ(files.Read("/file", 0), "");
    EXPECT_EQ(files.Read("/link", 1), "x");
    EXPECT_EQ(files.Read("/none"), "");
    EXPECT_EQ(files.Read(""), "") << "a folder";
    ASSERT_EQ(::mkfifo((tree.GetRoot() + "/pipe").c_str(), 0600), 0);
    EXPECT_EQ(files.Read("/pipe"), "") << "it would wait for a writer";
}

TEST(FilesTest, ReadsAMebibyteByDefault)
{
    const MachineTree tree;
    constexpr std::size_t kMebibyte = 1048576;
    tree.Write("/file", std::string(kMebibyte + 1, 'x'));
    EXPECT_EQ(tree.GetFiles().Read("/file").size(), kMebibyte);
}

TEST(FilesTest, ReadsAFirstLineWithoutTheBlanksAroundIt)
{
    const MachineTree tree;
    const auto read = [&tree](const std::string& bytes) {
        tree.Write("/file", bytes);
        return tree.GetFiles().ReadLine("/file");
    };
    EXPECT_EQ(read("one\ntwo\n"), "one");
    EXPECT_EQ(read("one"), "one");
    EXPECT_EQ(read(" \t\rone two\r\t \n"), "one two");
    EXPECT_EQ(read("x\n"), "x");
    EXPECT_EQ(read("\ntwo\n"), "");
    EXPECT_EQ(read(" \t\r\n"), "");
    EXPECT_EQ(read(""), "");
    EXPECT_EQ(read(std::string(4097, 'x')), std::string(4096, 'x'));
    EXPECT_EQ(tree.GetFiles().ReadLine("/none"), "");
}

std::string RepeatFolder(int times)
{
    std::string path;
    while (--times >= 0)
        path += "/a";
    return path;
}

TEST(FilesTest, FollowsFoldersUpToADepth)
{
    const MachineTree tree;
    tree.Write(RepeatFolder(128) + "/file", "");
    tree.Link("/link", RepeatFolder(127));
    EXPECT_EQ(tree.GetFiles().Resolve(RepeatFolder(128)), RepeatFolder(128));
    EXPECT_EQ(tree.GetFiles().Resolve(RepeatFolder(128) + "/file"), "");
    EXPECT_EQ(tree.GetFiles().Resolve("/link"), RepeatFolder(127));
    EXPECT_EQ(tree.GetFiles().Resolve("/link/a"), "");
}

// A library of any author may name such a path.
TEST(FilesTest, ADeepPathNeedsNoLargeStack)
{
    pthread_attr_t attributes;
    ASSERT_EQ(::pthread_attr_init(&attributes), 0);
    ASSERT_EQ(::pthread_attr_setstacksize(&attributes, std::size_t{1} << 20), 0);
    const auto resolve = [](void* /*unused*/) -> void* {
        EXPECT_EQ(Files().Resolve(RepeatFolder(2000)), "");
        return nullptr;
    };
    pthread_t thread{};
    ASSERT_EQ(::pthread_create(&thread, &attributes, resolve, nullptr), 0);
    ::pthread_join(thread, nullptr);
    ::pthread_attr_destroy(&attributes);
}

TEST(FilesTest, ListsAFolderWithoutHiddenNames)
{
    const MachineTree tree;
    for (const char* name : {"b", "B", ".b", "..b", "a.", "a.b", "c/d"})
        tree.Write(std::string("/folder/") + name, "");
    const Files files = tree.GetFiles();
    EXPECT_THAT(files.List("/folder"), ElementsAre("B", "a.", "a.b", "b", "c"));
    EXPECT_THAT(files.List("/folder/b"), IsEmpty());
    EXPECT_THAT(files.List("/none"), IsEmpty());
    EXPECT_THAT(files.List(""), IsEmpty()) << "no path, not the root";
    EXPECT_THAT(files.List("/"), ElementsAre("folder"));
}

TEST(FilesTest, ListsAtMost4096Names)
{
    const MachineTree tree;
    for (int file = 0; file < 4096; ++file)
        tree.Write("/" + std::to_string(file), "");
    EXPECT_EQ(tree.GetFiles().List("/").size(), 4096U);
    tree.Write("/more", "");
    EXPECT_EQ(tree.GetFiles().List("/").size(), 4096U);
}

TEST(FilesTest, ReadsTheTextOfALink)
{
    const MachineTree tree;
    tree.Link("/link", "no/such/file");
    tree.Link("/long", std::string(4095, 'x'));
    tree.Write("/file", "");
    const Files files = tree.GetFiles();
    EXPECT_EQ(files.ReadLink("/link"), "no/such/file");
    EXPECT_EQ(files.ReadLink("/long"), std::string(4095, 'x'));
    EXPECT_EQ(files.ReadLink("/file"), "");
    EXPECT_EQ(files.ReadLink("/none"), "");
}

TEST(FilesTest, ResolvesPaths)
{
    const MachineTree tree;
    tree.Write("/a/b/file", "");
    tree.Write("/c/file", "");
    tree.Link("/a/up", "../c");
    tree.Link("/a/top", "/c");
    const Files files = tree.GetFiles();
    EXPECT_EQ(files.Resolve("/a/b/file"), "/a/b/file");
    EXPECT_EQ(files.Resolve("/a//b/./file"), "/a/b/file");
    EXPECT_EQ(files.Resolve("/a/b/"), "/a/b");
    EXPECT_EQ(files.Resolve("/a/b/.."), "/a");
    EXPECT_EQ(files.Resolve("/a/b/../.."), "/");
    EXPECT_EQ(files.Resolve("/a/b/../../.."), "/");
    EXPECT_EQ(files.Resolve("/a/b/../../c/file"), "/c/file");
    EXPECT_EQ(files.Resolve("/a/up/file"), "/c/file");
    EXPECT_EQ(files.Resolve("/a/top/file"), "/c/file");
    EXPECT_EQ(files.Resolve("/a/top/../a"), "/a");
    EXPECT_EQ(files.Resolve("/"), "/");
    EXPECT_EQ(files.Resolve("//"), "/");
    EXPECT_EQ(files.Resolve(""), "");
    EXPECT_EQ(files.Resolve("a"), "") << "not absolute";
    EXPECT_EQ(files.Resolve("/none"), "");
    EXPECT_EQ(files.Resolve("/none/.."), "");
    EXPECT_EQ(files.Resolve("/c/file/x"), "");
}

TEST(FilesTest, ReadsTheLinksOfAFolderOnce)
{
    const MachineTree tree;
    for (const char* path : {"/old/a", "/old/b", "/new/a", "/new/b"})
        tree.Write(path, "");
    tree.Link("/folder", "old");
    const Files files = tree.GetFiles();
    EXPECT_EQ(files.Resolve("/folder/a"), "/old/a");
    tree.Remove("/folder");
    tree.Link("/folder", "new");
    EXPECT_EQ(files.Resolve("/folder/b"), "/old/b");
    EXPECT_EQ(tree.GetFiles().Resolve("/folder/b"), "/new/b");
}

TEST(FilesTest, FollowsAsManyLinksAsTheKernel)
{
    const MachineTree tree;
    tree.Write("/40", "");
    for (int link = 0; link < 40; ++link)
        tree.Link("/" + std::to_string(link), std::to_string(link + 1));
    tree.Link("/one-more", "0");
    EXPECT_EQ(tree.GetFiles().Resolve("/0"), "/40");
    EXPECT_EQ(tree.GetFiles().Resolve("/one-more"), "");
}

TEST(FilesTest, TakesPathsUpToTheLengthOfTheKernel)
{
    const MachineTree tree;
    tree.Write("/x", "");
    const Files files = tree.GetFiles();
    EXPECT_EQ(files.Resolve(std::string(4095, '/') + "x"), "/x");
    EXPECT_EQ(files.Resolve(std::string(4096, '/') + "x"), "");
}

TEST(FilesTest, FindsTheStatusOfRegularFiles)
{
    const MachineTree tree;
    tree.Write("/a/file", "12345");
    tree.Link("/link", "a/file");
    tree.Link("/other", "a");
    struct stat status {};
    ASSERT_EQ(::stat((tree.GetRoot() + "/a/file").c_str(), &status), 0);
    const Files files = tree.GetFiles();
    for (const char* path : {"/a/file", "/link", "/other/file"}) {
        const auto found = files.Find(path);
        ASSERT_TRUE(found) << path;
        EXPECT_EQ(found->fPath, "/a/file");
        EXPECT_EQ(found->fSize, 5U);
        EXPECT_EQ(found->fTime, status.st_mtim.tv_sec * 1000000000LL + status.st_mtim.tv_nsec);
        EXPECT_EQ(found->fNode.first, status.st_dev);
        EXPECT_EQ(found->fNode.second, status.st_ino);
    }
    for (const char* path : {"/a", "/other", "/none", "a/file", "", "/"})
        EXPECT_FALSE(files.Find(path)) << path;
}

} // namespace
} // namespace assay_host
