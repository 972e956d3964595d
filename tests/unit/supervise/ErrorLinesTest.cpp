#include "supervise/ErrorLines.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

TEST(ErrorLines, AreJoinedFromPieces)
{
    ErrorLines lines;
    EXPECT_THAT(lines.Feed("on"), IsEmpty());
    EXPECT_THAT(lines.Feed("e\r\n\ntwo\nthr"), ElementsAre("one", "", "two"));
    EXPECT_THAT(lines.Finish(), ElementsAre("thr"));
    EXPECT_THAT(lines.Finish(), IsEmpty());
    EXPECT_EQ(lines.GetLostByteCount(), 0U);
}

TEST(ErrorLines, AreCutAtTheLimits)
{
    ErrorLines longLine;
    longLine.Feed(std::string(ErrorLines::kMaxLineBytes + 5, 'x'));
    EXPECT_THAT(longLine.Finish().front(), SizeIs(ErrorLines::kMaxLineBytes));
    EXPECT_EQ(longLine.GetLostByteCount(), 5U);
    EXPECT_THAT(longLine.Feed(std::string(ErrorLines::kMaxLineBytes + 3, 'y') + "\n").front(),
                SizeIs(ErrorLines::kMaxLineBytes));
    EXPECT_EQ(longLine.GetLostByteCount(), 8U);

    ErrorLines manyLines;
    EXPECT_THAT(manyLines.Feed(std::string(ErrorLines::kMaxLines + 5, '\n')),
                SizeIs(ErrorLines::kMaxLines));
    EXPECT_EQ(manyLines.GetLostByteCount(), 5U);

    ErrorLines manyBytes;
    std::size_t held = 0;
    for (int block = 0; block < 20; ++block)
        for (const std::string& line : manyBytes.Feed(std::string(65535, 'x') + "\n"))
            held += line.size() + 1;
    for (const std::string& line : manyBytes.Finish())
        held += line.size();
    EXPECT_EQ(held, ErrorLines::kMaxBytes);
    EXPECT_EQ(manyBytes.GetLostByteCount(), 4U * 65536);
}

} // namespace
} // namespace assay_host
