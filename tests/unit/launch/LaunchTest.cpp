// Launches of a real child, from end to end.
#include <gmock/gmock.h>
#include <sstream>
#include <thread>

#include "CollectingTask.h"
#include "FailingStart.h"
#include "TempFolder.h"
#include "Throws.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

TEST(Launch, OutputAndCodeArrive)
{
    RealLaunch launch({"out", "hello", "err", "trouble", "exit", "7"});
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(launch.out->Text(), "hello\n");
    EXPECT_EQ(launch.err->Text(), "trouble\n");
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
    launch.launcher.Launch();
    EXPECT_TRUE(Eventually([&] { return launch.out->Text() == "started\n"; }));
    EXPECT_EQ(launch.launcher.Wait(&exitCode, 0.0), State::kTimeout);
    EXPECT_EQ(exitCode, -1);
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::Launch: already launched",
                                   [&] { launch.launcher.Launch(); }));
    {
        const ShortWait wait(1); // the launch needs some to end its output tasks
        launch.launcher.Kill();
    }
    EXPECT_EQ(launch.launcher.Wait(&exitCode, kLong), State::kKilled);
    EXPECT_EQ(exitCode, 0);
    launch.launcher.Kill();
    launch.SetArgs({"exit", "3"});
    EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 3);
}

