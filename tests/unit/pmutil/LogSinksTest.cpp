#include "pmutil/LogSinks.h"

#include <cstdio>

#include <gmock/gmock.h>

#include "RecordingLogger.h"
#include "TempFolder.h"
#include "all/PathCodecvt.h"
#include "pmutil/System.h"

namespace pmutil {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::StartsWith;

DebugValue gOn{"LogSinksTest.on", 1};

class LogSinksTest : public testing::Test {
protected:
    void SetUp() override { InitLogging(); }
};

std::string ReadStream(std::FILE* file)
{
    std::string text;
    std::rewind(file);
    for (int c = std::fgetc(file); c != EOF; c = std::fgetc(file))
        text += static_cast<char>(c);
    return text;
}

TEST_F(LogSinksTest, NullLoggerIsDisabledAndSwallowsEverything)
{
    PMNullLogger logger;
    EXPECT_EQ(logger.GetName(), "PMNullLogger");
    EXPECT_FALSE(logger.IsEnabled(0));
    EXPECT_FALSE(logger.IsEnabledWrapper());
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    PM_LOG(gOn, "text");
    logger.LogPrintf(nullptr, 0, "text");
    logger.WriteText("text", 4);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST_F(LogSinksTest, StdioLoggerIsNamedByItsStream)
{
    std::FILE* const file = std::tmpfile();
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(PMStdioLogger(stdout).GetName(), "stdout");
    EXPECT_EQ(PMStdioLogger(stderr).GetName(), "stderr");
    EXPECT_EQ(PMStdioLogger(file).GetName(), "FILE*");
    EXPECT_EQ(PMStdioLogger(nullptr).GetName(), "FILE*");
    std::fclose(file);
}

TEST_F(LogSinksTest, StdioLoggerWritesLinesAndLeavesTheStreamOpen)
{
    std::FILE* const file = std::tmpfile();
    ASSERT_NE(file, nullptr);
    {
        PMStdioLogger logger(file);
        PM_LOG(gOn, "one");
        PM_LOG(gOn, "two");
    }
    ASSERT_GE(std::fputs("own\n", file), 0);
    const std::string text = ReadStream(file);
    EXPECT_THAT(text, StartsWith("00000."));
    EXPECT_THAT(text, HasSubstr("] one\n00001."));
    EXPECT_THAT(text, EndsWith("] two\nown\n"));
    std::fclose(file);
}

TEST_F(LogSinksTest, StdioLoggerFlushesEachLine)
{
    const TempFolder folder;
    const std::string path = folder.File("log");
    std::FILE* const file = std::fopen(path.c_str(), "wb");
    ASSERT_NE(file, nullptr);
    {
        PMStdioLogger logger(file);
        PM_LOG(gOn, "one");
        EXPECT_THAT(ReadWhole(path), EndsWith("] one\n"));
    }
    std::fclose(file);
}

TEST_F(LogSinksTest, StdioLoggerWithANullStreamWritesNothing)
{
    PMStdioLogger logger(nullptr);
    PM_LOG(gOn, "text");
    logger.Flush();
    logger.Write("x", 1);
    EXPECT_TRUE(logger.IsEnabled(0));
}

TEST_F(LogSinksTest, AssayLoggerWritesReportCommentsToStandardOutput)
{
    testing::internal::CaptureStdout();
    {
        AssayLogger logger;
        EXPECT_EQ(logger.GetName(), "stdout");
        PM_LOG(gOn, "one");
        PM_LOG(gOn, "two");
    }
    const std::string text = testing::internal::GetCapturedStdout();
    EXPECT_THAT(text, StartsWith("# 00000."));
    EXPECT_THAT(text, HasSubstr("] one\n# 00001."));
    EXPECT_THAT(text, EndsWith("] two\n"));
}

TEST_F(LogSinksTest, AssayLoggerLosesNothingThatWasNotFlushed)
{
    testing::internal::CaptureStdout();
    {
        AssayLogger logger;
        logger.WriteText("one ", 4);
        logger.WriteText("two", 3);
    }
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "one two");
}

class PMFileLoggerTest : public LogSinksTest {
protected:
    std::wstring WideFolder() const { return fFolder.Path().wstring(GetPathCodecvt()); }
    bool Exists(const std::string& name) const
    {
        return boost::filesystem::exists(fFolder.Path() / name);
    }
    std::string Text(const std::string& name) const { return ReadWhole(fFolder.File(name)); }
    void Put(const std::string& name, const std::string& text) const
    {
        std::ofstream(fFolder.File(name), std::ios::binary) << text;
    }

