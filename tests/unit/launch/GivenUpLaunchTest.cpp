// Abandoned launches, and their effects on later launches.
#include <gmock/gmock.h>

#include "CollectingTask.h"
#include "ConsoleAppFixture.h"
#include "FailingStart.h"
#include "RecordingLogger.h"
#include "support/OpenThings.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

constexpr char kJoinsAfterEnd[] = "ConsoleApp::Wait fLauncherThread.TimedJoin(";
constexpr char kJoinsStdout[] = "CleanupLaunchThreadTask: joining output task thread for stdout";

class GivenUpLaunch : public ConsoleAppFixture {
protected:
    // The first launch uses fLauncher, and the next one, if it needs a launcher, fSecond.
    GivenUpLaunch()
    {
        fApp = boost::make_shared<RecordingApp>(fLauncher, [this] {
            ++fMade;
            return fSecond;
        });
        fLauncher->fOnKill = nullptr;
    }

    ~GivenUpLaunch() override
    {
        fGate->Open();
        fSecond->End(kEndedNormally);
        fLauncher->End(kEndedNormally);
        OpenTasks();
        for (const auto& task : fOldTasks)
            task->fGate.Open();
    }

    // Abandons a launch whose tasks continue.
    void GiveUp()
    {
        {
            const NoShortWait noWait;
            fApp->Reset();
        }
        ReplaceTasks();
    }

    void ReplaceTasks()
    {
        fOldTasks = {fStdout, fStderr};
        fStdout = boost::make_shared<PatientTask>();
        fStderr = boost::make_shared<PatientTask>();
        fParams.SetOutputTask(OutputChannel::kStdout, fStdout);
        fParams.SetOutputTask(OutputChannel::kStderr, fStderr);
    }

    // Blocks a thread of the launch in a notification until the gate opens.
    void HoldIn(const std::string& event)
    {
        fApp->fOnEvent = [gate = fGate, event](const std::string& now) {
            if (now == event)
                gate->Await();
        };
    }

    // Waits for a log line with this beginning, and returns whether it came.
    bool AwaitLine(const std::string& begin)
    {
        return Eventually([&] {
            const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
            return std::any_of(
                fLogger.lines.begin(), fLogger.lines.end(),
                [&](const std::string& line) { return MessageOf(line).rfind(begin, 0) == 0; });
        });
    }

    void ForgetLines()
    {
        const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
        fLogger.lines.clear();
    }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    RecordingLogger fLogger;
    boost::shared_ptr<FakeLauncher> fSecond = boost::make_shared<FakeLauncher>();
    std::atomic<int> fMade{0};
    std::vector<boost::shared_ptr<PatientTask>> fOldTasks;
    const ThreadsEnd fThreadsEnd;
};

TEST_F(GivenUpLaunch, OneLauncherServesAllLaunchesThatEnd)
{
    EXPECT_TRUE(RunsClean());
    fApp->SetInjectedFault(Fault::kNotifyRunning);
    fLauncher->fOnKill = [this] { OpenTasks(); };
    EXPECT_TRUE(ThrowsFailure("Launcher: NotifyRunning", [&] { Launch(); }));
    EXPECT_TRUE(RunsClean());
    Launch();
    fApp->Kill();
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled);
    EXPECT_EQ(fMade, 0);
    EXPECT_EQ(fLauncher->fLaunches, 4);
}

TEST_F(GivenUpLaunch, IsNotReachedByTheKillOfTheNext)
{
    LaunchUntilItWaits();
    GiveUp();
    Launch();
    EXPECT_EQ(fMade, 1);
    EXPECT_EQ(fSecond->fLaunches, 1);
    fSecond->fOnKill = [this] { OpenTasks(); };
    fApp->Kill();
    EXPECT_EQ(fSecond->fKills, 1);
    EXPECT_EQ(fLauncher->fKills, 0);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled);
    // After the old thread has ended, its launcher is not used again.
    fLauncher->End(kEndedNormally);
    Launch();
    EXPECT_EQ(fSecond->fLaunches, 2);
    fApp->Kill();
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled);
}

