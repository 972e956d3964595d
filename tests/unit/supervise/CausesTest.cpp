#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "LongTimes.h"
#include "TestChild.h"
#include "supervise/ChildLauncher.h"
#include "supervise/ChildRun.h"

namespace assay_host {
namespace {

class Lines : public RunObserver {
public:
    void OnLine(const ReportLine& line, double /*seconds*/) override
    {
        fLines.push_back(line.fText);
    }

    std::vector<std::string> fLines;
};

const std::string kPrefix = "# 00004.2026.11.21_10:49:36.366(+00.000)[tid=462f] ";
const std::string kFailure =
    kPrefix + "Cannot create default ContextOffscreen: eglGetError is not offered";

RunOutcome RunWith(bool keepCauses, std::vector<std::string> args, Lines& lines)
{
    ChildOptions options;
    options.fProgram = TEST_CHILD;
    options.fArgs = std::move(args);
    options.fTimeoutSeconds = 0;
    options.fKeepCauses = keepCauses;
    pmutil::StopRequest stop;
    const pmutil::LongShortWait shortWait;
    return RunChild(options, lines, stop, MakeChildLauncher(), GetLongTimes());
}

// The child ends after "# 00", which could be the beginning of a line of the log.
TEST(Causes, LeaveALastLineThatLacksItsEndInTheReport)
{
    Lines lines;
    RunWith(true, {"out", kFailure, "raw", "23203030"}, lines);
    EXPECT_EQ(lines.fLines, std::vector<std::string>{"# 00"});
}

TEST(Causes, AreTakenFromTheLogThatIsAskedFor)
{
    Lines lines;
    const RunOutcome outcome = RunWith(true,
                                       {"out", "QGFOGLInitialized=1", "out", kFailure, "out",
                                        "OGLContextCreated=0", "out", kPrefix + "last"},
                                       lines);
    EXPECT_EQ(outcome.FindCause("OGLContextCreated"), "eglGetError is not offered");
    EXPECT_EQ(outcome.fCauses.size(), 1U);
    EXPECT_EQ(lines.fLines,
              (std::vector<std::string>{"QGFOGLInitialized=1", "OGLContextCreated=0"}));
    EXPECT_EQ(outcome.fLastLogLine, kPrefix + "last");
    EXPECT_EQ(outcome.fCommand[1], "out"); // what was asked for
}

TEST(Causes, AreAtMostAHundred)
{
    std::vector<std::string> args;
    for (int cause = 0; cause < 101; ++cause)
        args.insert(args.end(), {"out", kFailure});
    Lines lines;
    EXPECT_EQ(RunWith(true, args, lines).fCauses.size(), 100U);
}

TEST(DriverFiles, AreTakenFromTheLogThatIsAskedFor)
{
    Lines lines;
    const RunOutcome outcome =
        RunWith(true,
                {"out", kPrefix + "driver files are logged", "out", kPrefix + "last call", "out",
                 kPrefix + "loaded for OpenGL: /lib/libEGL.so.1", "out",
                 kPrefix + "loaded for OpenCL: /lib/libOpenCL.so.1"},
                lines);
    EXPECT_TRUE(outcome.fDrivers.IsKnown());
    ASSERT_EQ(outcome.fDrivers.fFiles.size(), 2U);
    EXPECT_EQ(outcome.fDrivers.fFiles[0].fPath, "/lib/libEGL.so.1");
    EXPECT_EQ(outcome.fDrivers.fFiles[1].fInterface, DeviceKind::kOpenCL);
    EXPECT_EQ(lines.fLines, std::vector<std::string>());
    // The last line of the log is that of the last call, and not of a file.
    EXPECT_EQ(outcome.fLastLogLine, kPrefix + "last call");
    EXPECT_TRUE(outcome.fCauses.empty());
}

TEST(DriverFiles, AreUnknownWithoutTheirLog)
{
    Lines lines;
    EXPECT_EQ(RunWith(true, {"out", "NumGLGPUs=0"}, lines).fDrivers.fReason,
              "the child did not log them");
    EXPECT_EQ(RunWith(true, {"-verbose=0"}, lines).fDrivers.fReason, "the child did not log them");
    lines.fLines.clear();
    const std::string line = kPrefix + "loaded for OpenGL: /lib/libEGL.so.1";
    const RunOutcome outcome = RunWith(false, {"-verbose=0x101", "out", line}, lines);
    EXPECT_EQ(outcome.fDrivers.fReason, "the log of the child was not requested");
    EXPECT_TRUE(outcome.fDrivers.fFiles.empty());
    EXPECT_EQ(lines.fLines, std::vector<std::string>{line});
}

// A log that the arguments ask for is read too, and stays in the report.
TEST(DriverFiles, AreTakenFromTheLogOfTheArguments)
{
    const std::vector<std::string> log = {kPrefix + "driver files are logged",
                                          kPrefix + "loaded for OpenGL: /lib/libEGL.so.1"};
    Lines lines;
    const RunOutcome outcome =
        RunWith(true, {"-verbose=0x101", "out", log[0], "out", log[1]}, lines);
    EXPECT_TRUE(outcome.fDrivers.IsKnown());
    EXPECT_EQ(outcome.fDrivers.fFiles.size(), 1U);
    EXPECT_EQ(lines.fLines, log);
}

TEST(Causes, AreLeftWhereNobodyAsks)
{
    Lines lines;
    EXPECT_TRUE(RunWith(false, {"out", kFailure}, lines).fCauses.empty());
    EXPECT_EQ(lines.fLines, std::vector<std::string>{kFailure});
}

TEST(Causes, AreTakenFromTheLogOfTheArguments)
{
    Lines lines;
    const std::string noLog = "# Cannot create default ContextOffscreen: no prefix";
    const RunOutcome outcome = RunWith(
        true, {"-verbose=1", "out", "QGFOGLInitialized=1", "out", noLog, "out", kFailure}, lines);
    EXPECT_EQ(outcome.FindCause("OGLContextCreated"), "eglGetError is not offered");
    EXPECT_EQ(outcome.fCauses.size(), 1U);
    EXPECT_EQ(lines.fLines, (std::vector<std::string>{"QGFOGLInitialized=1", noLog, kFailure}));
}

TEST(Causes, AreTakenFromStandardErrorForADeviceThatFailed)
{
    Lines lines;
    const RunOutcome outcome =
        RunWith(true,
                {"err", "exception: out of memory", "out", "NumGLGPUs=1", "out",
                 "glgpu[0].GLVersion=\"4\"", "out", kPrefix + "Testing terminated for glgpu[0]"},
                lines);
    EXPECT_EQ(outcome.FindCause("glgpu[0].IsIntegratedGLGPU"), "out of memory");
}

} // namespace
} // namespace assay_host
