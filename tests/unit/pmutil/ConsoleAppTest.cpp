#include "pmutil/ConsoleApp.h"

#include <chrono>
#include <gmock/gmock.h>
#include <thread>

#include "FakeLauncher.h"
#include "Throws.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/PMLogging.h"

using namespace pmutil;
using consoleapp::Exception;
using testing::IsSupersetOf;

namespace {

template <typename Call>
testing::AssertionResult ThrowsFailure(const std::string& text, Call call)
{
    return ThrowsExactly<Exception>(text, call);
}

// Whether it comes true, soon or at least before the test's patience ends.
template <typename Condition>
bool Eventually(Condition condition)
{
    constexpr int kMilliseconds = 10000;
    for (int i = 0; i < kMilliseconds && !condition(); ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    return condition();
}

// An application over a fake launcher, with a task that runs as long as the test lets it.
class ConsoleAppTest : public testing::Test {
protected:
    ConsoleAppTest()
    {
        fParams.SetOutputTask(OutputChannel::kStdout, fStdout);
        fParams.SetOutputTask(OutputChannel::kStderr, fStderr);
        fParams.fProgram = L"program";
        NewData();
    }

    ~ConsoleAppTest() override
    {
        OpenTasks();
        fLauncher->End(kEndedNormally);
    }

    void OpenTasks()
    {
        fStdout->fOpen = true;
        fStderr->fOpen = true;
    }

    void NewData()
    {
        fData = boost::make_shared<consoleapp::ExecutionData>(boost::weak_ptr<ConsoleApp>(fApp),
                                                              boost::weak_ptr<OutputTask>(fStdout),
                                                              boost::weak_ptr<OutputTask>(fStderr));
    }

    void Launch()
    {
        NewData();
        fStdout->fOpen = false;
        fStderr->fOpen = false;
        fApp->Launch(fData, fParams);
    }

    // Lets the child and its output end.
    void End(WaitResult result, int exitCode = 0)
    {
        OpenTasks();
        fLauncher->End(result, exitCode);
    }

    State Peek() { return fApp->GetState(0.0); }

    boost::shared_ptr<FakeLauncher> fLauncher = boost::make_shared<FakeLauncher>();
    boost::shared_ptr<RecordingApp> fApp = boost::make_shared<RecordingApp>(fLauncher);
    boost::shared_ptr<PatientTask> fStdout = boost::make_shared<PatientTask>();
    boost::shared_ptr<PatientTask> fStderr = boost::make_shared<PatientTask>();
    boost::shared_ptr<consoleapp::ExecutionData> fData;
    LaunchParams fParams;
};

TEST_F(ConsoleAppTest, DefaultWaits)
{
    EXPECT_EQ(ConsoleApp::GetDefaultWaitSeconds(), 10.0);
    EXPECT_EQ(ConsoleApp::GetShortWaitSeconds(), 1.0);
    EXPECT_EQ(ConsoleApp::GetDefaultStateWaitSeconds(), 0.1);
    InitLogging();
    static DebugValue defaultWait{"ConsoleAppDefaultWaitSecondsMinus10", 0};
    static DebugValue shortWait{"ConsoleAppShortWaitSecondsMinusOne", 0};
    static DebugValue stateWait{"ConsoleAppDefaultStateWaitSecondsTimesTenMinus1", 0};
    GetDebugValue(defaultWait) = 5;
    GetDebugValue(shortWait) = 2;
    GetDebugValue(stateWait) = 4;
    EXPECT_EQ(ConsoleApp::GetDefaultWaitSeconds(), 15.0);
    EXPECT_EQ(ConsoleApp::GetShortWaitSeconds(), 3.0);
    EXPECT_EQ(ConsoleApp::GetDefaultStateWaitSeconds(), 0.5);
    GetDebugValue(defaultWait) = 0;
    GetDebugValue(shortWait) = 0;
    GetDebugValue(stateWait) = 0;
}

TEST_F(ConsoleAppTest, RegularPath)
{
    fParams.fArgs = {"a", "b"};
    Launch();
    EXPECT_EQ(Peek(), State::kRunning);
    EXPECT_EQ(fLauncher->fProgram, L"program");
    EXPECT_EQ(fLauncher->fArgs, fParams.fArgs);
    EXPECT_EQ(fApp->GetTasksRunning(), 14U);
    End(kEndedNormally, 7);
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, 10.0), State::kFinished);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(Peek(), State::kIdle) << "ready for the next launch";
    const auto events = fApp->Events();
    EXPECT_THAT(events, IsSupersetOf({"OnLaunching", "begin stdout", "begin stderr", "OnRunning",
                                      "end stdout", "end stderr", "OnFinished 7"}));
    EXPECT_EQ(events.size(), 7U);
    EXPECT_EQ(events.front(), "OnLaunching");
}

