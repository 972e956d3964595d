#include "pmutil/PutLine.h"

#include <vector>

#include <gmock/gmock.h>

#include "TempFolder.h"

namespace pmutil {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// A stream whose writes fail, for its error indicator.
class PutLineTest : public testing::Test {
protected:
    void SetUp() override
    {
        fStream = std::fopen(fFolder.File("read-only").c_str(), "w+");
        ASSERT_NE(fStream, nullptr);
        fStream = std::freopen(fFolder.File("read-only").c_str(), "r", fStream);
        ASSERT_NE(fStream, nullptr);
    }
    void TearDown() override { std::fclose(fStream); }

    // Writes the line with space for only `room` bytes, and fails as a stream does.
    bool Put(const std::string& line, std::size_t room)
    {
        return PutLine(fStream, line, [&](const std::string& text) {
            fTaken.push_back(text.substr(0, room));
            if (text.size() > room)
                std::fputc('x', fStream);
            return fTaken.back().size();
        });
    }

    TempFolder fFolder;
    std::FILE* fStream = nullptr;
    std::vector<std::string> fTaken;
};

TEST_F(PutLineTest, WritesTheLineInOnePiece)
{
    EXPECT_TRUE(Put("one\n", 99));
    EXPECT_TRUE(Put("two\n", 4));
    EXPECT_THAT(fTaken, ElementsAre("one\n", "two\n"));
}

TEST_F(PutLineTest, ALineThatIsLostWholeLeavesNoTrace)
{
    EXPECT_FALSE(Put("lost\n", 0));
    EXPECT_EQ(std::ferror(fStream), 0);
    EXPECT_TRUE(Put("two\n", 99));
    EXPECT_THAT(fTaken, ElementsAre("", "two\n"));
}

TEST_F(PutLineTest, TheLineAfterACutOneBeginsWithALineEnd)
{
    EXPECT_FALSE(Put("cut\n", 1));
    EXPECT_TRUE(Put("two\n", 99));
    EXPECT_TRUE(Put("three\n", 99));
    EXPECT_THAT(fTaken, ElementsAre("c", "\ntwo\n", "three\n"));
}

TEST_F(PutLineTest, ALineThatLacksItsEndAloneIsCutToo)
{
    EXPECT_FALSE(Put("cut\n", 3));
    EXPECT_TRUE(Put("two\n", 99));
    EXPECT_THAT(fTaken, ElementsAre("cut", "\ntwo\n"));
}

TEST_F(PutLineTest, ACutIsNotForgottenWhileLinesAreLost)
{
    EXPECT_FALSE(Put("cut\n", 2));
    EXPECT_FALSE(Put("lost\n", 0));
    EXPECT_FALSE(Put("lost\n", 0));
    EXPECT_TRUE(Put("two\n", 99));
    EXPECT_THAT(fTaken, ElementsAre("cu", "", "", "\ntwo\n"));
}

TEST_F(PutLineTest, ALineEndThatGotOutAloneMendsTheCut)
{
    EXPECT_FALSE(Put("cut\n", 2));
    EXPECT_FALSE(Put("lost\n", 1));
    EXPECT_TRUE(Put("two\n", 99));
    EXPECT_THAT(fTaken, ElementsAre("cu", "\n", "two\n"));
}

TEST_F(PutLineTest, ALineThatIsCutAfterAMendedCutIsOneAgain)
{
    EXPECT_FALSE(Put("cut\n", 2));
    EXPECT_FALSE(Put("again\n", 3));
    EXPECT_TRUE(Put("two\n", 99));
    EXPECT_THAT(fTaken, ElementsAre("cu", "\nag", "\ntwo\n"));
}

} // namespace
} // namespace pmutil
