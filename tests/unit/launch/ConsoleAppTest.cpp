#include "pmutil/ConsoleApp.h"

#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"

using namespace pmutil;

namespace {

using ConsoleAppTest = ConsoleAppFixture;

TEST(ConsoleAppWaits, HaveDefaultsAndDebugValues)
{
    EXPECT_EQ(ConsoleApp::GetDefaultWaitSeconds(), 10.0);
    EXPECT_EQ(ConsoleApp::GetShortWaitSeconds(), 1.0);
    EXPECT_EQ(ConsoleApp::GetDefaultStateWaitSeconds(), 0.1);
    const DebugValueSetter defaultWait("ConsoleAppDefaultWaitSecondsMinus10", 5);
    const DebugValueSetter shortWait("ConsoleAppShortWaitSecondsMinusOne", 2);
    const DebugValueSetter stateWait("ConsoleAppDefaultStateWaitSecondsTimesTenMinus1", 4);
    EXPECT_EQ(ConsoleApp::GetDefaultWaitSeconds(), 15.0);
    EXPECT_EQ(ConsoleApp::GetShortWaitSeconds(), 3.0);
    EXPECT_EQ(ConsoleApp::GetDefaultStateWaitSeconds(), 0.5);
}

TEST_F(ConsoleAppTest, EndsByItself)
{
    fParams.fArgs = {"a", "b"};
    Launch();
    EXPECT_EQ(Peek(), State::kRunning);
    EXPECT_EQ(fLauncher->fProgram, L"program");
    EXPECT_EQ(fLauncher->fArgs, fParams.fArgs);
    End(kEndedNormally, 7);
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(Peek(), State::kIdle) << "ready for the next launch";
    EXPECT_TRUE(RunsClean());
    Launch();
    End(kEndedNormally, 0);
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 0);
}

TEST_F(ConsoleAppTest, CrashHasNoCode)
{
    Launch();
    End(kEndedByCrash);
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kCrashed);
    EXPECT_EQ(exitCode, 0);
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, AnUnknownResultIsNoEnd)
{
    Launch();
    End(static_cast<WaitResult>(3));
    EXPECT_TRUE(Eventually([&] { return fApp->CountEvents("OnFinished 0") == 1; }));
    EXPECT_EQ(fApp->Wait(nullptr, 0.0), State::kTimeout);
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(ConsoleAppTest, KilledChild)
{
    Launch();
    fApp->Kill();
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kKilled);
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
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
}

TEST_F(ConsoleAppTest, LaunchRefusesEveryStateButIdle)
{
    for (int value = -1; value <= 9; ++value) {
        const auto state = static_cast<State>(value);
        if (state == State::kIdle)
            continue;
        fApp->SetState(state);
        EXPECT_TRUE(ThrowsRuntimeError("ConsoleApp: must be idle", [&] {
            fApp->Launch(fData, fParams);
        })) << state;
    }
    EXPECT_EQ(fLauncher->fLaunches, 0);
    fApp->SetState(State::kIdle);
}

TEST_F(ConsoleAppTest, LaunchReturnsWithTimeoutWhenTheStartIsSlow)
{
    fApp->fOnEvent = [gate = fGate](const std::string& event) {
        if (event == "OnLaunching")
            gate->Await();
    };
    {
        const NoShortWait noWait;
        fApp->Launch(fData, fParams);
        EXPECT_EQ(Peek(), State::kTimeout);
    }
    fGate->Open();
    EXPECT_TRUE(Eventually([&] { return fApp->CountEvents("OnRunning") == 1; }));
    End(kEndedNormally, 8);
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kFinished) << "the launch went on";
    EXPECT_EQ(exitCode, 8);
}

TEST_F(ConsoleAppTest, WaitBeforeALaunchIsIdleAtOnce)
{
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kIdle);
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
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kFinished) << "the end overwrites the timeout";
    EXPECT_EQ(exitCode, 3);
}

TEST_F(ConsoleAppTest, WaitGivesTheLaunchersThreadUpIfItWillNotEnd)
{
    fApp->fOnEvent = [gate = fGate](const std::string& event) {
        if (event == "OnFinished 3")
            gate->Await();
    };
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    Launch();
    End(kEndedNormally, 3);
    int exitCode = -1;
    {
        // The thread hangs before a short wait.
        const NoShortWait noWait;
        EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kTimeout);
    }
    EXPECT_EQ(exitCode, -1);
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_GE(ManagedThread::GetRegisteredThreadCount(), threads + 1);
    fGate->Open();
}

TEST_F(ConsoleAppTest, KillAfterATimedOutWait)
{
    fLauncher->fMortal = false;
    fLauncher->fOnKill = nullptr;
    Launch();
    EXPECT_EQ(fApp->Wait(nullptr, 0.0), State::kTimeout);
    KillAtTimeout();
    EXPECT_EQ(fLauncher->fKills, 1);
    End(kEndedByKill);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled);
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

TEST_F(ConsoleAppTest, GetStateEndsWithTheFirstStableState)
{
    fApp->SetState(State::kLaunched);
    boost::thread setter([&] { fApp->SetState(State::kRunning); });
    EXPECT_EQ(fApp->GetState(kLong), State::kRunning);
    setter.join();
    fApp->Reset();
}