TEST_F(GivenUpLaunch, KillsItsOwnChildWhenItsStartComesThrough)
{
    fLauncher->fOnLaunch = [this] { fGate->Await(); };
    {
        const NoShortWait noWait;
        Launch();
        EXPECT_EQ(Peek(), State::kTimeout);
    }
    EXPECT_TRUE(Eventually([&] { return fLauncher->fLaunches == 1; }));
    GiveUp();
    Launch();
    fGate->Open();
    EXPECT_TRUE(fLauncher->AwaitKills(1)) << "nobody else would";
    EXPECT_EQ(fSecond->fKills, 0);
    EXPECT_EQ(Peek(), State::kRunning);
    OpenTasks();
    fSecond->End(kEndedNormally, 6);
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 6);
}

TEST_F(GivenUpLaunch, KeepsAnOnlyLauncherUntilItsThreadEnds)
{
    fApp = boost::make_shared<RecordingApp>(fLauncher);
    LaunchUntilItWaits();
    GiveUp();
    EXPECT_TRUE(ThrowsRuntimeError(
        "ConsoleApp: the launcher still serves a launch that was given up", [&] { Launch(); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(fLauncher->fLaunches, 1);
    for (const auto& task : fOldTasks)
        task->fGate.Open();
    fLauncher->End(kEndedNormally);
    EXPECT_TRUE(Eventually([&] {
        try {
            Launch();
            return true;
        } catch (const std::runtime_error&) {
            return false;
        }
    }));
    End(kEndedNormally, 2);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
    EXPECT_EQ(fLauncher->fLaunches, 2);
}

TEST_F(GivenUpLaunch, HasNoSayInTheNext)
{
    LaunchUntilItWaits();
    const auto old = fData;
    GiveUp();
    Launch();
    const auto refused = [](auto call) { return ThrowsFailure("Launcher: no console app", call); };
    constexpr TaskID kWho = TaskID::kLauncher;
    EXPECT_TRUE(refused([&] { fApp->NotifyLaunching(kWho, old.get()); }));
    EXPECT_TRUE(refused([&] { fApp->NotifyLaunched(kWho, old.get()); }));
    EXPECT_TRUE(refused([&] { fApp->NotifyRunning(kWho, LaunchResult(), old.get()); }));
    EXPECT_TRUE(refused([&] { fApp->NotifyFinished(kWho, 3, State::kFinished, old.get()); }));
    EXPECT_TRUE(refused([&] { fApp->NotifyFailure(Exception(kWho, "late"), old.get()); }));
    for (const auto notify : {&ConsoleApp::NotifyOutputTaskBegin, &ConsoleApp::NotifyOutputTaskEnd})
        EXPECT_TRUE(ThrowsFailure("stderr: no console app",
                                  [&] { ((*fApp).*notify)(OutputChannel::kStderr, old.get()); }));
    fApp->SetInjectedFault(Fault::kLauncherKill);
    fApp->ThrowIfInjected(kWho, Fault::kLauncherKill, "LauncherKill", old.get());
    EXPECT_TRUE(ThrowsFailure("Client: LauncherKill", [&] { fApp->Kill(); }))
        << "the fault wasn't the old launch's to take";
    fApp->NotifyFailure(Exception(kWho, "mine"), fData.get());
    fApp->ThrowIfFailurePending(old.get());
    EXPECT_TRUE(ThrowsFailure("Launcher: mine", [&] { Peek(); }));
}

TEST_F(GivenUpLaunch, ItsPumpHasNoSayInTheNextEvenIfItsEndWasSeen)
{
    LaunchUntilItWaits();
    {
        const NoShortWait noWait;
        fLauncher->End(kEndedNormally, 7);
        for (int pump = 0; pump < 2; ++pump) // a GetState throws each one's failure
            EXPECT_TRUE(Eventually([&] {
                try {
                    Peek();
                    return false;
                } catch (const Exception&) {
                    return true;
                }
            }));
    }
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 7);
    ReplaceTasks();
    Launch();
    for (auto& task : fOldTasks) {
        const boost::weak_ptr<OutputTask> old = task;
        task->fGate.Open();
        task.reset();
        EXPECT_TRUE(Eventually([&] { return old.expired(); }));
    }
    fOldTasks.clear();
    EXPECT_EQ(fApp->CountEvents("end stdout") + fApp->CountEvents("end stderr"), 0);
    EXPECT_EQ(Peek(), State::kRunning);
}

TEST_F(GivenUpLaunch, KeepsItsTasks)
{
    LaunchUntilItWaits();
    const auto reader = fLauncher->fOutput[1];
    GiveUp();
    fSecond->fOnKill = nullptr;
    fParams.SetOutputTask(OutputChannel::kStdout, fOldTasks[0]);
    EXPECT_TRUE(ThrowsFailure("Launcher: OutputTask::Prepare: task is running", [&] { Launch(); }));
    EXPECT_TRUE(reader->fOpen) << "the old run goes on";
    EXPECT_TRUE(fSecond->AwaitKills(1));
    EXPECT_TRUE(Eventually([&] { return fSecond->fOutput[1].use_count() == 1; }))
        << "nobody reads from the new child";
    fOldTasks[0]->fGate.Open();
    EXPECT_TRUE(Eventually([&] { return !fOldTasks[0]->IsRunning(0.0); }));
    fOldTasks[0]->fGate.Close();
    EXPECT_TRUE(Eventually([&] {
        try {
            Launch();
            return true;
        } catch (const Exception&) {
            return false;
        }
    })) << "it serves again once its run has returned";
}

TEST_F(GivenUpLaunch, LetsGoOfEverythingOnceItEnds)
{
    LaunchUntilItWaits();
    const boost::weak_ptr<OutputTask> task = fStdout;
    const boost::weak_ptr<consoleapp::ExecutionData> data = fData;
    GiveUp();
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    fApp.reset(); // holds the parameters
    fData.reset();
    for (const auto& old : fOldTasks)
        old->fGate.Open();
    fOldTasks.clear();
    fLauncher->End(kEndedNormally);
    EXPECT_TRUE(Eventually([&] { return task.expired() && data.expired(); }))
        << "its thread, which stays registered, holds it";
    EXPECT_TRUE(Eventually([&] { return fLauncher.use_count() == 1; }));
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads - 2);
}

TEST_F(GivenUpLaunch, ClosesTheReaderOfATaskWhoseThreadHangsBeforeIt)
{
    HoldIn("begin stdout");
    const NoShortWait noWait;
    const auto fail = [&] {
        Launch(); // throws if the failure is already there
        EXPECT_TRUE(fLauncher->AwaitKills(1));
        fApp->Wait(nullptr, kLong);
    };
    EXPECT_TRUE(ThrowsFailure("Launcher: LauncherTask: output task stdout never started", fail));
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_TRUE(Eventually([&] { return !fLauncher->fOutput[1]->fOpen; }));
}

TEST_F(GivenUpLaunch, AWaiterThatSawTheEndKeepsTheCode)
{
    HoldIn("OnFinished 7");
    Launch();
    State end = State::kUndefined;
    int exitCode = -1;
    boost::thread waiter([&] { end = fApp->Wait(&exitCode, 10 * kLong); });
    End(kEndedNormally, 7);
    EXPECT_TRUE(AwaitLine(kJoinsAfterEnd));
    GiveUp();
    waiter.join();
    EXPECT_EQ(end, State::kFinished);
    EXPECT_EQ(exitCode, 7);
}

TEST_F(GivenUpLaunch, AWaiterThatSawTheEndKeepsTheCodeWhenTheWaitOfAnotherFails)
{
    HoldIn("OnFinished 7");
    for (int round = 0; round < 50; ++round) { // either thread may join
        fGate->Close();
        ForgetLines();
        Launch();
        State end = State::kUndefined;
        int exitCode = -1;
        boost::thread waiter([&] { end = fApp->Wait(&exitCode, 10 * kLong); });
        End(kEndedNormally, 7);
        EXPECT_TRUE(AwaitLine(kJoinsAfterEnd));
        fApp->NotifyFailure(Exception(TaskID::kClient, "ouch"));
        boost::thread other([&] {
            EXPECT_TRUE(ThrowsFailure("Client: ouch", [&] { fApp->Wait(nullptr, 10 * kLong); }));
        });
        EXPECT_TRUE(AwaitLine("TimedJoin("));
        fGate->Open();
        waiter.join();
        other.join();
        ASSERT_EQ(end, State::kFinished);
        ASSERT_EQ(exitCode, 7);
        ASSERT_EQ(Peek(), State::kIdle);
    }
}

TEST_F(GivenUpLaunch, AWaiterOfItLeavesTheNextAlone)
{
    HoldIn("OnFinished 7");
    Launch();
    int exitCode = -1;
    State end = State::kUndefined;
    boost::thread waiter([&] { end = fApp->Wait(&exitCode, 10 * kLong); });
    End(kEndedNormally, 7);
    EXPECT_TRUE(AwaitLine(kJoinsAfterEnd));
    GiveUp();
    Launch();
    waiter.join();
    EXPECT_EQ(end, State::kFinished);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(Peek(), State::kRunning);
    EXPECT_NE(fApp->GetTasksRunning() & 8U, 0U) << "the thread of the next is still held";
}

TEST_F(GivenUpLaunch, ASleepingWaiterOfItLeavesTheNextAlone)
{
    LaunchUntilItWaits();
    State end = State::kUndefined;
    boost::thread waiter([&] { end = fApp->Wait(nullptr, 10 * kLong); });
    EXPECT_TRUE(AwaitLine("ConsoleApp::Wait fState=Running"));
    GiveUp();
    Launch();
    waiter.join();
    EXPECT_EQ(end, State::kIdle);
    EXPECT_EQ(Peek(), State::kRunning);
    fApp->NotifyFailure(Exception(TaskID::kClient, "mine"));
    EXPECT_TRUE(ThrowsFailure("Client: mine", [&] { Peek(); }));
}

TEST_F(GivenUpLaunch, OneOutputThreadWillNotEnd)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    std::optional<NoShortWait> noWait;
    // The thread of standard output ends when it is joined; the other one doesn't.
    fApp->fOnEvent = [&](const std::string& event) {
        if (event != "end stdout")
            return;
        EXPECT_TRUE(AwaitLine(kJoinsStdout));
        noWait.emplace();
    };
    Launch();
    fStdout->fGate.Open();
    fLauncher->End(kEndedNormally, 4);
    EXPECT_TRUE(AwaitLine("NotifyFailureLocked: exc=Launcher: output task thread abandoned"));
    noWait.reset();
    EXPECT_TRUE(ThrowsFailure("Launcher: output task thread abandoned",
                              [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads + 1) << "the pump runs on";
    EXPECT_TRUE(fStderr->IsRunning(0.0));
}

// The clean-up then takes two short waits, and the client waits for it only one.
TEST_F(GivenUpLaunch, TheClientIsFirstToGiveUpWhenNoOutputThreadEnds)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    Launch();
    fLauncher->End(kEndedNormally, 4);
    EXPECT_TRUE(AwaitLine(kJoinsStdout));
    int exitCode = -1;
    const NoShortWait noWait;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), State::kTimeout);
    EXPECT_EQ(exitCode, -1);
    EXPECT_EQ(Peek(), State::kIdle);
    EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), threads + 3);
}