TEST(Launch, InputReachesTheChild)
{
    RealLaunch launch({"echo", "exit", "5"}, true);
    launch.launcher.Launch();
    launch.AwaitStart();
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
    launch.AwaitStart();
    const std::string text(1 << 16, 'x');
    // The first writes may still go into the pipe.
    EXPECT_THROW(for (int line = 0; line < 10'000; ++line) launch.app->WritelnAppStdin(text),
                 std::runtime_error);
    EXPECT_EQ(launch.launcher.Wait(nullptr, kLong), State::kFinished);
}

TEST(Launch, ChildThatNeverReadsItsInputBlocksTheWriterUntilItEnds)
{
    RealLaunch launch({"sleep", "200", "exit", "3"}, true);
    launch.launcher.Launch();
    launch.AwaitStart();
    const std::string text(16 << 20, 'x'); // more than any pipe holds
    EXPECT_THROW(launch.app->WritelnAppStdin(text), std::runtime_error);
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 3);
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

TEST(Launch, ChildThatClosesItsOutputsAtOnceIsStillWaitedFor)
{
    RealLaunch launch({"close", "echo", "exit", "6"}, true);
    launch.launcher.Launch();
    EXPECT_TRUE(Eventually([&] {
        return !launch.out->IsRunning(0.0) && !launch.err->IsRunning(0.0);
    })) << "both channels are at their end";
    EXPECT_EQ(launch.app->GetState(0.0), State::kRunning);
    launch.app->CloseAppStdin();
    int exitCode = -1;
    EXPECT_EQ(launch.launcher.Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 6);
}

TEST(Launch, GrandchildThatHoldsThePipesIsGivenUp)
{
    const DebugValueSetter log("ConsoleAppLog", 1);
    Journal journal;
    const ThreadsEnd threadsEnd;
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    // The grandchild reads its input, which is the child's, to its end.
    RealLaunch launch({"heir", "exit", "0"}, true);
    launch.launcher.Launch();
    // Both pumps hang, and therefore the launcher's thread.
    journal.Await("Launcher", "CleanupLaunchThreadTask: joining output task thread for stdout");
    {
        const NoShortWait noWait;
        EXPECT_EQ(launch.launcher.Wait(nullptr, kLong), State::kTimeout);
    }
    EXPECT_EQ(launch.app->GetState(0.0), State::kIdle);
    EXPECT_GT(ManagedThread::GetRegisteredThreadCount(), threads);
    // Reset has closed the input, so that the grandchild and then the pumps end.
    EXPECT_TRUE(
        Eventually([&] { return !launch.out->IsRunning(0.0) && !launch.err->IsRunning(0.0); }));
    EXPECT_EQ(launch.launcher.Wait(nullptr, 0.0), State::kIdle) << "nothing left to wait for";
}

TEST(Launch, ProgramsThatCannotBeStartedFailTheLaunch)
{
    const TempFolder folder;
    const std::string text = folder.File("text");
    std::ofstream(text) << "not a program\n";
    for (const std::wstring& program :
         {std::wstring(L"/nonexistent/program"), folder.Path().wstring(),
          boost::filesystem::path(text).wstring()}) {
        RealLaunch launch({}, false, program);
        EXPECT_THROW(launch.launcher.Launch(), Exception);
        EXPECT_EQ(launch.app->GetState(0.0), State::kIdle);
        EXPECT_EQ(launch.launcher.Wait(nullptr, 0.0), State::kIdle);
        launch.SetArgs({"exit", "2"});
        int exitCode = -1;
        EXPECT_EQ(launch.launcher.LaunchAndWait(&exitCode, kLong), State::kFinished);
        EXPECT_EQ(exitCode, 2);
    }
}

TEST(Launch, ATaskServesOneLaunchAfterTheOther)
{
    RealLaunch launch({"out", "one"});
    EXPECT_EQ(launch.launcher.LaunchAndWait(nullptr, kLong), State::kFinished);
    EXPECT_EQ(launch.out->Text(), "one\n");
    launch.SetArgs({"out", "two"});
    EXPECT_EQ(launch.launcher.LaunchAndWait(nullptr, kLong), State::kFinished);
    EXPECT_EQ(launch.out->Text(), "two\n");
}

// Every fault with every kind of child.
class FaultMatrix : public testing::TestWithParam<std::tuple<Fault, const char*>> {
protected:
    struct Kind {
        const char* name;
        std::deque<std::string> args;
        bool endless;
        State end;
        int exitCode;
    };

    static const Kind& GetKind()
    {
        static const Kind kKinds[] = {
            {"ends", {"exit", "5"}, false, State::kFinished, 5},
            {"runs", {"out", "x", "sleep", "50", "exit", "6"}, false, State::kFinished, 6},
            {"crashes", {"abort"}, false, State::kCrashed, 0},
            {"floods", {"flood", "1000000000000"}, true, State::kKilled, 0},
            {"hangs", {"sleep", "60000"}, true, State::kKilled, 0},
        };
        const std::string name = std::get<1>(GetParam());
        return *std::find_if(std::begin(kKinds), std::end(kKinds),
                             [&](const Kind& kind) { return kind.name == name; });
    }

    static Fault GetFault() { return std::get<0>(GetParam()); }

    // The latest point of the launch at which the fault fires.
    static bool BeforeTheStart()
    {
        return GetFault() == Fault::kNotifyLaunching || GetFault() == Fault::kLauncherLaunch;
    }
    static bool KillsTheChild()
    {
        return GetFault() == Fault::kNotifyLaunched || GetFault() == Fault::kNotifyRunning ||
               GetFault() == Fault::kNotifyOutputTaskBegin || GetFault() == Fault::kLauncherWait;
    }
    static bool FailsLaunch()
    {
        return BeforeTheStart() || (KillsTheChild() && GetFault() != Fault::kLauncherWait);
    }

    // The possible texts of the exception; none if the launch succeeds.
    static std::vector<std::string> GetFailures()
    {
        std::ostringstream fault;
        fault << GetFault();
        switch (GetFault()) {
        case Fault::kNoFault:
            return {};
        case Fault::kLauncherKill:
            if (!GetKind().endless)
                return {};
            return {"Client: LauncherKill"};
        case Fault::kNotifyOutputTaskBegin:
            return {"stdout: NotifyOutputTaskBegin"};
        case Fault::kNotifyOutputTaskEnd:
            // For the channel that ends first.
            return {"stdout: NotifyOutputTaskEnd", "stderr: NotifyOutputTaskEnd"};
        default:
            return {"Launcher: " + fault.str()};
        }
    }
};

TEST_P(FaultMatrix, EndsAsPredictedIdleAndReusable)
{
    const Kind& kind = GetKind();
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    RealLaunch launch(kind.args);
    launch.app->SetInjectedFault(GetFault());
    std::string failure;
    bool launched = false;
    bool killed = false;
    State result = State::kUndefined;
    int exitCode = -1;
    std::optional<FailingStart> failing;
    if (GetFault() == Fault::kNotifyOutputTaskBegin)
        failing.emplace("stdout");
    try {
        launch.launcher.Launch();
        launched = true;
        if (kind.endless && !KillsTheChild()) {
            try {
                launch.launcher.Kill();
            } catch (const Exception& exc) {
                failure = exc.what();
                // The launcher's thread must not join with this short wait.
                const boost::lock_guard<boost::mutex> noEnd(launch.platform->fHoldsEnd);
                const NoShortWait noWait; // the state doesn't change
                launch.launcher.Kill();   // fires once
            }
            killed = true;
        }
        result = launch.launcher.Wait(&exitCode, kLong);
    } catch (const Exception& exc) {
        failure = exc.what();
    }

    const std::vector<std::string> failures = GetFailures();
    if (failures.empty())
        EXPECT_EQ(failure, "");
    else
        EXPECT_THAT(failures, testing::Contains(failure));
    if (failures.empty() || GetFault() == Fault::kLauncherKill) {
        EXPECT_EQ(result, kind.end);
        EXPECT_EQ(exitCode, kind.exitCode);
    } else {
        // A failure of an output thread may come when the exit code is already known.
        EXPECT_TRUE(exitCode == -1 ||
                    (GetFault() == Fault::kNotifyOutputTaskEnd && exitCode == kind.exitCode))
            << exitCode;
        EXPECT_FALSE(FailsLaunch() && launched);
    }
    EXPECT_EQ(launch.app->GetState(0.0), State::kIdle);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads) << "nothing was given up";

    // The child has ended: this wait is short.
    CountingLauncher& platform = *launch.platform;
    EXPECT_EQ(platform.fLaunches, BeforeTheStart() ? 0 : 1);
    if (!BeforeTheStart() && kind.endless) {
        int code = -1;
        EXPECT_EQ(platform.Wait(&code), kEndedByKill);
        EXPECT_EQ(code, -1);
        EXPECT_TRUE(killed || KillsTheChild());
    }

    launch.launcher.Wait(nullptr, 0.0);
    launch.SetArgs({"exit", "9"});
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
