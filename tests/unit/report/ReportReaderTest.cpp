#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "Lines.h"
#include "report/ReportReader.h"

namespace assay_host {
namespace {

ReportLine Text(std::string text, std::string end, std::string key, std::string value)
{
    return {LineKind::kValue,
            std::move(text),
            std::move(end),
            false,
            std::move(key),
            std::move(value),
            true};
}

ReportLine Plain(std::string text, std::string end, std::string key, std::string value)
{
    return {LineKind::kValue, std::move(text),  std::move(end), false,
            std::move(key),   std::move(value), false};
}

ReportLine Comment(std::string text, std::string end = "\n")
{
    return {LineKind::kComment, std::move(text), std::move(end), false, {}, {}, false};
}

ReportLine Raw(std::string text, std::string end = "\n")
{
    return {LineKind::kRaw, std::move(text), std::move(end), false, {}, {}, false};
}

using Lines = std::vector<ReportLine>;

TEST(ReportReader, ReadsEachFormOfLine)
{
    EXPECT_EQ(ReadLines("NumGLGPUs=2\n"), Lines{Plain("NumGLGPUs=2", "\n", "NumGLGPUs", "2")});
    EXPECT_EQ(ReadLines("Tester=\"Pixmere\"\n"),
              Lines{Text("Tester=\"Pixmere\"", "\n", "Tester", "Pixmere")});
    EXPECT_EQ(ReadLines("glgpu[0].GLMemoryMB=4096\n"),
              Lines{Plain("glgpu[0].GLMemoryMB=4096", "\n", "glgpu[0].GLMemoryMB", "4096")});
    EXPECT_EQ(
        ReadLines("clgpu[1].CLName=\"Some device\"\n"),
        Lines{Text("clgpu[1].CLName=\"Some device\"", "\n", "clgpu[1].CLName", "Some device")});
    EXPECT_EQ(ReadLines("gputag.GL_MAX_TEXTURE_UNITS=34018\n"),
              Lines{Plain("gputag.GL_MAX_TEXTURE_UNITS=34018", "\n", "gputag.GL_MAX_TEXTURE_UNITS",
                          "34018")});
    EXPECT_EQ(ReadLines("glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]=[8]\n"),
              Lines{Plain("glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]=[8]", "\n",
                          "glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]", "[8]")});
    EXPECT_EQ(ReadLines("glgpu[0].extension[QGF::OGL::GL_ARB_VERTEX_SHADER]=1\n"),
              Lines{Plain("glgpu[0].extension[QGF::OGL::GL_ARB_VERTEX_SHADER]=1", "\n",
                          "glgpu[0].extension[QGF::OGL::GL_ARB_VERTEX_SHADER]", "1")});
    EXPECT_EQ(ReadLines("# text\n"), Lines{Comment("# text")});
}

TEST(ReportReader, SplitsAtTheFirstEqualsSign)
{
    EXPECT_EQ(ReadLines("a=b=c\n"), Lines{Plain("a=b=c", "\n", "a", "b=c")});
    EXPECT_EQ(ReadLines("a=\"b=\"c\"\n"), Lines{Text("a=\"b=\"c\"", "\n", "a", "b=\"c")});
    EXPECT_EQ(ReadLines("a=\n"), Lines{Plain("a=", "\n", "a", "")});
    EXPECT_EQ(ReadLines("a=\"\"\n"), Lines{Text("a=\"\"", "\n", "a", "")});
    EXPECT_EQ(ReadLines("a=\"\"\"\n"), Lines{Text("a=\"\"\"", "\n", "a", "\"")});
    EXPECT_EQ(ReadLines("a=b\"\n"), Lines{Plain("a=b\"", "\n", "a", "b\"")});
}

TEST(ReportReader, KeepsOtherLinesRaw)
{
    EXPECT_EQ(ReadLines("!~=1\n"), Lines{Plain("!~=1", "\n", "!~", "1")});
    for (const char* text : {"", "text", "=1", " a=1", "a b=1", "\"a\"=1", "a\x80=1", "a\x7F=1",
                             " # text", "DoStdout failed"})
        EXPECT_EQ(ReadLines(std::string(text) + "\n"), Lines{Raw(text)}) << text;
}

TEST(ReportReader, KeepsTheLineEnd)
{
    EXPECT_EQ(ReadLines("a=1\r\nb=\"2\"\r\n# c\r\nd\r\n\r\n"),
              (Lines{Plain("a=1", "\r\n", "a", "1"), Text("b=\"2\"", "\r\n", "b", "2"),
                     Comment("# c", "\r\n"), Raw("d", "\r\n"), Raw("", "\r\n")}));
    EXPECT_EQ(ReadLines("a=1\r\r\nb\rc\n"),
              (Lines{Plain("a=1\r", "\r\n", "a", "1\r"), Raw("b\rc")}));
}

TEST(ReportReader, ReturnsAnIncompleteLastLine)
{
    EXPECT_EQ(ReadLines("a=1\nb=2"),
              (Lines{Plain("a=1", "\n", "a", "1"), Plain("b=2", "", "b", "2")}));
    EXPECT_EQ(ReadLines("a=\"1\""), Lines{Text("a=\"1\"", "", "a", "1")});
    EXPECT_EQ(ReadLines("a=\"1"), Lines{Raw("a=\"1", "")});
    EXPECT_EQ(ReadLines("# te"), Lines{Comment("# te", "")});
    EXPECT_EQ(ReadLines("a=1\r"), Lines{Plain("a=1\r", "", "a", "1\r")});
    EXPECT_EQ(ReadLines(""), Lines{});
}

TEST(ReportReader, ContinuesAQuoteAcrossLines)
{
    EXPECT_EQ(ReadLines("a=\"one\ntwo\"\n"), Lines{Text("a=\"one\ntwo\"", "\n", "a", "one\ntwo")});
    EXPECT_EQ(ReadLines("a=\"\n\n\"\r\n"), Lines{Text("a=\"\n\n\"", "\r\n", "a", "\n\n")});
    EXPECT_EQ(ReadLines("a=\"one\r\ntwo\"\r\n"),
              Lines{Text("a=\"one\r\ntwo\"", "\r\n", "a", "one\r\ntwo")});
    EXPECT_EQ(ReadLines("a=\"one\nb=\"two\"\n"),
              Lines{Text("a=\"one\nb=\"two\"", "\n", "a", "one\nb=\"two")});
    EXPECT_EQ(ReadLines("a=\"one\n\"two\" three\nfour\"\nb=1\n"),
              (Lines{Text("a=\"one\n\"two\" three\nfour\"", "\n", "a", "one\n\"two\" three\nfour"),
                     Plain("b=1", "\n", "b", "1")}));
    EXPECT_EQ(ReadLines("a=\"one\" two\n\"\n"),
              Lines{Text("a=\"one\" two\n\"", "\n", "a", "one\" two\n")});
}

TEST(ReportReader, ReleasesAnOpenQuoteBeforeALineOfTheReport)
{
    for (const char* own :
         {"# log", "#", "glgpu[0].GLVendor=\"x", "clgpu[12].CLName=", "gputag.GL_X=1", "Tester=1",
          "assayStart=1", "QGFCoreInitialized=1", "QGFOGLInitialized=0", "OGLContextCreated=1",
          "NumGLGPUs=0", "NumCLGPUs=0", "assayEnd=\"2026"}) {
        const Lines lines = ReadLines(std::string("a=\"one\ntwo\nb=2\n") + own + "\n");
        ASSERT_EQ(lines.size(), 4U) << own;
        EXPECT_EQ(lines[0], Raw("a=\"one"));
        EXPECT_EQ(lines[1], Raw("two"));
        EXPECT_EQ(lines[2], Plain("b=2", "\n", "b", "2"));
        EXPECT_EQ(lines[3].fText, own);
    }
    for (const char* other : {"glgpu[].X=1", "glgpu[0]X=1", "gputagX=1", "Tester", "NumGLGPUsX=1",
                              "Tester x=1", "", " # log"})
        EXPECT_EQ(ReadLines(std::string("a=\"one\n") + other + "\nend\"\n").size(), 1U) << other;
}

TEST(ReportReader, OpensNoQuoteInAComment)
{
    EXPECT_EQ(ReadLines("#a=\"x\ny\"\n"), (Lines{Comment("#a=\"x"), Raw("y\"")}));
}

TEST(ReportReader, OpensANewQuoteAfterAReleasedOne)
{
    EXPECT_EQ(
        ReadLines("glgpu[0].GLName=\"one\nglgpu[0].GLVendor=\"two\nthree\"\nx\n"),
        (Lines{Raw("glgpu[0].GLName=\"one"),
               Text("glgpu[0].GLVendor=\"two\nthree\"", "\n", "glgpu[0].GLVendor", "two\nthree"),
               Raw("x")}));
}

TEST(ReportReader, ReleasesAnOpenQuoteAtTheEnd)
{
    EXPECT_EQ(ReadLines("a=\"one\nb=2\n# c"),
              (Lines{Raw("a=\"one"), Plain("b=2", "\n", "b", "2"), Comment("# c", "")}));
    EXPECT_EQ(ReadLines("a=\"one\nb=\"two\nc=\"three\nd"),
              (Lines{Raw("a=\"one"), Raw("b=\"two"), Raw("c=\"three"), Raw("d", "")}));
    EXPECT_EQ(ReadLines("a=\"one\ntwo\""), Lines{Text("a=\"one\ntwo\"", "", "a", "one\ntwo")});
}

TEST(ReportReader, AcceptsAnyByte)
{
    std::string all;
    for (int byte = 0; byte < 256; ++byte)
        if (byte != '\n')
            all += static_cast<char>(byte);
    EXPECT_EQ(ReadLines("a=\"" + all + "\"\n"), Lines{Text("a=\"" + all + "\"", "\n", "a", all)});
    EXPECT_EQ(ReadLines(all + "\n"), Lines{Raw(all)});
    EXPECT_EQ(ReadLines("# " + all + "\n"), Lines{Comment("# " + all)});
    const std::string zeros("\0\0\n\0=\0\n", 7);
    EXPECT_EQ(ReadLines(zeros), (Lines{Raw(std::string(2, '\0')), Raw(std::string("\0=\0", 3))}));
}

// Has quotes, both kinds of line end, and quotes that stay open, to be split at any byte.
constexpr const char* kMixed = "Tester=\"Pixmere\"\r\n"
                               "glgpu[0].GLName=\"one \"two\".\r\nthree\r\n\"\r\n"
                               "glgpu[0].GLVendor=\"open\n"
                               "still\r\r\n"
                               "glgpu[0].GLMemoryMB=1\n"
                               "\n\r\n\r"
                               "# comment \"\n"
                               "a=\"\n\n"
                               "b=[8, 4]\r";

TEST(ReportReader, IgnoresWhereTheDataIsSplit)
{
    const std::string text = kMixed;
    const Lines whole = ReadLines(text);
    EXPECT_EQ(whole.size(), 11U);
    for (std::size_t piece = 1; piece <= text.size(); ++piece)
        EXPECT_EQ(ReadLines(text, piece), whole) << piece;
    for (std::size_t split = 0; split <= text.size(); ++split) {
        ReportReader reader;
        Lines lines = reader.Feed(text.substr(0, split));
        for (ReportLine& line : reader.Feed(text.substr(split)))
            lines.push_back(std::move(line));
        for (ReportLine& line : reader.Finish())
            lines.push_back(std::move(line));
        EXPECT_EQ(lines, whole) << split;
        EXPECT_EQ(reader.GetByteCount(), text.size());
        EXPECT_EQ(reader.GetLostByteCount(), 0U);
    }
}

TEST(ReportReader, ReturnsALineAsSoonAsItIsComplete)
{
    ReportReader reader;
    EXPECT_TRUE(reader.Feed("a=").empty());
    EXPECT_TRUE(reader.Feed("1").empty());
    EXPECT_EQ(reader.Feed("\nb=2"), Lines{Plain("a=1", "\n", "a", "1")});
    EXPECT_TRUE(reader.Feed("").empty());
    EXPECT_TRUE(reader.Feed("\r").empty());
    EXPECT_EQ(reader.Feed("\n"), Lines{Plain("b=2", "\r\n", "b", "2")});
    EXPECT_TRUE(reader.Finish().empty());
}

TEST(ReportReader, KeepsEveryByte)
{
    const Report report = ReadReport(kMixed);
    EXPECT_EQ(report.ToText(), kMixed);
}

TEST(ReportReader, CanBeUsedAgainAfterFinish)
{
    ReportReader reader;
    reader.Feed("a=\"1\nb");
    reader.Finish();
    EXPECT_TRUE(reader.Finish().empty());
    EXPECT_EQ(reader.Feed("c\"\n"), Lines{Raw("c\"")});
    EXPECT_EQ(reader.GetByteCount(), 9U);
    reader.Feed("a\r");
    EXPECT_EQ(reader.Finish(), Lines{Raw("a\r", "")});
    EXPECT_EQ(reader.Feed("b\n"), Lines{Raw("b")});
}

// Reads the text in pieces of every size, and checks that the lines and the counts are the same.
Lines ReadWithLimits(const std::string& text, const ReportReader::Limits& limits,
                     std::uint64_t expectedLost)
{
    Lines whole;
    for (std::size_t piece = text.size(); piece > 0; --piece) {
        ReportReader reader(limits);
        Lines lines;
        for (std::size_t at = 0; at < text.size(); at += piece)
            for (ReportLine& line : reader.Feed(std::string_view(text).substr(at, piece)))
                lines.push_back(std::move(line));
        for (ReportLine& line : reader.Finish())
            lines.push_back(std::move(line));
        EXPECT_EQ(reader.GetByteCount(), text.size()) << piece;
        EXPECT_EQ(reader.GetLostByteCount(), expectedLost) << piece;
        if (piece == text.size())
            whole = lines;
        EXPECT_EQ(lines, whole) << piece;
    }
    return whole;
}

ReportLine Cut(ReportLine line)
{
    line.fCut = true;
    return line;
}

TEST(ReportReader, CutsALineThatIsTooLong)
{
    ReportReader::Limits limits;
    limits.fMaxLineBytes = 8;
    EXPECT_EQ(ReadWithLimits("a=123456\na=1234567\nb=1\n", limits, 1),
              (Lines{Plain("a=123456", "\n", "a", "123456"),
                     Cut(Plain("a=123456", "\n", "a", "123456")), Plain("b=1", "\n", "b", "1")}));
    EXPECT_EQ(
        ReadWithLimits("a=\"123456\"\r\nb=1\r\n", limits, 2),
        (Lines{Cut(Text("a=\"12345", "\r\n", "a", "12345")), Plain("b=1", "\r\n", "b", "1")}));
    EXPECT_EQ(ReadWithLimits("# 3456789\n1234567890", limits, 3),
              (Lines{Cut(Comment("# 345678")), Cut(Raw("12345678", ""))}));
    EXPECT_EQ(ReadWithLimits("12345678\r\n12345678\rx\n", limits, 2),
              (Lines{Raw("12345678", "\r\n"), Cut(Raw("12345678"))}));
}

TEST(ReportReader, ReleasesAQuoteThatIsTooLong)
{
    ReportReader::Limits limits;
    limits.fMaxLineBytes = 12;
    EXPECT_EQ(ReadWithLimits("a=\"34\n7890\"\n", limits, 0),
              Lines{Text("a=\"34\n7890\"", "\n", "a", "34\n7890")});
    EXPECT_EQ(ReadWithLimits("a=\"34\n789012\"\n", limits, 0),
              (Lines{Raw("a=\"34"), Raw("789012\"")}));
    EXPECT_EQ(ReadWithLimits("a=\"34\n7890\"\nb=\"34\n78901\"\n", limits, 0),
              (Lines{Text("a=\"34\n7890\"", "\n", "a", "34\n7890"),
                     Text("b=\"34\n78901\"", "\n", "b", "34\n78901")}));
    EXPECT_EQ(
        ReadWithLimits("a=\"34\n# x\nb=\"34\n78901\"\n", limits, 0),
        (Lines{Raw("a=\"34"), Comment("# x"), Text("b=\"34\n78901\"", "\n", "b", "34\n78901")}));
    EXPECT_EQ(ReadWithLimits("a=\"34\nb=\"7890\n1\"\n", limits, 0),
              (Lines{Raw("a=\"34"), Text("b=\"7890\n1\"", "\n", "b", "7890\n1")}));
    EXPECT_EQ(ReadWithLimits("a=\"34\n0123456789012345\"\n", limits, 5),
              (Lines{Raw("a=\"34"), Cut(Raw("012345678901"))}));
}

TEST(ReportReader, DropsBytesBeyondTheLimit)
{
    ReportReader::Limits limits;
    limits.fMaxBytes = 6;
    EXPECT_EQ(ReadWithLimits("a=1\nb=\nc=2\n", limits, 5),
              (Lines{Plain("a=1", "\n", "a", "1"), Cut(Plain("b=", "", "b", ""))}));
    EXPECT_EQ(ReadWithLimits("a=1\nb\nc\n", limits, 2),
              (Lines{Plain("a=1", "\n", "a", "1"), Raw("b")}));
    EXPECT_EQ(ReadWithLimits("a=\"1\n\r\n\n", limits, 2),
              (Lines{Raw("a=\"1"), Cut(Raw("\r", ""))}));
}

TEST(ReportReader, DoesNotCountWhatIsCutFromALine)
{
    ReportReader::Limits limits;
    limits.fMaxLineBytes = 4;
    limits.fMaxBytes = 10;
    EXPECT_EQ(ReadWithLimits("a=12345678\nb=1\nc\n", limits, 7),
              (Lines{Cut(Plain("a=12", "\n", "a", "12")), Plain("b=1", "\n", "b", "1"),
                     Cut(Raw("c", ""))}));
    EXPECT_EQ(ReadWithLimits("a=12345678\nb=12345678", limits, 12),
              (Lines{Cut(Plain("a=12", "\n", "a", "12")), Cut(Plain("b=12", "", "b", "12"))}));
    EXPECT_EQ(ReadWithLimits("12345678\n1\r2345\n", limits, 6),
              (Lines{Cut(Raw("1234")), Cut(Raw("1\r23"))}));
}

TEST(ReportReader, ReadsTheSameInPiecesAtEveryLimit)
{
    const std::string text = "a=\"12\r\r3\"\r\n\r\n1234\r5\n1234\r\n\n\rx\n";
    for (std::size_t lineBytes = 0; lineBytes < 8; ++lineBytes)
        for (std::uint64_t bytes = 0; bytes <= text.size(); ++bytes) {
            ReportReader::Limits limits;
            limits.fMaxLineBytes = lineBytes;
            limits.fMaxBytes = bytes;
            ReportReader reader(limits);
            std::size_t size = 0;
            for (const Lines& lines : {reader.Feed(text), reader.Finish()})
                for (const ReportLine& line : lines)
                    size += line.fText.size() + line.fLineEnd.size();
            EXPECT_LE(size, bytes);
            EXPECT_EQ(size + reader.GetLostByteCount(), text.size());
            ReadWithLimits(text, limits, reader.GetLostByteCount());
        }
}

TEST(ReportReader, DropsLinesBeyondTheLimit)
{
    ReportReader::Limits limits;
    limits.fMaxLines = 2;
    EXPECT_EQ(ReadWithLimits("a=\"1\n2\"\nb=1\nc", limits, 5),
              Lines{Text("a=\"1\n2\"", "\n", "a", "1\n2")});
    EXPECT_EQ(ReadWithLimits("a=\"1\n2\n\"\n", limits, 2), (Lines{Raw("a=\"1"), Raw("2")}));
}

TEST(ReportReader, AcceptsLimitsOfZero)
{
    ReportReader::Limits limits;
    limits.fMaxLineBytes = 0;
    EXPECT_EQ(ReadWithLimits("ab\n\nc", limits, 3),
              (Lines{Cut(Raw("")), Raw(""), Cut(Raw("", ""))}));
    limits = {};
    limits.fMaxBytes = 0;
    EXPECT_EQ(ReadWithLimits("ab\n", limits, 3), Lines{});
    limits = {};
    limits.fMaxLines = 0;
    EXPECT_EQ(ReadWithLimits("ab\n", limits, 3), Lines{});
}

TEST(ReportReader, LimitsWhatItHolds)
{
    ReportReader reader;
    const std::string piece(1 << 20, 'x');
    for (int count = 0; count < 64; ++count)
        EXPECT_TRUE(reader.Feed(piece).empty());
    const Lines lines = reader.Finish();
    ASSERT_EQ(lines.size(), 1U);
    EXPECT_EQ(lines[0].fText.size(), std::size_t{1} << 16);
    EXPECT_TRUE(lines[0].fCut);
    EXPECT_EQ(reader.GetByteCount(), std::uint64_t{64} << 20);
    EXPECT_EQ(reader.GetLostByteCount(), (std::uint64_t{64} << 20) - (std::uint64_t{1} << 16));

    ReportReader second;
    const std::string ends(1 << 20, '\n');
    std::size_t count = 0;
    for (int round = 0; round < 4; ++round)
        count += second.Feed(ends).size();
    EXPECT_EQ(count, ReportReader::Limits().fMaxLines);
}

TEST(ReportReader, ReadsTheLinesOfManyOpenQuotesOnce)
{
    // Reading the rest again after each open quote would take minutes.
    std::string text;
    for (int line = 0; line < 15000; ++line)
        text += "a=\"x\n";
    text += "assayEnd=\"x\"\n";
    EXPECT_EQ(ReadLines(text, 1000).size(), 15001U);
}

} // namespace
} // namespace assay_host