TEST_F(ConsoleAppTest, WithoutATaskForAChannelTheLaunchSucceeds)
{
    fParams.SetOutputTask(OutputChannel::kStderr, nullptr);
    Launch();
    EXPECT_EQ(Peek(), State::kRunning);
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStderr), nullptr);
    End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
    EXPECT_THAT(fApp->Events(),
                testing::UnorderedElementsAre("OnLaunching", "begin stdout", "OnRunning",
                                              "end stdout", "OnFinished 0"));
}

TEST_F(ConsoleAppTest, TasksRunningAfterTheEndOfOutput)
{
    Launch();
    EXPECT_EQ(fApp->GetTasksRunning(), 14U);
    fStdout->fGate.Open();
    EXPECT_TRUE(Eventually([&] { return fApp->GetTasksRunning() == 12; }));
    End(kEndedNormally);
    EXPECT_TRUE(Eventually([&] { return fApp->GetTasksRunning() == 8; }))
        << "the launcher's thread is not joined yet";
    fApp->Wait(nullptr, kLong);
    EXPECT_EQ(fApp->GetTasksRunning(), 0U);
}

TEST_F(ConsoleAppTest, StandardInputIsClosedUnlessItIsKept)
{
    Launch();
    EXPECT_TRUE(Eventually([&] { return fLauncher->fInput.use_count() == 1; }))
        << "somebody still holds the writer";
    End(kEndedNormally);
    fApp->Wait(nullptr, kLong);
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
    fApp->Wait(nullptr, kLong);
}

TEST_F(ConsoleAppTest, CloseAppStdinClosesTheWriter)
{
    fParams.fKeepStdin = true;
    Launch();
    fApp->CloseAppStdin();
    EXPECT_FALSE(fLauncher->fInput->fOpen);
    End(kEndedNormally);
    fApp->Wait(nullptr, kLong);
}

TEST_F(ConsoleAppTest, TheNextStartClosesAWriterThatWasLeftOpen)
{
    fParams.fKeepStdin = true;
    Launch();
    End(kEndedNormally);
    fApp->Wait(nullptr, kLong);
    const auto left = fLauncher->fInput;
    EXPECT_TRUE(left->fOpen) << "the end of the child is not the end of the writer";
    Launch();
    EXPECT_FALSE(left->fOpen);
    End(kEndedNormally);
    fApp->Wait(nullptr, kLong);
    const auto second = fLauncher->fInput;
    fApp->Reset();
    EXPECT_FALSE(second->fOpen);
}

using ConsoleAppDeathTest = ConsoleAppFixture;

TEST_F(ConsoleAppDeathTest, MissingPartsFailThePointerAssertion)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const unsigned char byte = 'a';
    EXPECT_DEATH(fApp->WriteAppStdin(&byte, 1), "px != 0") << "the input wasn't kept";
    EXPECT_DEATH(fApp->GetTasksRunning(), "px != 0") << "nothing was launched";
}

TEST_F(ConsoleAppDeathTest, TasksRunningNeedsBothTasks)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    fParams.SetOutputTask(OutputChannel::kStderr, nullptr);
    EXPECT_DEATH(
        {
            Launch();
            fApp->GetTasksRunning();
        },
        "px != 0");
}

TEST_F(ConsoleAppTest, ResetWhileRunningAbandonsTheLaunch)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    LaunchUntilItWaits();
    {
        const NoShortWait noWait;
        fApp->Reset();
    }
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fData->GetConsoleApp(), nullptr);
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStdout), nullptr);
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStderr), nullptr);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads + 3)
        << "the launcher's thread, and the two that it will join";
    End(kEndedNormally);
    EXPECT_TRUE(Eventually([&] {
        return ManagedThread::GetRegisteredThreadCount() == threads + 1;
    })) << "the launcher's thread has joined the two";
}

TEST_F(ConsoleAppTest, ResetJoinsALaunchThatEnds)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    Launch();
    End(kEndedNormally);
    fApp->Reset();
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads);
}

TEST_F(ConsoleAppTest, DestructionWhileRunningReturns)
{
    LaunchUntilItWaits();
    {
        const NoShortWait noWait;
        fApp.reset();
    }
    // The launcher's thread may be in a notification, and then is the last owner.
    EXPECT_TRUE(Eventually([&] { return fData->GetConsoleApp() == nullptr; }));
}

TEST_F(ConsoleAppTest, EachOfTwoThreadsThatWaitLearnsTheEnd)
{
    for (int round = 0; round < 20; ++round) {
        Launch();
        State ends[2] = {State::kUndefined, State::kUndefined};
        int exitCodes[2] = {-1, -1};
        const auto wait = [&](int index) { ends[index] = fApp->Wait(&exitCodes[index], kLong); };
        boost::thread first([&] { wait(0); });
        boost::thread second([&] { wait(1); });
        End(kEndedNormally, 5);
        first.join();
        second.join();
        int informed = 0;
        for (int index = 0; index < 2; ++index) {
            if (ends[index] == State::kIdle)
                continue; // came after the other had finished
            ++informed;
            EXPECT_EQ(ends[index], State::kFinished);
            EXPECT_EQ(exitCodes[index], 5);
        }
        EXPECT_GE(informed, 1);
        EXPECT_EQ(Peek(), State::kIdle);
    }
}

} // namespace