TEST_F(GivenUpLaunch, ResetDoesNotWaitForAnotherThreadsWait)
{
    LaunchUntilItWaits();
    std::string failure;
    boost::thread waiter([&] {
        try {
            fApp->Wait(nullptr, 10 * kLong);
        } catch (const Exception& exc) {
            failure = exc.what();
        }
    });
    fApp->NotifyFailure(Exception(TaskID::kClient, "ouch"));
    EXPECT_TRUE(AwaitLine("TimedJoin(")); // with the client's own limit
    std::atomic<bool> done{false};
    boost::thread resetter([&] {
        {
            const NoShortWait noWait;
            fApp->Reset();
        }
        done = true;
    });
    EXPECT_TRUE(Eventually([&] { return done.load(); }));
    OpenTasks();
    fLauncher->End(kEndedNormally);
    resetter.join();
    waiter.join();
    EXPECT_EQ(failure, "Client: ouch");
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(GivenUpLaunch, ResetFromTheLaunchersThreadDoesNotWaitForIt)
{
    fApp->fOnEvent = [this](const std::string& event) {
        if (event != "OnFinished 7")
            return;
        EXPECT_TRUE(AwaitLine(kJoinsAfterEnd)) << "another thread waits for this one";
        fApp->Reset();
    };
    Launch();
    State end = State::kUndefined;
    int exitCode = -1;
    std::atomic<bool> done{false};
    boost::thread waiter([&] {
        end = fApp->Wait(&exitCode, 10 * kLong);
        done = true;
    });
    End(kEndedNormally, 7);
    EXPECT_TRUE(Eventually([&] { return done.load(); }));
    waiter.join();
    EXPECT_EQ(end, State::kFinished);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(GivenUpLaunch, TwoInterruptsOfALaunchLeaveItIdle)
{
    HoldIn("OnLaunching");
    fLauncher->fLaunchFailure = "no wings";
    bool interrupted = false;
    boost::thread client([&] {
        try {
            Launch();
        } catch (const boost::thread_interrupted&) {
            interrupted = true;
        }
    });
    EXPECT_TRUE(AwaitLine("ConsoleApp::GetStateLocked nloops=0"));
    client.interrupt();
    EXPECT_TRUE(AwaitLine("ConsoleApp::LaunchHandleException exc=?"));
    client.interrupt();
    fGate->Open(); // the thread of the launch ends
    client.join();
    EXPECT_TRUE(interrupted);
    EXPECT_EQ(Peek(), State::kIdle);
}

TEST_F(GivenUpLaunch, TwoInterruptsOfAWaitLeaveItIdle)
{
    LaunchUntilItWaits();
    bool interrupted = false;
    boost::thread client([&] {
        try {
            fApp->Wait(nullptr, 10 * kLong);
        } catch (const boost::thread_interrupted&) {
            interrupted = true;
        }
    });
    EXPECT_TRUE(AwaitLine("ConsoleApp::Wait fState=Running"));
    const NoShortWait noWait;
    client.interrupt();
    EXPECT_TRUE(AwaitLine("TimedJoin("));
    client.interrupt();
    client.join();
    EXPECT_TRUE(interrupted);
    EXPECT_EQ(Peek(), State::kIdle);
}

using FailedStart = ConsoleAppFixture;

TEST_F(FailedStart, ClosesTheReaderOfATaskThatNeverRan)
{
    fApp->SetInjectedFault(Fault::kNotifyOutputTaskBegin);
    const FailingStart failing("stdout");
    EXPECT_TRUE(ThrowsFailure("stdout: NotifyOutputTaskBegin", [&] { Launch(); }));
    EXPECT_TRUE(Eventually([&] { return !fLauncher->fOutput[1]->fOpen; }));
}

// At each point at which a launch fails with its child alive.
class FailedLaunch : public ConsoleAppFixture, public testing::WithParamInterface<Fault> {
protected:
    template <typename Call>
    static void ExpectFailure(const Call& launch)
    {
        std::optional<FailingStart> failing;
        if (GetParam() == Fault::kNotifyOutputTaskBegin)
            failing.emplace("stdout");
        EXPECT_THROW(launch(), Exception);
    }
};

TEST_P(FailedLaunch, KillsTheChildBeforeItsInputEnds)
{
    long holders = 0;
    fLauncher->fOnKill = [&, before = fLauncher->fOnKill] {
        holders = fLauncher->fInput.use_count();
        before();
    };
    fApp->SetInjectedFault(GetParam());
    ExpectFailure([&] { Launch(); });
    EXPECT_TRUE(fLauncher->AwaitKills(1));
    EXPECT_TRUE(Eventually([&] { return fLauncher->fInput.use_count() == 1; }));
    EXPECT_GT(holders, 1);
}

TEST_P(FailedLaunch, LeavesNoDescriptorOfARealChild)
{
    // An abandoned thread keeps handles on Windows, so that none may be abandoned.
    const auto fail = [] {
        RealLaunch launch({"sleep", "60000"});
        launch.app->SetInjectedFault(GetParam());
        ExpectFailure([&] { launch.launcher.Launch(); });
        EXPECT_EQ(launch.launcher.Wait(nullptr, 0.0), State::kIdle);
        // Wine 8's server crashes if it lists handles while a process dies.
        EXPECT_TRUE(Eventually([] { return !HasChildren(); }));
    };
    fail();
    const long before = CountOpenThings();
    constexpr int kLaunches = 3;
    for (int launch = 0; launch < kLaunches; ++launch)
        fail();
    const long most = before + kLaunches * kKeptPerLaunch + GetMaxGrowth(kLaunches);
    EXPECT_TRUE(Eventually([&] { return CountOpenThings() <= most; }));
}

INSTANTIATE_TEST_SUITE_P(At, FailedLaunch,
                         testing::Values(Fault::kNotifyLaunched, Fault::kNotifyOutputTaskBegin,
                                         Fault::kNotifyRunning),
                         [](const auto& parameter) {
                             std::ostringstream name;
                             name << parameter.param;
                             return name.str();
                         });

} // namespace