TEST_F(ConsoleAppTest, EndsByItself)
{
    int exitCode = -1;
    Launch();
    End(kEndedNormally, 0);
    EXPECT_EQ(fApp->Wait(&exitCode, 10.0), State::kFinished);
    EXPECT_EQ(exitCode, 0);
    Launch();
    End(kEndedByCrash);
    exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, 10.0), State::kCrashed);
    EXPECT_EQ(exitCode, 0) << "a crash has no code";
    Launch();
    End(static_cast<WaitResult>(3));
    EXPECT_EQ(fApp->Wait(nullptr, 0.1), State::kTimeout) << "Undefined is no end";
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, KilledChild)
{
    Launch();
    OpenTasks();
    fApp->Kill();
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, 10.0), State::kKilled);
    EXPECT_EQ(exitCode, 0);
    EXPECT_EQ(fLauncher->fKills, 1);
}

TEST_F(ConsoleAppTest, SecondLaunchLeavesTheRunningOneAlone)
{
    Launch();
    EXPECT_TRUE(
        ThrowsRuntimeError("ConsoleApp: must be idle", [&] { fApp->Launch(fData, fParams); }));
    EXPECT_EQ(Peek(), State::kRunning);
    EXPECT_EQ(fLauncher->fLaunches, 1);
    End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kFinished);
}

TEST_F(ConsoleAppTest, WaitBeforeALaunchIsIdleAtOnce)
{
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, 100.0), State::kIdle);
    EXPECT_EQ(exitCode, -1);
}

TEST_F(ConsoleAppTest, WaitOfNoTimeOnARunningChild)
{
    Launch();
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, 0.0), State::kTimeout);
    EXPECT_EQ(exitCode, -1);
    EXPECT_EQ(Peek(), State::kTimeout);
    EXPECT_EQ(fApp->Wait(&exitCode, 0.01), State::kTimeout);
    End(kEndedNormally, 3);
    EXPECT_EQ(fApp->Wait(&exitCode, 10.0), State::kFinished) << "the end overwrites the timeout";
    EXPECT_EQ(exitCode, 3);
}

TEST_F(ConsoleAppTest, KillAfterATimedOutWait)
{
    Launch();
    EXPECT_EQ(fApp->Wait(nullptr, 0.0), State::kTimeout);
    OpenTasks();
    fApp->Kill();
    EXPECT_EQ(fLauncher->fKills, 1);
    EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kKilled);
}

TEST_F(ConsoleAppTest, KillOfAnEndedOrIdleObjectDoesNothing)
{
    fApp->Kill();
    for (const State state : {State::kFinished, State::kCrashed, State::kKilled}) {
        fApp->SetState(state);
        fApp->Kill();
        EXPECT_EQ(Peek(), state);
    }
    EXPECT_EQ(fLauncher->fKills, 0);
}

TEST_F(ConsoleAppTest, AnUnstableStateBecomesTimeout)
{
    for (const State state : {State::kUndefined, State::kLaunching, State::kLaunched,
                              State::kFinishing, State::kKilling, State::kTimeout}) {
        fApp->SetState(state);
        EXPECT_EQ(fApp->GetState(0.01), State::kTimeout) << state;
    }
    fApp->SetState(State::kRunning);
    EXPECT_EQ(fApp->GetState(0.01), State::kRunning) << "a later state overwrites it";
    fApp->Reset();
}

TEST_F(ConsoleAppTest, GetStateEndsWithTheFirstStableState)
{
    fApp->SetState(State::kLaunched);
    boost::thread setter([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        fApp->SetState(State::kRunning);
    });
    EXPECT_EQ(fApp->GetState(30.0), State::kRunning);
    setter.join();
    fApp->Reset();
}

