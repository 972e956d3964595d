#include "supervise/Containment.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include "LongTimes.h"
#include "TestChild.h"
#include "pmutil/ChildCommand.h"
#include "supervise/ChildRun.h"
#include "support/Waits.h"

namespace assay_host {
namespace {

const std::vector<std::string> kWhole = {"out", "assayStart=\"x\"", "out", "assayEnd=\"y\""};

struct StopAtFirstLine : RunObserver {
    void OnLine(const ReportLine& /*line*/, double /*seconds*/) override { fStop.Raise(); }
    pmutil::StopRequest fStop;
};

RunOutcome RunForeign(std::vector<std::string> args, RunObserver& observer,
                      pmutil::StopRequest& stop, const RunTimes& times = GetLongTimes())
{
    ChildOptions options;
    options.fProgram = TEST_CHILD;
    options.fArgs = std::move(args);
    options.fTimeoutSeconds = 0;
    return RunChild(options, observer, stop, *MakeForeignContainment(), times);
}

class ForeignContainment : public testing::Test {
private:
    const pmutil::LongShortWait fLongShortWait;
};

TEST_F(ForeignContainment, ManyRunsAtOnceEndTheirOwnGrandchildren)
{
    std::atomic<int> right{0};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 8; ++thread)
        threads.emplace_back([&right, thread] {
            std::vector<std::string> args = kWhole;
            args.insert(args.end(), {"spawn", "600000", "exit", std::to_string(thread)});
            RunObserver observer;
            pmutil::StopRequest stop;
            const RunOutcome outcome = RunForeign(args, observer, stop);
            if (outcome.fExitStatus == thread && !outcome.fLeftBehind)
                ++right;
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(right, 8);
}

TEST_F(ForeignContainment, LeavesTheOtherChildrenOfTheHost)
{
    const pmutil::ChildCommand command =
        pmutil::MakeChildCommand(TEST_CHILD, {"echo", "exit", "5"});
    const auto other = pmutil::MakeLauncher();
    pmutil::LaunchResult ends = other->Launch(command.fProgram, command.fArgs);
    std::vector<std::string> args = kWhole;
    args.insert(args.end(), {"spawn", "600000"});
    RunObserver observer;
    pmutil::StopRequest stop;
    EXPECT_EQ(RunForeign(args, observer, stop).fVerdict, Verdict::kComplete);
    ends.fAppInput.reset(); // which ends it
    int exitCode = -1;
    EXPECT_EQ(other->Wait(&exitCode), pmutil::kEndedNormally);
    EXPECT_EQ(exitCode, 5);
}

TEST_F(ForeignContainment, ReportsACrash)
{
    RunObserver observer;
    pmutil::StopRequest stop;
    const RunOutcome outcome = RunForeign({"abort"}, observer, stop);
    EXPECT_EQ(outcome.fVerdict, Verdict::kCrashed);
    EXPECT_THAT(outcome.fTermination,
                testing::AnyOf(testing::StartsWith("signal "), testing::StartsWith("code 0x")));
}

TEST_F(ForeignContainment, ReportsAMissingProgram)
{
    ChildOptions options;
    options.fProgram = "no-such-program";
    RunObserver observer;
    pmutil::StopRequest stop;
    const RunOutcome outcome =
        RunChild(options, observer, stop, *MakeForeignContainment(), GetLongTimes());
    EXPECT_EQ(outcome.fVerdict, Verdict::kNeverStarted);
    EXPECT_THAT(outcome.fReason, testing::HasSubstr("there is no file no-such-program"));
}

// The streams of a killed child aren't waited for, as nothing of use is to come.
TEST_F(ForeignContainment, AKilledChildsGrandchildIsEndedAtOnce)
{
    RunTimes times = GetLongTimes();
    times.fStreamGrace = RunTimes::Seconds(pmutil::kLong);
    StopAtFirstLine observer;
    const RunOutcome outcome = RunForeign({"spawn", "600000", "out", "Tester=x", "sleep", "600000"},
                                          observer, observer.fStop, times);
    EXPECT_EQ(outcome.fVerdict, Verdict::kInterrupted);
    EXPECT_FALSE(outcome.fLeftBehind);
}

} // namespace
} // namespace assay_host
