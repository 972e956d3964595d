#include "report/RunLog.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/Reports.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// A run of two OpenGL devices.
class RunLogTest : public testing::Test {
protected:
    void AddReport(const std::vector<std::string>& lines)
    {
        const Report report = ReadReport(lines);
        for (const ReportLine& line : report.GetLines())
            fSequence.Add(line);
    }

    void AddUpTo(const std::string& key)
    {
        for (const std::string& line : Join(MakeWholeRun(2, -1))) {
            if (line.rfind(key + "=", 0) == 0)
                return;
            AddReport({line});
        }
        FAIL() << key;
    }

    bool AddLog(const std::string& text)
    {
        const bool isOfFiles = fLog.Add(text, fSequence, fOutcome);
        AddReport({"# " + text});
        return isOfFiles;
    }

    // Returns "KEY: TEXT" for each cause.
    std::vector<std::string> Finish(const std::vector<std::string>& errorLines)
    {
        fOutcome.fErrorLines = errorLines;
        fLog.Finish(fOutcome);
        std::vector<std::string> causes;
        for (const Cause& cause : fOutcome.fCauses)
            causes.push_back(cause.fKey + ": " + cause.fText);
        return causes;
    }

    RunLog fLog;
    SequenceReader fSequence;
    RunOutcome fOutcome;
};

TEST_F(RunLogTest, TellsLinesOfFilesFromOthers)
{
    EXPECT_TRUE(AddLog("driver files are logged"));
    EXPECT_TRUE(AddLog("loaded for OpenGL: /a"));
    EXPECT_FALSE(AddLog("any call"));
    EXPECT_FALSE(AddLog("Cannot create default ContextOffscreen: x"));
    EXPECT_FALSE(AddLog("Testing terminated for glgpu[0]"));
    EXPECT_EQ(fOutcome.fDrivers.fFiles.size(), 1U);
}

TEST_F(RunLogTest, ACauseBelongsToTheAnswerThatFollowsTheNamesOfItsLimit)
{
    AddUpTo("gputag.GL_MAX_DRAW_BUFFERS");
    AddLog("GLGetIntegerv failure: x");
    EXPECT_THAT(
        Finish({}),
        ElementsAre("glgpu[0].glGetIntegerv[GL_MAX_DRAW_BUFFERS]: GLGetIntegerv failure: x"));
}

TEST_F(RunLogTest, TheFailuresOnStandardErrorAreThoseOfTheDevicesInTheirOrder)
{
    AddUpTo("glgpu[0].GLVendor");
    AddLog("Testing terminated for glgpu[0]");
    AddReport({"glgpu[1].GLVendor=\"x\"", "glgpu[1].GLRenderer=\"x\""});
    AddUpTo("glgpu[1].CanCompileProgramGLSL");
    AddLog("Testing terminated for glgpu[1]");
    EXPECT_THAT(Finish({"a driver's line", "QGF::LogicalException: first", "exception: second",
                        "the exception: of none"}),
                ElementsAre("glgpu[0].GLVendor: first", "glgpu[1].CanCompileProgramGLSL: second"));
}

TEST_F(RunLogTest, AFailureWithoutATextIsACauseAsAWhole)
{
    AddUpTo("glgpu[0].GLVendor");
    AddLog("Testing terminated for glgpu[0]");
    EXPECT_THAT(Finish({"unknown exception"}), ElementsAre("glgpu[0].GLVendor: unknown exception"));
}

TEST_F(RunLogTest, TheLogsCauseIsKept)
{
    AddUpTo("glgpu[0].GLVendor");
    AddLog("glGetString: glGetError() returns 1282");
    AddLog("Testing terminated for glgpu[0]");
    EXPECT_THAT(Finish({"exception: less"}),
                ElementsAre("glgpu[0].GLVendor: glGetString: glGetError() returns 1282"));
}

TEST_F(RunLogTest, FailuresOfAnotherNumberThanTheDevicesBelongToNone)
{
    AddUpTo("glgpu[0].GLVendor");
    AddLog("Testing terminated for glgpu[0]");
    EXPECT_THAT(Finish({}), IsEmpty());
    EXPECT_THAT(Finish({"exception: of a driver", "exception: x"}), IsEmpty());
}

// A device that isn't the next one: its key isn't known, but its line is.
TEST_F(RunLogTest, ADeviceOutOfOrderTakesItsLineOnly)
{
    AddUpTo("glgpu[0].GLVendor");
    AddLog("Testing terminated for glgpu[7]");
    AddLog("Testing terminated for glgpu[0] soon");
    AddLog("Testing terminated for glgpu[0]");
    EXPECT_THAT(Finish({"exception: a", "exception: b", "exception: c"}),
                ElementsAre("glgpu[0].GLVendor: c"));
}

TEST_F(RunLogTest, CausesAreAtMostAHundred)
{
    AddUpTo("glgpu[0].GLVendor");
    for (int count = 0; count < 101; ++count)
        AddLog("Cannot create default ContextOffscreen: x");
    AddLog("Testing terminated for glgpu[0]");
    EXPECT_EQ(Finish({"exception: a"}).size(), 100U);
}

TEST(IsFailureLine, IsByTheStartOfTheLine)
{
    for (const char* const line :
         {"exception: ", "exception: x", "QGF::LogicalException: <NULL>", "unknown exception"})
        EXPECT_TRUE(IsFailureLine(line)) << line;
    for (const char* const line :
         {"", "exception:", " exception: x", "QGF::LogicalException", "unknown exception."})
        EXPECT_FALSE(IsFailureLine(line)) << line;
}

} // namespace
} // namespace assay_host
