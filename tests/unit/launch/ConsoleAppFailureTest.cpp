// Failures of a launch: their list, the injected faults, and the client's view.
#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "FailingStart.h"
#include "RecordingLogger.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

using FailureList = ConsoleAppFixture;

TEST_F(FailureList, IsThrownOldestFirstOnePerCall)
{
    fApp->NotifyFailure(Exception(TaskID::kStdout, "first"));
    fApp->NotifyFailure(Exception(TaskID::kStderr, "second"));
    EXPECT_TRUE(ThrowsFailure("stdout: first", [&] { Peek(); }));
    EXPECT_TRUE(ThrowsFailure("stderr: second", [&] { Peek(); }));
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(FailureList, IsThrownByEachKindOfWait)
{
    const auto fail = [&] { fApp->NotifyFailure(Exception(TaskID::kStdout, "stored")); };
    fail();
    EXPECT_TRUE(ThrowsFailure("stdout: stored", [&] { fApp->GetState(kLong); }));
    fail();
    EXPECT_TRUE(ThrowsFailure("stdout: stored", [&] { fApp->Kill(); }));
    fail();
    EXPECT_TRUE(ThrowsFailure("stdout: stored", [&] { fApp->ThrowIfFailurePending(); }));
    fail();
    EXPECT_TRUE(ThrowsFailure("stdout: stored", [&] { fApp->Wait(nullptr, kLong); }));
    OpenTasks();
    fail();
    const NoShortWait noWait; // for a launch that doesn't end
    EXPECT_TRUE(ThrowsFailure("stdout: stored", [&] { fApp->Launch(fData, fParams); }))
        << "one that was stored before";
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(FailureList, IsDiscardedByReset)
{
    fApp->NotifyFailure(Exception(TaskID::kStdout, "first"));
    fApp->NotifyFailure(Exception(TaskID::kStdout, "second"));
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(FailureList, IsDiscardedBehindTheOneThatWaitThrows)
{
    fApp->SetState(State::kRunning);
    fApp->NotifyFailure(Exception(TaskID::kStdout, "first"));
    fApp->NotifyFailure(Exception(TaskID::kStdout, "second"));
    EXPECT_TRUE(ThrowsFailure("stdout: first", [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(FailureList, IsLoggedWithItsSize)
{
    const DebugValueSetter log("ConsoleAppLog", 1);
    const RecordingLogger logger;
    fApp->NotifyFailure(Exception(TaskID::kStdout, "first"));
    fApp->NotifyFailure(Exception(TaskID::kStderr, "second"));
    std::vector<std::string> messages;
    for (const std::string& line : logger.lines)
        messages.push_back(MessageOf(line));
    EXPECT_THAT(messages, testing::ElementsAre("NotifyFailureLocked: exc=stdout: first\n",
                                               "NotifyFailureLocked: exc=stderr: second\n",
                                               "NotifyFailureLocked: fFailures.size()=2\n"));
}

using InjectedFault = ConsoleAppFixture;

TEST_F(InjectedFault, FiresOnceAndOnlyForItsPoint)
{
    fApp->SetInjectedFault(Fault::kLauncherWait);
    fApp->ThrowIfInjected(TaskID::kClient, Fault::kLauncherKill, "LauncherKill");
    EXPECT_TRUE(ThrowsFailure("stderr: somewhere", [&] {
        fApp->ThrowIfInjected(TaskID::kStderr, Fault::kLauncherWait, "somewhere");
    }));
    fApp->ThrowIfInjected(TaskID::kStderr, Fault::kLauncherWait, "somewhere");
    fApp->SetInjectedFault(Fault::kLauncherWait);
    EXPECT_TRUE(ThrowsFailure("Client: <nullptr>", [&] {
        fApp->ThrowIfInjected(TaskID::kClient, Fault::kLauncherWait, nullptr);
    }));
    fApp->ThrowIfInjected(TaskID::kClient, Fault::kNoFault, "never");
}

TEST_F(InjectedFault, IsDisarmedByReset)
{
    fApp->SetInjectedFault(Fault::kLauncherLaunch);
    fApp->Reset();
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, NotifyLaunchingOfTheLauncher)
{
    fApp->SetInjectedFault(Fault::kNotifyLaunching);
    EXPECT_TRUE(ThrowsFailure("Launcher: NotifyLaunching", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fLaunches, 0);
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, LauncherLaunchOfTheLauncher)
{
    fApp->SetInjectedFault(Fault::kLauncherLaunch);
    EXPECT_TRUE(ThrowsFailure("Launcher: LauncherLaunch", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fLaunches, 0);
    EXPECT_EQ(fLauncher->fKills, 0);
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, NotifyLaunchedOfTheLauncherKillsTheChild)
{
    fApp->SetInjectedFault(Fault::kNotifyLaunched);
    EXPECT_TRUE(ThrowsFailure("Launcher: NotifyLaunched", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fLaunches, 1);
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, NotifyRunningOfTheLauncherKillsTheChild)
{
    fApp->SetInjectedFault(Fault::kNotifyRunning);
    EXPECT_TRUE(ThrowsFailure("Launcher: NotifyRunning", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_THAT(fApp->Events(), testing::Not(testing::Contains("OnRunning")));
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, LauncherWaitOfTheLauncherKillsTheChild)
{
    fApp->SetInjectedFault(Fault::kLauncherWait);
    // The launch has ended by then, unless the client's thread is slow.
    EXPECT_TRUE(ThrowsFailure("Launcher: LauncherWait", [&] {
        Launch();
        fApp->Wait(nullptr, kLong);
    }));
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_THAT(fApp->Events(), testing::Contains("OnRunning"));
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, NotifyFinishedOfTheLauncherLosesTheExitCode)
{
    fApp->SetInjectedFault(Fault::kNotifyFinished);
    Launch();
    End(kEndedNormally, 5);
    int exitCode = -1;
    EXPECT_TRUE(ThrowsFailure("Launcher: NotifyFinished", [&] { fApp->Wait(&exitCode, kLong); }));
    EXPECT_EQ(exitCode, -1);
    EXPECT_EQ(fLauncher->fKills, 0) << "it was seen to end";
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_TRUE(RunsClean());
}

TEST_F(InjectedFault, LauncherKillOfTheClientLeavesTheChildAlive)
{
    Launch();
    fApp->SetInjectedFault(Fault::kLauncherKill);
    EXPECT_TRUE(ThrowsFailure("Client: LauncherKill", [&] { fApp->Kill(); }));
    EXPECT_EQ(fLauncher->fKills, 0);
    fApp->ThrowIfFailurePending();
    EXPECT_EQ(Peek(), State::kTimeout) << "Killing is no stable state";
    fApp->SetState(State::kRunning);
    fApp->Kill();
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled) << "the fault fired once";
}

TEST_F(InjectedFault, LauncherKillOfTheLauncherEndsTheCleanUp)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    fApp->SetInjectedFault(Fault::kLauncherKill);
    fApp->fThrowIn = "OnRunning";
    EXPECT_TRUE(ThrowsFailure("Launcher: OnRunning failed", [&] {
        Launch();
        fApp->Wait(nullptr, kLong);
    }));
    EXPECT_EQ(fLauncher->fKills, 0) << "the child keeps running";
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads + 2)
        << "both output threads are let go";
}

// The faults of the output threads fire in the first thread that reaches them.
class OutputFault : public ConsoleAppFixture, public testing::WithParamInterface<OutputChannel> {
protected:
    OutputFault()
    {
        const bool isStdout = GetParam() == OutputChannel::kStdout;
        fParams.SetOutputTask(isStdout ? OutputChannel::kStderr : OutputChannel::kStdout, nullptr);
        fParty = isStdout ? "stdout" : "stderr";
    }

    std::string fParty;
};

TEST_P(OutputFault, NotifyOutputTaskBeginFailsTheLaunch)
{
    fApp->SetInjectedFault(Fault::kNotifyOutputTaskBegin);
    {
        const FailingStart failing(fParty);
        EXPECT_TRUE(ThrowsFailure(fParty + ": NotifyOutputTaskBegin", [&] { Launch(); }));
    }
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_THAT(fApp->Events(), testing::ElementsAre("OnLaunching"));
    EXPECT_TRUE(RunsClean());
}

TEST_P(OutputFault, NotifyOutputTaskEndIsThrownByWait)
{
    fApp->SetInjectedFault(Fault::kNotifyOutputTaskEnd);
    Launch();
    End(kEndedNormally, 4);
    EXPECT_TRUE(ThrowsFailure(fParty + ": NotifyOutputTaskEnd", [&] {
        fApp->Wait(nullptr, kLong);
    })) << "the thread of the launch ends after it";
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fKills, 0);
    EXPECT_TRUE(RunsClean());
}

INSTANTIATE_TEST_SUITE_P(Of, OutputFault,
                         testing::Values(OutputChannel::kStdout, OutputChannel::kStderr),
                         [](const auto& parameter) {
                             return parameter.param == OutputChannel::kStdout ? "Stdout" : "Stderr";
                         });

using Situation = ConsoleAppFixture;

TEST_F(Situation, ThePlatformFailsToStartTheChild)
{
    fLauncher->fLaunchFailure = "no wings";
    EXPECT_TRUE(ThrowsFailure("Launcher: no wings", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fKills, 0);
    fLauncher->fLaunchFailure.clear();
    EXPECT_TRUE(RunsClean());
}

TEST_F(Situation, ThePlatformFailsToWaitForTheChild)
{
    fLauncher->fWaitFailure = "lost sight";
    Launch();
    End(kEndedNormally);
    EXPECT_TRUE(ThrowsFailure("Launcher: lost sight", [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_TRUE(fLauncher->AwaitKills(1)) << "a child that was not seen to end is killed";
}

TEST_F(Situation, TheChildHangs)
{
    Launch();
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, 0.02), State::kTimeout);
    EXPECT_EQ(Peek(), State::kTimeout);
    EXPECT_EQ(exitCode, -1);
    KillAtTimeout();
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kKilled);
}

TEST_F(Situation, AnOutputTaskDoesNotStartInTheShortWait)
{
    fApp->fOnEvent = [gate = fGate](const std::string& event) {
        if (event == "begin stdout")
            gate->Await();
    };
    const NoShortWait noWait;
    // Launch and the thread of the launch wait for the same time; either may be first.
    EXPECT_TRUE(ThrowsFailure("Launcher: LauncherTask: output task stdout never started", [&] {
        Launch();
        fApp->Wait(nullptr, kLong);
    }));
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(Situation, AnOutputTaskThatFailsTakesPrecedenceOverOneThatNeverStarted)
{
    fApp->fThrowIn = "begin stderr";
    const FailingStart failing("stderr");
    EXPECT_TRUE(ThrowsFailure("stderr: begin stderr failed", [&] { Launch(); }));
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(Situation, ANotificationThrowsBeforeTheStart)
{
    fApp->fThrowIn = "OnLaunching";
    EXPECT_TRUE(ThrowsFailure("Launcher: OnLaunching failed", [&] { Launch(); }));
    EXPECT_EQ(fLauncher->fLaunches, 0);
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(Situation, ANotificationThrowsWhileTheChildRuns)
{
    fApp->fThrowIn = "OnRunning";
    EXPECT_TRUE(ThrowsFailure("Launcher: OnRunning failed", [&] {
        Launch();
        fApp->Wait(nullptr, kLong);
    }));
    EXPECT_TRUE(fLauncher->AwaitKills(1)) << "a failure after the start leaves no child running";
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(Situation, ANotificationThrowsAfterTheEnd)
{
    fApp->fThrowIn = "OnFinished 4";
    Launch();
    End(kEndedNormally, 4);
    EXPECT_TRUE(
        ThrowsFailure("Launcher: OnFinished 4 failed", [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_EQ(fLauncher->fKills, 0) << "nothing is to be killed";
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(Situation, SeveralFailures)
{
    LaunchUntilItWaits();
    fApp->NotifyFailure(Exception(TaskID::kClient, "first"));
    fApp->NotifyFailure(Exception(TaskID::kClient, "second"));
    fApp->NotifyFailure(Exception(TaskID::kClient, "third"));
    EXPECT_TRUE(ThrowsFailure("Client: first", [&] { Peek(); }));
    EXPECT_TRUE(ThrowsFailure("Client: second", [&] { fApp->Kill(); }));
    EXPECT_EQ(fLauncher->fKills, 0) << "the wait in it threw";
    const NoShortWait noWait;
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle) << "the rest is discarded";
    EXPECT_EQ(fLauncher->fKills, 0) << "a reset kills nobody";
}

} // namespace
