// Launches of a real child, from end to end.
#include <chrono>
#include <gmock/gmock.h>
#include <sstream>
#include <thread>

#include "CollectingTask.h"
#include "Throws.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

constexpr double kLong = 60.0;

TEST(Launch, OutputAndCodeArrive)
{
    RealLaunch launch({"out", "hello", "err", "trouble", "exit", "7"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(launch.out->Text(), "hello\n");
    EXPECT_EQ(launch.err->Text().substr(0, 7), "trouble");
}

TEST(Launch, ExitCodesUpTo255AreCodes)
{
    for (const int code : {0, 1, 254, 255}) {
        RealLaunch launch({"exit", std::to_string(code)});
        int exitCode = -1;
        EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
        EXPECT_EQ(exitCode, code);
    }
}

TEST(Launch, CrashIsCrashedWithoutACode)
{
    RealLaunch launch({"out", "last words", "abort"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kCrashed);
    EXPECT_EQ(exitCode, 0);
    EXPECT_EQ(launch.out->Text(), "last words\n");
}

TEST(Launch, HangingChildTimesOutAndIsKilled)
{
    RealLaunch launch({"out", "started", "sleep", "60000"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, 0.2), State::kTimeout);
    EXPECT_EQ(exitCode, -1);
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::Launch: already launched",
                                   [&] { launch.launcher.Launch(); }));
    launch.launcher.Kill();
    EXPECT_EQ(launch.launcher.Wait(&exitCode, kLong), State::kKilled);
    EXPECT_EQ(exitCode, 0);
    EXPECT_EQ(launch.out->Text(), "started\n");
    launch.launcher.Kill();
    launch.SetArgs({"exit", "3"});
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 3);
}

TEST(Launch, InputReachesTheChild)
{
    RealLaunch launch({"echo", "exit", "5"}, true);
    launch.launcher.Launch();
    launch.app->AwaitStart();
    launch.app->WritelnAppStdin("one");
    launch.app->WritelnAppStdin("two");
    launch.app->CloseAppStdin();
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 5);
    EXPECT_EQ(launch.out->Text(), "one\ntwo\n");
}

TEST(Launch, InputThatIsNotKeptIsAtItsEnd)
{
    RealLaunch launch({"echo", "exit", "5"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 5);
}

TEST(Launch, WritingToAChildThatHasGoneRaises)
{
    RealLaunch launch({"exit", "0"}, true);
    launch.launcher.Launch();
    launch.app->AwaitStart();
    const std::string text(1 << 16, 'x');
    // What the pipe still takes, it takes.
    EXPECT_THROW(for (int line = 0; line < 10'000; ++line) launch.app->WritelnAppStdin(text),
                 std::runtime_error);
    EXPECT_EQ(launch.launcher.Wait(nullptr, kLong), State::kFinished);
}

TEST(Launch, FloodIsPumped)
{
    constexpr long long kFlood = 100LL << 20;
    RealLaunch launch({"flood", std::to_string(kFlood), "exit", "1"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 1);
    EXPECT_EQ(launch.out->Count(), static_cast<unsigned long long>(kFlood));
}

TEST(Launch, ChildThatClosesItsOutputsIsStillWaitedFor)
{
    RealLaunch launch({"close", "sleep", "200", "exit", "6"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 6);
}

TEST(Launch, GrandchildThatHoldsThePipesIsGivenUp)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    RealLaunch launch({"spawn", "6000", "exit", "0"});
    // Both pumps hang, for a short wait each: the launcher's thread is given up before that.
    EXPECT_EQ(launch.launcher.LaunchAndWait(nullptr, kLong), State::kTimeout);
    EXPECT_EQ(launch.app->GetState(0.0), State::kIdle);
    EXPECT_GT(ManagedThread::GetRegisteredThreadCount(), threads);
    std::this_thread::sleep_for(std::chrono::seconds(6));
}

TEST(Launch, MissingProgramFailsTheLaunch)
{
    RealLaunch launch({}, false, L"/nonexistent/program");
    EXPECT_THROW(launch.launcher.Launch(), Exception);
    EXPECT_EQ(launch.app->GetState(0.0), State::kIdle);
    EXPECT_EQ(launch.launcher.Wait(nullptr, 0.0), State::kIdle);
    launch.SetArgs({"exit", "2"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 2);
}

TEST(Launch, KillAndEndRace)
{
    RealLaunch launch({});
    for (int round = 0; round < 50; ++round) {
        launch.SetArgs({"sleep", std::to_string(round % 5)});
        launch.launcher.Launch();
        std::this_thread::sleep_for(std::chrono::milliseconds(round % 7));
        launch.launcher.Kill();
        const State end = launch.launcher.Wait(nullptr, kLong);
        EXPECT_TRUE(end == State::kKilled || end == State::kFinished) << end;
    }
}

// Every fault against every kind of child ends Idle and reusable.
class FaultMatrix : public testing::TestWithParam<std::tuple<Fault, const char*>> {};

TEST_P(FaultMatrix, EndsIdleAndReusable)
{
    const auto [fault, kind] = GetParam();
    const std::string child = kind;
    std::deque<std::string> args;
    if (child == "ends")
        args = {"exit", "0"};
    else if (child == "runs")
        args = {"out", "x", "sleep", "300", "exit", "0"};
    else if (child == "crashes")
        args = {"abort"};
    else if (child == "floods")
        args = {"flood", "1000000000000"};
    else
        args = {"sleep", "20000"};
    RealLaunch launch(args);
    launch.app->SetInjectedFault(fault);
    std::string text;
    State result = State::kUndefined;
    try {
        launch.launcher.Launch();
        result = launch.launcher.Wait(nullptr, 0.5);
        if (result == State::kTimeout) {
            try {
                launch.launcher.Kill();
            } catch (const Exception& exc) {
                EXPECT_STREQ(exc.what(), "Client: LauncherKill");
                launch.launcher.Kill(); // fires once
                text = exc.what();
            }
            result = launch.launcher.Wait(nullptr, kLong);
        }
    } catch (const Exception& exc) {
        text = exc.what();
    }
    const bool endsByItself = child == "ends" || child == "runs" || child == "crashes";
    std::ostringstream name;
    name << fault;
    if (fault == Fault::kNoFault || (fault == Fault::kLauncherKill && endsByItself)) {
        EXPECT_EQ(text, "");
        EXPECT_EQ(result, child == "crashes" ? State::kCrashed
                          : endsByItself     ? State::kFinished
                                             : State::kKilled);
    } else {
        EXPECT_THAT(text, testing::EndsWith(": " + name.str())) << result;
    }
    EXPECT_EQ(launch.app->GetState(0.0), State::kIdle);
    launch.launcher.Wait(nullptr, 0.0);
    launch.SetArgs({"exit", "9"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 9);
}

INSTANTIATE_TEST_SUITE_P(
    All, FaultMatrix,
    testing::Combine(testing::Values(Fault::kNoFault, Fault::kNotifyLaunching,
                                     Fault::kNotifyLaunched, Fault::kNotifyRunning,
                                     Fault::kNotifyFinished, Fault::kNotifyOutputTaskBegin,
                                     Fault::kNotifyOutputTaskEnd, Fault::kLauncherLaunch,
                                     Fault::kLauncherWait, Fault::kLauncherKill),
                     testing::Values("ends", "runs", "crashes", "floods", "hangs")),
    [](const auto& parameter) {
        std::ostringstream name;
        name << std::get<0>(parameter.param) << "_" << std::get<1>(parameter.param);
        return name.str();
    });

} // namespace