    TempFolder fFolder;
};

TEST_F(PMFileLoggerTest, NullNameIsPmlog)
{
    PMFileLogger logger(WideFolder(), nullptr);
    EXPECT_EQ(logger.GetName(), "pmlog.txt");
    PM_LOG(gOn, "text");
    EXPECT_THAT(Text("pmlog.txt"), EndsWith("] text\n"));
}

TEST_F(PMFileLoggerTest, LogsIntoTheDesktopFolder)
{
    const std::wstring desktop = GetDesktopFolder();
    const PMFileLogger logger("assay-unit-test-never-written.txt");
    if (desktop.empty())
        EXPECT_EQ(logger.GetPath(), L"assay-unit-test-never-written.txt");
    else
        EXPECT_EQ(logger.GetPath(),
                  desktop + static_cast<wchar_t>(boost::filesystem::path::preferred_separator) +
                      L"assay-unit-test-never-written.txt");
}

TEST_F(PMFileLoggerTest, WithoutAFolderThePathIsTheBareName)
{
    const PMFileLogger logger(std::wstring(), "never-written.txt");
    EXPECT_EQ(logger.GetPath(), L"never-written.txt");
}

TEST_F(PMFileLoggerTest, BeginsAnewWithTheFirstLoggerOfTheProcess)
{
    Put("anew.txt", "of an earlier process\n");
    PMFileLogger logger(WideFolder(), "anew.txt");
    EXPECT_FALSE(Exists("anew.txt"));
    PM_LOG(gOn, "text");
    EXPECT_THAT(Text("anew.txt"), StartsWith("00000."));
}

TEST_F(PMFileLoggerTest, SecondLoggerOnThePathAppends)
{
    {
        PMFileLogger logger(WideFolder(), "twice.txt");
        PM_LOG(gOn, "one");
    }
    PMFileLogger logger(WideFolder(), "twice.txt");
    PM_LOG(gOn, "two");
    EXPECT_THAT(Text("twice.txt"), HasSubstr("] one\n00000."));
    EXPECT_THAT(Text("twice.txt"), EndsWith("] two\n"));
}

TEST_F(PMFileLoggerTest, TwoLiveLoggersOnOneNameBothWrite)
{
    PMFileLogger first(WideFolder(), "both.txt");
    PM_LOG(gOn, "one");
    PMFileLogger second(WideFolder(), "both.txt"); // the first one logs its construction
    PM_LOG(gOn, "two");
    first.LogPrintf(nullptr, 0, "three");
    const std::string text = Text("both.txt");
    const auto one = text.find("] one\n");
    const auto activating = text.find("] Activating new logger both.txt\n");
    const auto two = text.find("] two\n");
    const auto three = text.find("] three\n");
    EXPECT_NE(three, std::string::npos) << text;
    EXPECT_LT(one, activating);
    EXPECT_LT(activating, two);
    EXPECT_LT(two, three);
}

TEST_F(PMFileLoggerTest, LoggerThatWroteNothingLeavesNoFile)
{
    {
        const PMFileLogger logger(WideFolder(), "empty.txt");
        Put("empty.txt", "");
    }
    EXPECT_FALSE(Exists("empty.txt"));
    {
        const PMFileLogger logger(WideFolder(), "none.txt");
    }
    EXPECT_FALSE(Exists("none.txt"));
}

TEST_F(PMFileLoggerTest, FileThatHoldsSomethingStays)
{
    {
        PMFileLogger logger(WideFolder(), "stays.txt");
        PM_LOG(gOn, "text");
    }
    EXPECT_THAT(Text("stays.txt"), EndsWith("] text\n"));
}

TEST_F(PMFileLoggerTest, UnfinishedLineIsOnDiskAfterTheLoggerDied)
{
    {
        PMFileLogger logger(WideFolder(), "piece.txt");
        logger.WriteText("piece", 5);
    }
    EXPECT_EQ(Text("piece.txt"), "piece");
}

TEST_F(PMFileLoggerTest, EachLineIsOnDiskAndTheFileClosedBehindIt)
{
    PMFileLogger logger(WideFolder(), "closed.txt");
    PM_LOG(gOn, "one");
    EXPECT_THAT(Text("closed.txt"), EndsWith("] one\n"));
    boost::filesystem::rename(fFolder.Path() / "closed.txt", fFolder.Path() / "moved.txt");
    PM_LOG(gOn, "two");
    EXPECT_THAT(Text("closed.txt"), StartsWith("00001."));
    EXPECT_THAT(Text("moved.txt"), EndsWith("] one\n"));
}

TEST_F(PMFileLoggerTest, FileThatCannotBeOpenedCostsTheLineAndIsToldOnce)
{
    const auto missing = fFolder.Path() / "missing";
    testing::internal::CaptureStderr();
    {
        PMFileLogger logger(missing.wstring(GetPathCodecvt()), "log.txt");
        PM_LOG(gOn, "lost");
        PM_LOG(gOn, "lost too");
        boost::filesystem::create_directory(missing);
        PM_LOG(gOn, "found");
        EXPECT_THAT(ReadWhole((missing / "log.txt").string()), StartsWith("00002."));
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "PMFileLogger: the log file " +
                                                          (missing / "log.txt").string() +
                                                          " can't be opened\n");
    EXPECT_THAT(ReadWhole((missing / "log.txt").string()), EndsWith("] found\n"));
}

TEST_F(PMFileLoggerTest, FolderAtThePathIsLeftAlone)
{
    boost::filesystem::create_directory(fFolder.Path() / "folder");
    testing::internal::CaptureStderr();
    {
        PMFileLogger logger(WideFolder(), "folder");
        PM_LOG(gOn, "lost");
    }
    EXPECT_THAT(testing::internal::GetCapturedStderr(), EndsWith("can't be opened\n"));
    EXPECT_TRUE(Exists("folder"));
}

} // namespace
} // namespace pmutil
