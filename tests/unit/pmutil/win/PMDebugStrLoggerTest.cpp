#include "pmutil/PMDebugStrLogger.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "pmutil/PMLogging.h"
#include "win/ReplacedImport.h"

namespace pmutil {
namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::StartsWith;

DebugValue gOn{"PMDebugStrLoggerTest.on", 1};

std::vector<std::string> gPieces; // the debugger's messages

void WINAPI Record(LPCSTR text)
{
    gPieces.emplace_back(text);
}

class PMDebugStrLoggerTest : public testing::Test {
protected:
    PMDebugStrLoggerTest()
    {
        InitLogging();
        gPieces.clear();
    }

    const ReplacedImport<decltype(&::OutputDebugStringA)> fOutput{__imp_OutputDebugStringA,
                                                                  &Record};
};

TEST_F(PMDebugStrLoggerTest, ItsNameIsDebugStr)
{
    EXPECT_EQ(PMDebugStrLogger().GetName(), "DebugStr");
}

TEST_F(PMDebugStrLoggerTest, ALineIsThreePiecesOfWhichTheLastIsTheLineEnd)
{
    const PMDebugStrLogger logger;
    PM_LOG(gOn, "first");
    PM_LOG(gOn, "second");
    EXPECT_THAT(gPieces,
                ElementsAre(AllOf(StartsWith("00000."), EndsWith("] ")), "first", "\r\n",
                            AllOf(StartsWith("00001."), EndsWith("] ")), "second", "\r\n"));
}

TEST_F(PMDebugStrLoggerTest, ALineThatEndsByItselfIsTwoPieces)
{
    const PMDebugStrLogger logger;
    PM_LOG(gOn, "text\n");
    EXPECT_THAT(gPieces, ElementsAre(EndsWith("] "), "text\n"));
}

TEST_F(PMDebugStrLoggerTest, APieceEndsWithItsSize)
{
    PMDebugStrLogger logger;
    logger.WriteText("text", 2);
    logger.Flush();
    EXPECT_THAT(gPieces, ElementsAre("te"));
}

} // namespace
} // namespace pmutil
