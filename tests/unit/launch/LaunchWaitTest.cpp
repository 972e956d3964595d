// The waits of a supervised application: what wakes them, their limits and their results. The limit
// of a wait is far longer than the test, so that only a wake ends it.
#include <limits>

#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "Journal.h"
#include "all/WaitTime.h"
#include "pmutil/ConsoleAppAccessor.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

constexpr double kEndless = 1000 * kLong;
constexpr char kOther[] = "other"; // the party of a thread of no launch

class LaunchWait : public ConsoleAppFixture {
protected:
    ~LaunchWait() override
    {
        fGate->Open();
        End(kEndedNormally);
    }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    Journal fJournal;
    const ThreadsEnd fThreadsEnd;
};

TEST_F(LaunchWait, AFailureWakesASleepingWait)
{
    LaunchUntilItWaits();
    std::string failure;
    boost::thread waiter([&] {
        fJournal.Enter(kOther);

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
    boost::thread waiter([&] {
        fJournal.Enter(kOther);
        state = fApp->GetState(kEndless);
    });
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

TEST_F(LaunchWait, KillSleepsUntilAStableState)
{
    fApp->SetState(State::kLaunched);
    boost::thread killer([&] {
        fJournal.Enter(kOther);
        fApp->Kill();
    });
    fJournal.Await(kOther, "ConsoleApp::GetStateLocked nloops=0 fState=Launched");
    EXPECT_EQ(fLauncher->fKills, 0);
    fApp->SetState(State::kRunning);
    killer.join();
    EXPECT_THAT(fJournal.Take(kOther),
                testing::ElementsAre("ConsoleApp::GetStateLocked nloops=0 fState=Launched",
                                     "ConsoleApp::ThrowIfFailurePendingLocked numFailures=0",
                                     "ConsoleApp::GetStateLocked nloops=1 fState=Running",
                                     "ConsoleApp::ThrowIfFailurePendingLocked numFailures=0",
                                     "SetStateLocked state=Killing"));
    EXPECT_EQ(fLauncher->fKills, 1);
    fApp->Reset();
}

TEST_F(LaunchWait, KillWaitsNoLongerThanTheShortWait)
{
    const DebugValueSetter defaultWait("ConsoleAppDefaultWaitSecondsMinus10", 100'000);
    const DebugValueSetter stateWait("ConsoleAppDefaultStateWaitSecondsTimesTenMinus1", 1'000'000);
    fApp->SetState(State::kLaunched);
    boost::thread killer([&] {
        fJournal.Enter(kOther);

        const NoShortWait noWait;
        fApp->Kill();
    });
    fJournal.Await(kOther, "SetStateLocked state=Killing");
    fApp->SetState(State::kRunning); // ends any wait
    killer.join();
    EXPECT_EQ(fLauncher->fKills, 1);
    fApp->Reset();
}

// The child has ended, but the thread that waited for it doesn't.
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
    boost::thread waiter([&] {
        fJournal.Enter(kOther);
        end = fApp->Wait(nullptr, 0.0);
    });
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
    fApp->SetState(State::kFinished); // without an exit code
    int exitCode = -1;
    boost::thread waiter([&] {
        fJournal.Enter(kOther);
        fApp->Wait(&exitCode, kLong);
    });
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

// Waits of this length time out while the test holds the mutex that the waiter needs.
constexpr double kBrief = 0.2;

void OutlastABriefWait()
{
    const double end = GetWaitClock() + 2 * kBrief;
    while (GetWaitClock() < end)
        boost::this_thread::yield();
}

TEST_F(LaunchWait, AStateThatComesWhenTheTimeHasJustRunOutIsSeen)
{
    const std::string looks = "ConsoleApp::GetStateLocked nloops=0 fState=Launched";
    boost::mutex own;
    // Repeat if the test was too slow to stop the waiter.
    for (int attempt = 1, seen = 0; seen == 0; ++attempt) {
        fApp->SetState(State::kLaunched);
        State state = State::kUndefined;
        boost::thread waiter([&] {
            fJournal.Enter(kOther);

            boost::unique_lock<boost::mutex> lock(own);
            state = fApp->GetStateLocked(lock, kBrief);
        });
        fJournal.Await(kOther, looks, attempt);
        {
            const boost::lock_guard<boost::mutex> hold(own);
            const auto entries = fJournal.Take(kOther);
            seen = entries.size() == 2 ? 1 : 0;
            OutlastABriefWait();
            fApp->SetState(State::kRunning);
        }
        waiter.join();
        if (seen != 0)
            EXPECT_EQ(state, State::kRunning);
    }
    fApp->Reset();
}

// Returns a standard input that calls a function in each write, with the application's mutex held.
class InputLauncher : public FakeLauncher {
public:
    class Input : public FakeChannel {
    public:
        explicit Input(std::function<void()> onWrite) : fOnWrite(std::move(onWrite)) {}

    protected:
        std::uint64_t BinioWriteSome(const void* /*bytes*/, std::uint64_t nbytes) override
        {
            fOnWrite();
            return nbytes;
        }

    private:
        const std::function<void()> fOnWrite;
    };

    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        LaunchResult result = FakeLauncher::Launch(program, args);
        result.fAppInput = boost::make_shared<Input>([this] { fOnWrite(); });
        return result;
    }

    std::function<void()> fOnWrite;
};

TEST_F(LaunchWait, AnEndThatComesWhenTheTimeHasJustRunOutIsSeen)
{
    struct Ending : RecordingApp {
        using RecordingApp::RecordingApp;
        void EndLocked() { SetStateLocked({}, State::kFinished); }
    };
    const auto launcher = boost::make_shared<InputLauncher>();
    fLauncher = launcher;
    const auto app = boost::make_shared<Ending>(launcher);
    fApp = app;
    fParams.fKeepStdin = true;
    const auto timesOut = testing::Contains("ConsoleApp::Wait Wait timed out");
    const std::string sleeps = "ConsoleApp::Wait fState=Running fCond.timed_wait";
    for (int attempt = 1, seen = 0; seen == 0; ++attempt) {
        LaunchUntilItWaits();
        launcher->fOnWrite = [&] {
            seen = testing::Value(fJournal.Take(kOther), timesOut) ? 0 : 1;
            OutlastABriefWait();
            app->EndLocked();
        };
        boost::thread waiter([&] {
            fJournal.Enter(kOther);
            fApp->Wait(nullptr, kBrief);
        });
        fJournal.Await(kOther, sleeps, attempt);
        const unsigned char byte = 'x';
        fApp->WriteAppStdin(&byte, 1);
        waiter.join();
        if (seen != 0)
            EXPECT_THAT(fJournal.Take(kOther), testing::Not(timesOut));
        End(kEndedNormally);
        fApp->Reset();
    }
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

TEST(WaitTime, IsInfiniteBeyondAHundredYears)
{
    constexpr double kYears = 100.0 * 365 * 24 * 60 * 60;
    EXPECT_EQ(ToWaitDuration(kYears).total_seconds(), 3153600000);
    EXPECT_TRUE(ToWaitDuration(kYears + 1).is_pos_infinity());
    EXPECT_FALSE(ToWaitDuration(-kYears).is_special());
    EXPECT_TRUE(ToWaitDuration(-kYears - 1).is_neg_infinity());
    EXPECT_TRUE(ToWaitDuration(std::numeric_limits<double>::quiet_NaN()).is_not_a_date_time());
}

} // namespace
