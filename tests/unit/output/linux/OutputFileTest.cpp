#include "output/Output.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <system_error>
#include <thread>
#include <vector>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "output/Links.h"

namespace assay_host {
namespace {

namespace fs = std::filesystem;
using testing::ElementsAre;

class OutputFileTest : public testing::Test {
protected:
    OutputFileTest()
    {
        std::string name = testing::TempDir() + "assay-output-XXXXXX";
        if (::mkdtemp(name.data()) == nullptr)
            throw std::system_error(errno, std::generic_category(), name);
        fFolder = name;
    }
    ~OutputFileTest() override
    {
        std::error_code ignored;
        fs::remove_all(fFolder, ignored);
    }

    std::string GetPath(const std::string& name) const { return fFolder + "/" + name; }

    std::vector<std::string> List() const
    {
        std::vector<std::string> names;
        for (const fs::directory_entry& entry : fs::directory_iterator(fFolder))
            names.push_back(entry.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }

    static std::string Read(const std::string& path)
    {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }

    static ::mode_t GetMode(const std::string& path)
    {
        struct stat found = {};
        EXPECT_EQ(::stat(path.c_str(), &found), 0);
        return found.st_mode & 07777;
    }

    static void WriteAll(const std::string& path, std::string_view text)
    {
        const std::unique_ptr<Output> output = OpenFile(path);
        output->Open();
        output->Write(text);
        output->Finish();
    }

    static std::string GetFailure(const std::string& path)
    {
        try {
            WriteAll(path, "text");
        } catch (const std::runtime_error& failure) {
            return failure.what();
        }
        return "no failure";
    }

    std::string fFolder;
};

TEST_F(OutputFileTest, AppearsWhenItIsFinished)
{
    const std::string path = GetPath("report");
    const ::mode_t mask = ::umask(027);
    {
        const std::unique_ptr<Output> output = OpenFile(path);
        ASSERT_EQ(List().size(), 1U);
        EXPECT_THAT(List().front(), testing::MatchesRegex("\\.report\\.[0-9a-f]{8}\\.tmp"));
        output->Open();
        output->Write("one ");
        output->Write("two");
        EXPECT_FALSE(fs::exists(path));
        output->Finish();
        EXPECT_THAT(List(), ElementsAre("report"));
        output->Abandon(); // what is finished stays
    }
    ::umask(mask);
    EXPECT_THAT(List(), ElementsAre("report"));
    EXPECT_EQ(Read(path), "one two");
    EXPECT_EQ(GetMode(path), 0640U);
}

TEST_F(OutputFileTest, MayBeReadAndChangedByAllWhoTheUserAllows)
{
    const ::mode_t mask = ::umask(0);
    WriteAll(GetPath("report"), "text");
    ::umask(mask);
    EXPECT_EQ(GetMode(GetPath("report")), 0666U);
}

TEST_F(OutputFileTest, NamesAFolderThatComesIntoItsPlace)
{
    const std::string path = GetPath("report");
    const std::unique_ptr<Output> output = OpenFile(path);
    fs::create_directory(path);
    try {
        output->Finish();
        FAIL() << "nothing thrown";
    } catch (const std::runtime_error& failure) {
        EXPECT_EQ(failure.what(), "cannot write " + path + ": Is a directory");
    }
    output->Abandon();
    EXPECT_THAT(List(), ElementsAre("report"));
}

// The path is a link that only the system can follow.
TEST_F(OutputFileTest, MayBeAnOpenPipe)
{
    int ends[2];
    ASSERT_EQ(::pipe2(ends, O_CLOEXEC), 0);
    WriteAll("/proc/self/fd/" + std::to_string(ends[1]), "text");
    char text[8] = {};
    EXPECT_EQ(::read(ends[0], text, sizeof text), 4);
    EXPECT_STREQ(text, "text");
    ::close(ends[0]);
    ::close(ends[1]);
}

TEST_F(OutputFileTest, ClosesItsFileAndNoOther)
{
    const auto countOpen = [] {
        return std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator());
    };
    const auto before = countOpen();
    const std::string path = GetPath("report");
    const ::pid_t child = ::fork(); // which may lose its streams
    ASSERT_GE(child, 0);
    if (child == 0) {
        OpenFile("/dev/null"); // not opened yet
        WriteAll(path, "finished");
        OpenFile(path); // not finished
        ::_exit(countOpen() == before ? 0 : 1);
    }
    int status = -1;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
}

TEST_F(OutputFileTest, LeavesNothingUnfinished)
{
    const std::string path = GetPath("report");
    WriteAll(path, "old");
    {
        const std::unique_ptr<Output> output = OpenFile(path);
        output->Open();
        output->Write("new");
    }
    EXPECT_THAT(List(), ElementsAre("report"));
    const std::unique_ptr<Output> output = OpenFile(path);
    EXPECT_EQ(List().size(), 2U);
    output->Abandon();
    EXPECT_THAT(List(), ElementsAre("report"));
    EXPECT_EQ(Read(path), "old");
}

TEST_F(OutputFileTest, KeepsTheModeOfTheFileThatItReplaces)
{
    const std::string path = GetPath("report");
    WriteAll(path, "old");
    ASSERT_EQ(::chmod(path.c_str(), 0604), 0);
    WriteAll(path, "new");
    EXPECT_EQ(Read(path), "new");
    EXPECT_EQ(GetMode(path), 0604U);
}

TEST_F(OutputFileTest, ReplacesWhatALinkLeadsTo)
{
    fs::create_directory(GetPath("folder"));
    fs::create_symlink("folder/report", GetPath("second"));
    fs::create_symlink("second", GetPath("first"));
    for (const char* text : {"made", "replaced"}) { // first there is no file yet
        WriteAll(GetPath("first"), text);
        EXPECT_EQ(Read(GetPath("folder/report")), text);
        EXPECT_TRUE(fs::is_symlink(GetPath("first")));
        EXPECT_TRUE(fs::is_symlink(GetPath("second")));
    }
}

TEST_F(OutputFileTest, WritesToADeviceOrPipeItself)
{
    WriteAll("/dev/null", "text");
    EXPECT_TRUE(fs::is_character_file("/dev/null"));

    const std::string pipe = GetPath("pipe");
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    std::thread writer([&] { WriteAll(pipe, "through the pipe"); });
    EXPECT_EQ(Read(pipe), "through the pipe");
    writer.join();
    EXPECT_THAT(List(), ElementsAre("pipe"));
    EXPECT_TRUE(fs::is_fifo(pipe));
}

TEST_F(OutputFileTest, NamesTheFileThatCannotBeWritten)
{
    EXPECT_EQ(GetFailure(GetPath("none/report")),
              "cannot write " + GetPath("none/report") + ": No such file or directory");
    fs::create_symlink("loop", GetPath("loop"));
    EXPECT_EQ(GetFailure(GetPath("loop")),
              "cannot write " + GetPath("loop") + ": Too many levels of symbolic links");
    WriteAll(GetPath("file"), "");
    EXPECT_EQ(GetFailure(GetPath("file/report")),
              "cannot write " + GetPath("file/report") + ": Not a directory");
    EXPECT_EQ(GetFailure("/dev/full"), "cannot write /dev/full: No space left on device");
    EXPECT_THAT(List(), ElementsAre("file", "loop"));
}

TEST_F(OutputFileTest, NamesAFolderThatIsInItsPlace)
{
    fs::create_directory(GetPath("folder"));
    EXPECT_EQ(GetFailure(GetPath("folder")),
              "cannot write " + GetPath("folder") + ": Is a directory");
    EXPECT_THAT(List(), ElementsAre("folder"));
}

std::string GetNewFailure(const std::string& path)
{
    try {
        OpenNewFile(path);
    } catch (const std::runtime_error& failure) {
        return failure.what();
    }
    return "no failure";
}

TEST_F(OutputFileTest, ANewFileReplacesNothing)
{
    const std::string path = GetPath("report");
    const std::string failure = "cannot write " + path + ": File exists";
    {
        const std::unique_ptr<Output> output = OpenNewFile(path);
        output->Open();
        output->Write("text");
        output->Finish();
    }
    EXPECT_EQ(Read(path), "text");
    EXPECT_EQ(GetNewFailure(path), failure);
    fs::remove(path);
    fs::create_symlink("nothing", path);
    EXPECT_EQ(GetNewFailure(path), failure);
    fs::remove(path);
    // Another one comes before its end.
    {
        const std::unique_ptr<Output> output = OpenNewFile(path);
        output->Open();
        output->Write("text");
        OutputFileTest::WriteAll(path, "other");
        try {
            output->Finish();
            ADD_FAILURE();
        } catch (const std::runtime_error& caught) {
            EXPECT_EQ(caught.what(), failure);
        }
    }
    EXPECT_EQ(Read(path), "other");
    EXPECT_THAT(List(), ElementsAre("report"));
}

TEST_F(OutputFileTest, ReplacesWhatALinkToAnAbsolutePathLeadsTo)
{
    fs::create_symlink(GetPath("report"), GetPath("link"));
    EXPECT_EQ(FollowLinks(GetPath("link")).string(), GetPath("report"));
    for (const char* text : {"made", "replaced"}) {
        WriteAll(GetPath("link"), text);
        EXPECT_EQ(Read(GetPath("report")), text);
    }
    EXPECT_THAT(List(), ElementsAre("link", "report"));
}

TEST_F(OutputFileTest, FollowsAsManyLinksAsTheSystem)
{
    // link0 -> link1 -> ... -> link41, which isn't there
    for (int link = 0; link < 41; ++link)
        fs::create_symlink("link" + std::to_string(link + 1),
                           GetPath("link" + std::to_string(link)));
    EXPECT_EQ(FollowLinks(GetPath("link1")).filename().string(), "link41");
    EXPECT_EQ(FollowLinks(GetPath("link0")).filename().string(), "link40");
    EXPECT_EQ(FollowLinks(GetPath("link41")).filename().string(), "link41");
}

} // namespace
} // namespace assay_host