TEST_F(ConsoleAppTest, NotificationsOverwriteAnyState)
{
    LaunchResult result;
    for (int from = -1; from <= 9; ++from) {
        const auto state = static_cast<State>(from);
        const auto becomes = [&](auto notify, State expected) {
            fApp->SetState(state);
            notify();
            EXPECT_EQ(fApp->GetState(0.0), IsStable(expected) ? expected : State::kTimeout);
        };
        becomes([&] { fApp->NotifyLaunching(TaskID::kLauncher); }, State::kLaunching);
        becomes([&] { fApp->NotifyLaunched(TaskID::kLauncher); }, State::kLaunched);
        becomes([&] { fApp->NotifyRunning(TaskID::kLauncher, result); }, State::kRunning);
        for (const State end :
             {State::kFinished, State::kCrashed, State::kKilled, State::kUndefined})
            becomes([&] { fApp->NotifyFinished(TaskID::kLauncher, 0, end); }, end);
        becomes([&] { fApp->Reset(); }, State::kIdle);
    }
}

TEST_F(ConsoleAppTest, LaunchFailureOfThePlatform)
{
    fLauncher->fLaunchFailure = "no wings";
    EXPECT_TRUE(ThrowsFailure("Launcher: no wings", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fKills, 0);
    fLauncher->fLaunchFailure.clear();
    Launch();
    End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kFinished);
}

TEST_F(ConsoleAppTest, WaitFailureOfThePlatform)
{
    fLauncher->fWaitFailure = "lost sight";
    Launch();
    End(kEndedNormally);
    EXPECT_TRUE(ThrowsFailure("Launcher: lost sight", [&] { fApp->Wait(nullptr, 10.0); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fKills, 1) << "a child that was not seen to end is killed";
}

TEST_F(ConsoleAppTest, AFaultDuringLaunchIsThrownOnceAndLeavesIdle)
{
    const struct {
        Fault fault;
        const char* text;
        int kills;
    } kRows[] = {
        {Fault::kNotifyLaunching, "Launcher: NotifyLaunching", 0},
        {Fault::kLauncherLaunch, "Launcher: LauncherLaunch", 0},
        {Fault::kNotifyLaunched, "Launcher: NotifyLaunched", 1},
        {Fault::kNotifyRunning, "Launcher: NotifyRunning", 1},
    };
    for (const auto& row : kRows) {
        fLauncher->fKills = 0;
        fApp->SetInjectedFault(row.fault);
        OpenTasks();
        NewData();
        fStdout->fOpen = row.fault == Fault::kNotifyRunning ? false : true;
        fStderr->fOpen = fStdout->fOpen.load();
        boost::thread opener([&] {
            std::this_thread::sleep_for(std::chrono::milliseconds(100));
            OpenTasks();
        });
        EXPECT_TRUE(ThrowsFailure(row.text, [&] { fApp->Launch(fData, fParams); })) << row.text;
        opener.join();
        EXPECT_EQ(fApp->GetState(0.0), State::kIdle) << row.text;
        EXPECT_EQ(fLauncher->fKills, row.kills) << row.text;
        Launch();
        End(kEndedNormally);
        EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kFinished) << "the next launch runs clean";
    }
}

TEST_F(ConsoleAppTest, AFaultAtTheWaitKillsTheChild)
{
    fApp->SetInjectedFault(Fault::kLauncherWait);
    try {
        Launch();
        OpenTasks();
        EXPECT_TRUE(ThrowsFailure("Launcher: LauncherWait", [&] { fApp->Wait(nullptr, 10.0); }));
    } catch (const Exception& exc) {
        EXPECT_STREQ(exc.what(), "Launcher: LauncherWait") << "the fault came before Launch looked";
    }
    EXPECT_EQ(fLauncher->fKills, 1);
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, AFaultAtTheEndLosesTheExitCode)
{
    fApp->SetInjectedFault(Fault::kNotifyFinished);
    Launch();
    End(kEndedNormally, 5);
    int exitCode = -1;
    EXPECT_TRUE(ThrowsFailure("Launcher: NotifyFinished", [&] { fApp->Wait(&exitCode, 10.0); }));
    EXPECT_EQ(exitCode, -1);
    EXPECT_EQ(fLauncher->fKills, 0);
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, AFaultAtTheKillLeavesTheChildAlive)
{
    Launch();
    fApp->SetInjectedFault(Fault::kLauncherKill);
    EXPECT_TRUE(ThrowsFailure("Client: LauncherKill", [&] { fApp->Kill(); }));
    EXPECT_EQ(fLauncher->fKills, 0);
    fApp->ThrowIfFailurePending();
    EXPECT_EQ(fApp->GetState(0.0), State::kTimeout) << "Killing is no stable state";
    fApp->Kill();
    OpenTasks();
    EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kKilled) << "the fault fired once";
}

