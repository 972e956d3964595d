// The waits of a supervised application: what wakes them, how long they may last and what a look
// finds. A wait is made far longer than the test lasts, so that only what wakes it can end it.
#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "Journal.h"
#include "all/WaitTime.h"
#include "pmutil/ConsoleAppAccessor.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

constexpr double kEndless = 1000 * kLong;
constexpr char kOther[] = ""; // the party of a thread that belongs to no launch

class LaunchWait : public ConsoleAppFixture {
protected:
    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    Journal fJournal;
};

TEST_F(LaunchWait, AFailureWakesASleepingWait)
{
    LaunchUntilItWaits();
    std::string failure;
    boost::thread waiter([&] {
        try {
            fApp->Wait(nullptr, kEndless);
        } catch (const Exception& exc) {
            failure = exc.what();
        }
    });
    fJournal.Await(kOther, "ConsoleApp::Wait fState=Running fCond.timed_wait");
    fApp->NotifyFailure(Exception(TaskID::kStdout, "ouch"));
    fJournal.Await(kOther, "ThrowIfFailurePendingLocked throwing exc=stdout: ouch");
    End(kEndedNormally);
    waiter.join();
    EXPECT_EQ(failure, "stdout: ouch");
}

TEST_F(LaunchWait, GetStateSleepsUntilAStableState)
{
    fApp->SetState(State::kLaunched);
    State state = State::kUndefined;
    boost::thread waiter([&] { state = fApp->GetState(kEndless); });
    fJournal.Await(kOther, "ConsoleApp::GetStateLocked nloops=0 fState=Launched");
    fApp->SetState(State::kRunning);
    waiter.join();
    EXPECT_EQ(state, State::kRunning);
    EXPECT_THAT(fJournal.Take(kOther),
                testing::ElementsAre("ConsoleApp::GetStateLocked nloops=0 fState=Launched",
                                     "ConsoleApp::ThrowIfFailurePendingLocked numFailures=0",
                                     "ConsoleApp::GetStateLocked nloops=1 fState=Running",
                                     "ConsoleApp::ThrowIfFailurePendingLocked numFailures=0"));
    fApp->Reset();
}

TEST_F(LaunchWait, KillWaitsNoLongerThanTheShortWait)
{
    const DebugValueSetter defaultWait("ConsoleAppDefaultWaitSecondsMinus10", 100'000);
    const DebugValueSetter stateWait("ConsoleAppDefaultStateWaitSecondsTimesTenMinus1", 1'000'000);
    fApp->SetState(State::kLaunched);
    boost::thread killer([&] {
        const NoShortWait noWait;
        fApp->Kill();
    });
    fJournal.Await(kOther, "SetStateLocked state=Killing");
    fApp->SetState(State::kRunning); // ends any wait
    killer.join();
    EXPECT_EQ(fLauncher->fKills, 1);
    fApp->Reset();
}

// The child has ended, and the thread that saw it doesn't.
TEST_F(LaunchWait, TheJoinMustFitIntoTheTimeLeft)
{
    const DebugValueSetter longShortWait("ConsoleAppShortWaitSecondsMinusOne", 600'000);
    fApp->fOnEvent = [gate = fGate](const std::string& event) {
        if (event == "OnFinished 3")
            gate->Await();
    };
    Launch();
    fJournal.Await("Launcher", "calling fLauncher->Wait");
    End(kEndedNormally, 3);
    fJournal.Await("Launcher", "SetStateLocked state=Finished");
    State end = State::kUndefined;
    boost::thread waiter([&] { end = fApp->Wait(nullptr, 0.0); });
    fJournal.Await(kOther, "ConsoleApp::Wait fLauncherThread.TimedJoin(0)");
    fJournal.Await(kOther, "ConsoleApp::Wait fLauncherThread never finished");
    fGate->Open();
    waiter.join();
    EXPECT_EQ(end, State::kTimeout);
}

TEST_F(LaunchWait, ResetForgetsTheExitCode)
{
    LaunchUntilItWaits();
    End(kEndedNormally, 7);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
    fApp->Reset();
    LaunchUntilItWaits();
    fApp->SetState(State::kFinished); // nobody told a code yet
    int exitCode = -1;
    boost::thread waiter([&] { fApp->Wait(&exitCode, kLong); });
    fJournal.Await(kOther, "ConsoleApp::Wait fLauncherThread.TimedJoin(");
    End(kEndedNormally, 9);
    waiter.join();
    EXPECT_EQ(exitCode, 0);
}

TEST_F(LaunchWait, AnAccessorMissesTheAppAfterItsReset)
{
    LaunchUntilItWaits();
    End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
    const ConsoleAppAccessor accessor(TaskID::kClient, fData);
    EXPECT_EQ(accessor.GetConsoleApp(), fApp);
    fApp->Reset();
    EXPECT_TRUE(ThrowsFailure("Client: no console app", [&] { accessor.GetConsoleApp(); }));
}

TEST(WaitTime, IsRoundedToWholeMilliseconds)
{
    const struct {
        double seconds;
        long microseconds;
    } kRows[] = {{0.0, 0},          {0.0004, 0},    {0.0006, 1000},
                 {0.0014, 1000},    {0.0016, 2000}, {1.2344, 1234000},
                 {1.2346, 1235000}, {0.001, 1000},  {60.0, 60000000}};
    for (const auto& row : kRows)
        EXPECT_EQ(ToWaitDuration(row.seconds).total_microseconds(), row.microseconds)
            << row.seconds;
    EXPECT_EQ(GetTimeLeft(GetWaitClock() - 1.0), 0.0);
}

} // namespace
