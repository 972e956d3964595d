#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include "report/Causes.h"
#include "report/LogFilter.h"

namespace assay_host {
namespace {

const std::string kPrefix = "# 00004.2026.11.21_10:49:36.366(+00.000)[tid=462f] ";

// Filters a text that arrives in pieces of this size. Returns it with its log lines in brackets.
std::string Filter(std::string_view text, std::size_t size)
{
    LogFilter filter;
    std::string result;
    const auto add = [&result](const std::vector<LogFilter::Piece>& pieces) {
        for (const LogFilter::Piece& piece : pieces)
            result += piece.fIsLog ? "[" + piece.fText + "]" : piece.fText;
    };
    for (; !text.empty(); text.remove_prefix(std::min(size, text.size())))
        add(filter.Feed(text.substr(0, size)));
    add(filter.Finish());
    return result;
}

void Expect(const std::string& text, const std::string& expected)
{
    for (const std::size_t size : {std::size_t{1}, std::size_t{2}, std::size_t{7}, text.size() + 1})
        EXPECT_EQ(Filter(text, size), expected) << size;
}

TEST(LogFilter, TakesTheLogOutAndKeepsTheOrder)
{
    Expect("a=1\n" + kPrefix + "x\nb=2\r\n" + kPrefix + "y\r\n" + kPrefix + "z\nc",
           "a=1\n[" + kPrefix + "x]b=2\r\n[" + kPrefix + "y][" + kPrefix + "z]c");
    Expect(kPrefix + "broken off", "[" + kPrefix + "broken off]");
}

TEST(LogFilter, LeavesEverythingElse)
{
    for (const std::string& text : std::vector<std::string>{
             "", "\n\n", "# text\n", "# 00004\n", "# 00004.2026", "#\n# ", " " + kPrefix + "\n",
             "# 0004.2026.11.21_10:49:36.366(+00.000)[tid=1] x\n", "a=\"\xFF\nb\"\n"})
        Expect(text, text);
}

TEST(LogFilter, KnowsNumbersOfMoreDigits)
{
    EXPECT_TRUE(IsLogLine("# 1234567.2026.11.21_10:49:36.366(+00.000)[tid=1] x"));
    EXPECT_FALSE(IsLogLine("# 12345x.2026.11.21_10:49:36.366(+00.000)[tid=1] x"));
    EXPECT_EQ(GetLogText(kPrefix + "x] y"), "x] y");
    EXPECT_EQ(GetLogText("nothing"), "nothing");
}

TEST(LogFilter, CutsALongLine)
{
    LogFilter filter;
    filter.Feed(kPrefix);
    const std::string block(LogFilter::kMaxLineBytes, 'x');
    filter.Feed(block);
    filter.Feed(block);
    const std::vector<LogFilter::Piece> pieces = filter.Feed("\na=1\n");
    ASSERT_EQ(pieces.size(), 2U);
    EXPECT_TRUE(pieces[0].fIsLog);
    EXPECT_EQ(pieces[0].fText.size(), LogFilter::kMaxLineBytes);
    EXPECT_EQ(pieces[1].fText, "a=1\n");
    EXPECT_TRUE(filter.Finish().empty());
}

TEST(LogFilter, JoinsTheLinesBetweenTwoLogLines)
{
    LogFilter filter;
    const std::vector<LogFilter::Piece> pieces = filter.Feed("a\n\nb\n" + kPrefix + "x\nc\n");
    ASSERT_EQ(pieces.size(), 3U);
    EXPECT_EQ(pieces[0].fText, "a\n\nb\n");
    EXPECT_EQ(pieces[2].fText, "c\n");
}

TEST(Causes, AreTheTextsOfFailures)
{
    EXPECT_EQ(FindCauseText("Cannot create default ContextOffscreen: eglGetError is not offered"),
              "eglGetError is not offered");
    EXPECT_EQ(FindCauseText("QGF::OGL::Library::initialize() failed: no"), "no");
    EXPECT_EQ(FindCauseText("DoCompileProgramGLSL: The vertex shader doesn't compile: a | b"),
              "The vertex shader doesn't compile: a | b");
    EXPECT_EQ(FindCauseText("GPUImplHardware::DoGLGetString(7936): glGetError() returns 1282"),
              "GPUImplHardware::DoGLGetString(7936): glGetError() returns 1282");
    EXPECT_EQ(FindCauseText("qgfNumDevices=1"), "");
    EXPECT_EQ(FindCauseText("Cannot create default ContextOffscreen"), "");
    EXPECT_EQ(FindCauseText(""), "");
}

} // namespace
} // namespace assay_host