TEST_F(ConsoleAppTest, AFaultAtTheBeginOfOutputFailsTheLaunch)
{
    fApp->SetInjectedFault(Fault::kNotifyOutputTaskBegin);
    EXPECT_TRUE(ThrowsFailure("stdout: NotifyOutputTaskBegin", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fKills, 1);
}

TEST_F(ConsoleAppTest, AFaultAtTheEndOfOutputIsThrownByWait)
{
    fApp->SetInjectedFault(Fault::kNotifyOutputTaskEnd);
    Launch();
    fStdout->fOpen = true;
    EXPECT_TRUE(ThrowsFailure("stdout: NotifyOutputTaskEnd", [&] { fApp->Wait(nullptr, 0.5); }));
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, FailuresAreThrownOldestFirstOnePerCall)
{
    fApp->NotifyFailure(Exception(TaskID::kStdout, "first"));
    fApp->NotifyFailure(Exception(TaskID::kStderr, "second"));
    EXPECT_TRUE(ThrowsFailure("stdout: first", [&] { Peek(); }));
    EXPECT_TRUE(ThrowsFailure("stderr: second", [&] { Peek(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    fApp->NotifyFailure(Exception(TaskID::kStdout, "third"));
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle) << "a reset discards them";
}

TEST_F(ConsoleAppTest, AFailureWakesASleepingWaitAtOnce)
{
    Launch();
    boost::thread failing([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        End(kEndedNormally);
        fApp->NotifyFailure(Exception(TaskID::kStdout, "ouch"));
    });
    EXPECT_TRUE(ThrowsFailure("stdout: ouch", [&] { fApp->Wait(nullptr, 30.0); }));
    failing.join();
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, InjectionFiresOnceAndOnlyForItsPoint)
{
    fApp->SetInjectedFault(Fault::kLauncherWait);
    fApp->ThrowIfInjected(TaskID::kClient, Fault::kLauncherKill, "LauncherKill");
    EXPECT_TRUE(ThrowsFailure("stderr: somewhere", [&] {
        fApp->ThrowIfInjected(TaskID::kStderr, Fault::kLauncherWait, "somewhere");
    }));
    fApp->ThrowIfInjected(TaskID::kStderr, Fault::kLauncherWait, "somewhere");
}

TEST_F(ConsoleAppTest, OutputTaskThatNeverStartsFailsTheLaunch)
{
    fParams.SetOutputTask(OutputChannel::kStdout, boost::make_shared<OutputTask>());
    // Launch waits as long as the launcher does, so that its own wait may run out first.
    EXPECT_TRUE(ThrowsFailure("Launcher: LauncherTask: output task stdout never started", [&] {
        Launch();
        fApp->Wait(nullptr, 10.0);
    }));
    // Where Launch's wait did run out first, the launcher's thread was given up on its way to this.
    EXPECT_TRUE(Eventually([this] { return fLauncher->fKills == 1; }));
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, OutputTaskThatWillNotEndIsGivenUp)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    Launch();
    fStdout->fOpen = true;
    fLauncher->End(kEndedNormally, 4);
    // One pump hangs for the short wait, which is what Wait gives the launcher's thread too: either
    // it sees the failure, or gives the thread up.
    try {
        EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kTimeout);
    } catch (const Exception& exc) {
        EXPECT_STREQ(exc.what(), "Launcher: output task thread abandoned");
    }
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_GE(ManagedThread::GetRegisteredThreadCount(), threads + 1) << "the pump runs on";
    OpenTasks();
}

TEST_F(ConsoleAppTest, ExceptionInANotificationIsAFailureOfItsParty)
{
    fApp->fThrowIn = "OnRunning";
    boost::thread opener([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        OpenTasks();
    });
    std::string text;
    try {
        Launch();
        fApp->Wait(nullptr, 10.0);
    } catch (const Exception& exc) {
        text = exc.what();
    }
    opener.join();
    EXPECT_EQ(text, "Launcher: OnRunning failed");
    EXPECT_EQ(fLauncher->fKills, 1) << "a failure after the start leaves no child running";
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, WithoutATaskForAChannelTheLaunchSucceeds)
{
    fParams.SetOutputTask(OutputChannel::kStderr, nullptr);
    Launch();
    EXPECT_EQ(Peek(), State::kRunning);
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStderr), nullptr);
    End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, 10.0), State::kFinished);
}

TEST_F(ConsoleAppTest, TasksRunningAfterTheEndOfOutput)
{
    Launch();
    EXPECT_EQ(fApp->GetTasksRunning(), 14U);
    fStdout->fOpen = true;
    while (fStdout->IsRunning(0.0))
        boost::this_thread::yield();
    EXPECT_EQ(fApp->GetTasksRunning(), 12U);
    End(kEndedNormally);
    while (fStderr->IsRunning(0.0))
        boost::this_thread::yield();
    EXPECT_EQ(fApp->GetTasksRunning(), 8U) << "the launcher's thread is not joined yet";
    fApp->Wait(nullptr, 10.0);
    EXPECT_EQ(fApp->GetTasksRunning(), 0U);
}

TEST_F(ConsoleAppTest, StandardInputIsClosedUnlessItIsKept)
{
    Launch();
    EXPECT_TRUE(Eventually([this] { return fLauncher->fInput.use_count() == 1; }))
        << "nobody holds the writer once the launcher's thread has let go of it";
    End(kEndedNormally);
    fApp->Wait(nullptr, 10.0);
}

TEST_F(ConsoleAppTest, StandardInputTakesTextAndLines)
{
    fParams.fKeepStdin = true;
    Launch();
    const unsigned char bytes[] = {'a', 'b'};
    fApp->WriteAppStdin(bytes, 2);
    fApp->WritelnAppStdin("line");
    fApp->WritelnAppStdin(std::string("another"));
    EXPECT_EQ(fLauncher->fInput->fWritten, "abline\nanother\n");
    EXPECT_TRUE(ThrowsInvalidArgument("ConsoleApp::WritelnAppStdin str=nullptr", [&] {
        fApp->WritelnAppStdin(static_cast<const char*>(nullptr));
    }));
    fLauncher->fInput->Close();
    EXPECT_TRUE(
        ThrowsRuntimeError("pmutil::Channel not open", [&] { fApp->WriteAppStdin(bytes, 2); }));
    fApp->CloseAppStdin();
    fApp->CloseAppStdin();
    End(kEndedNormally);
    fApp->Wait(nullptr, 10.0);
}

TEST_F(ConsoleAppTest, CloseAppStdinClosesTheWriter)
{
    fParams.fKeepStdin = true;
    Launch();
    fApp->CloseAppStdin();
    EXPECT_FALSE(fLauncher->fInput->fOpen);
    End(kEndedNormally);
    fApp->Wait(nullptr, 10.0);
}

using ConsoleAppDeathTest = ConsoleAppTest;

TEST_F(ConsoleAppDeathTest, MissingPartsFailThePointerAssertion)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const unsigned char byte = 'a';
    EXPECT_DEATH(fApp->WriteAppStdin(&byte, 1), "px != 0");
    EXPECT_DEATH(fApp->GetTasksRunning(), "px != 0");
}

TEST_F(ConsoleAppTest, ResetWhileRunningAbandonsTheLaunch)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    Launch();
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fData->GetConsoleApp(), nullptr);
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStdout), nullptr);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads + 3)
        << "the launcher's thread, and the two that it will join";
}

TEST_F(ConsoleAppTest, DestructionWhileRunningReturns)
{
    Launch();
    fApp.reset();
    // The launcher's thread may be in a notification, and is the last owner then.
    for (int tries = 0; tries < 10'000 && fData->GetConsoleApp() != nullptr; ++tries)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_EQ(fData->GetConsoleApp(), nullptr);
}

} // namespace
