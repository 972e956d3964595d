// The functions of the threads of a launch, run on a thread of the test.
#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "FailingStart.h"
#include "RecordingLogger.h"
#include "all/LaunchOutputThreadTask.h"
#include "all/LaunchThreadTask.h"
#include "pmutil/Threads.h"

using namespace pmutil;
using consoleapp::Exception;
using testing::ElementsAre;

namespace {

class ThreadBody : public ConsoleAppFixture {
protected:
    // Removes and returns all failures, in order.
    std::vector<std::string> TakeFailures()
    {
        std::vector<std::string> failures;
        for (;;) {
            try {
                fApp->ThrowIfFailurePending();
                return failures;
            } catch (const Exception& exc) {
                failures.emplace_back(exc.what());
            }
        }
    }

    void Store(const char* message) { fApp->NotifyFailure(Exception(TaskID::kClient, message)); }

    std::vector<std::string> Messages() const
    {
        std::vector<std::string> messages;
        for (const std::string& line : fLogger.lines)
            messages.push_back(MessageOf(line));
        return messages;
    }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    const RecordingLogger fLogger;
};

class OutputThread : public ThreadBody {
protected:
    // Calls a function in DoRun.
    class Task : public OutputTask {
    public:
        std::function<void()> fDo;
        bool fRan = false;

    protected:
        void DoRun() override
        {
            fRan = true;
            if (fDo)
                fDo();
        }
    };

    OutputThread() { fData->SetOutputTask(OutputChannel::kStdout, fTask); }

    void Run()
    {
        if (fTask != nullptr)
            fTask->Prepare(OutputChannel::kStdout, fData, fReader);
        boost::thread(LaunchOutputThreadTask(OutputChannel::kStdout, fData)).join();
    }

    boost::shared_ptr<Task> fTask = boost::make_shared<Task>();
    boost::shared_ptr<FakeChannel> fReader = boost::make_shared<FakeChannel>();
};

TEST_F(OutputThread, RunsTheTaskBetweenItsNotifications)
{
    std::string name;
    std::string id;
    fTask->fDo = [&] {
        name = GetCurrentThreadName();
        id = GetCurrentThreadIDString();
    };
    Run();
    EXPECT_TRUE(fTask->fRan);
    EXPECT_THAT(fApp->Events(), ElementsAre("begin stdout", "end stdout"));
    EXPECT_THAT(TakeFailures(), ElementsAre());
    EXPECT_EQ(name, id + "(app.stdout)");
    EXPECT_EQ(Messages().at(0), "LaunchOutputThreadTask::operator()() fOutputChannel=stdout\n");
}

TEST_F(OutputThread, AFailurePendingBeforeTheTaskGoesBehindTheOthers)
{
    Store("first");
    Store("second");
    Run();
    EXPECT_FALSE(fTask->fRan);
    EXPECT_THAT(TakeFailures(), ElementsAre("Client: second", "Client: first"));
}

TEST_F(OutputThread, AFailurePendingAfterTheTaskGoesBehindTheOthers)
{
    fTask->fDo = [&] {
        Store("first");
        Store("second");
    };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("Client: second", "Client: first"));
    EXPECT_THAT(fApp->Events(), ElementsAre("begin stdout"));
    EXPECT_FALSE(fReader->fOpen);
}

TEST_F(OutputThread, AnExceptionOfTheLaunchIsStoredUnchanged)
{
    fTask->fDo = [] { throw Exception(TaskID::kClient, "mine"); };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("Client: mine"));
    EXPECT_FALSE(fReader->fOpen);
}

TEST_F(OutputThread, AnotherExceptionIsStoredAsTheChannels)
{
    fTask->fDo = [] { throw std::runtime_error("broken"); };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("stdout: broken"));
}

TEST_F(OutputThread, AnythingElseThrownIsAFailureWithoutAText)
{
    fTask->fDo = [] { throw 7; };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("stdout: LaunchOutputThreadTask failed"));
}

TEST_F(OutputThread, ATaskThatIsGoneIsAFailure)
{
    fTask.reset();
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("stdout: no output task"));
}

TEST_F(OutputThread, WithoutAnAppItEndsQuietly)
{
    fData->ClearConsoleApp();
    Run();
    EXPECT_FALSE(fTask->fRan);
    EXPECT_EQ(Messages().back(), "ConsoleAppAccessor::NotifyFailure exc=stdout: no console app "
                                 "could not notify app because stdout: no console app\n");
}

class LauncherThread : public ThreadBody {
protected:
    LauncherThread()
    {
        fStdout->fGate.Open();
        fStderr->fGate.Open();
        fParams.SetOutputTask(OutputChannel::kStdout, nullptr);
        fParams.SetOutputTask(OutputChannel::kStderr, nullptr);
        fLauncher->fOnLaunch = [this] { fLauncher->fEnded = true; };
    }

    void Run() { boost::thread(LaunchThreadTask(fData, fLauncher, fParams)).join(); }
};

TEST_F(LauncherThread, SeesALaunchFromStartToEnd)
{
    std::string name;
    std::string id;
    fApp->fOnEvent = [&](const std::string& /*event*/) {
        name = GetCurrentThreadName();
        id = GetCurrentThreadIDString();
    };
    fLauncher->fExitCode = 4;
    Run();
    EXPECT_THAT(fApp->Events(), ElementsAre("OnLaunching", "OnRunning", "OnFinished 4"));
    EXPECT_EQ(Peek(), State::kFinished);
    EXPECT_THAT(TakeFailures(), ElementsAre());
    EXPECT_EQ(name, id + "(app.Launcher)");
    EXPECT_EQ(fLauncher->fKills, 0);
    EXPECT_EQ(fLauncher->fInput.use_count(), 1) << "it keeps no end of a pipe";
    EXPECT_EQ(fLauncher->fOutput[1].use_count(), 1);
    EXPECT_EQ(fLauncher->fOutput[2].use_count(), 1);
}

// Records the order in which the ends of the pipes are released.
class WatchedEnds : public FakeLauncher {
public:
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        LaunchResult result = FakeLauncher::Launch(program, args);
        Watch(result.fAppInput, "stdin");
        Watch(result.fAppOutput[1], "stdout");
        Watch(result.fAppOutput[2], "stderr");
        return result;
    }

    std::vector<std::string> fReleased;

private:
    template <typename End>
    void Watch(boost::shared_ptr<End>& end, const char* name)
    {
        end.reset(end.get(), [this, name, kept = end](End*) { fReleased.emplace_back(name); });
    }
};

TEST_F(LauncherThread, ReleasesTheOutputsBeforeTheInput)
{
    const auto launcher = boost::make_shared<WatchedEnds>();
    launcher->fOnLaunch = [&] { launcher->fEnded = true; };
    for (const Fault fault : {Fault::kNoFault, Fault::kNotifyLaunched}) {
        launcher->fReleased.clear();
        fApp->SetInjectedFault(fault);
        boost::thread(LaunchThreadTask(fData, launcher, fParams)).join();
        EXPECT_THAT(launcher->fReleased, ElementsAre("stdout", "stderr", "stdin")) << fault;
    }
}

TEST_F(LauncherThread, MapsTheResultsToStates)
{
    const struct {
        int result;
        State state;
    } kRows[] = {{0, State::kFinished},
                 {1, State::kCrashed},
                 {2, State::kKilled},
                 {3, State::kUndefined},
                 {-1, State::kUndefined}};
    for (const auto& row : kRows) {
        fLauncher->fResult = static_cast<WaitResult>(row.result);
        Run();
        EXPECT_EQ(Peek(), row.state == State::kUndefined ? State::kTimeout : row.state);
        std::ostringstream line;
        line << "SetStateLocked state=" << row.state << "\n";
        EXPECT_THAT(Messages(), testing::Contains(line.str()));
    }
}

TEST_F(LauncherThread, FailuresAreStoredByTheirKind)
{
    fLauncher->fOnLaunch = [] { throw Exception(TaskID::kClient, "mine"); };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("Client: mine"));
    EXPECT_THAT(Messages(), testing::Contains("LaunchThreadTask inner exception=Client: mine\n"));
    fLauncher->fOnLaunch = [] { throw std::runtime_error("broken"); };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("Launcher: broken"));
    EXPECT_THAT(Messages(), testing::Contains("LaunchThreadTask inner exception=broken\n"));
    fLauncher->fOnLaunch = [] { throw 7; };
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("Launcher: LaunchThreadTask failed"));
    EXPECT_THAT(Messages(), testing::Contains("LaunchThreadTask inner exception=?\n"));
    EXPECT_EQ(fLauncher->fKills, 0) << "no child was started";
}

TEST_F(LauncherThread, AFailureOfATaskIsFoundBeforeItCountsAsOneThatNeverStarted)
{
    fParams.SetOutputTask(OutputChannel::kStderr, fStderr);
    fApp->fThrowIn = "begin stderr";
    const FailingStart failing("stderr");
    Run();
    EXPECT_THAT(TakeFailures(), ElementsAre("stderr: begin stderr failed"));
    EXPECT_EQ(fLauncher->fKills, 1);
}

TEST_F(LauncherThread, AFailureInTheCleanUpIsOnlyLogged)
{
    fLauncher->fWaitFailure = "lost sight";
    fLauncher->fOnKill = [] { throw std::runtime_error("missed"); };
    Run();
    EXPECT_EQ(Messages().back(), "LaunchThreadTask outer exception=missed\n");
    EXPECT_THAT(TakeFailures(), ElementsAre("Launcher: lost sight"));
    fLauncher->fOnKill = [] { throw 7; };
    Run();
    EXPECT_EQ(Messages().back(), "LaunchThreadTask outer exception=?\n");
}

TEST_F(LauncherThread, AnArmedKillEndsTheCleanUp)
{
    fLauncher->fWaitFailure = "lost sight";
    fApp->SetInjectedFault(Fault::kLauncherKill);
    Run();
    EXPECT_EQ(fLauncher->fKills, 0);
    EXPECT_EQ(Messages().back(), "LaunchThreadTask outer exception=Launcher: LauncherKill\n");
}

TEST_F(LauncherThread, WithoutAnAppNothingIsStarted)
{
    fData->ClearConsoleApp();
    Run();
    EXPECT_EQ(fLauncher->fLaunches, 0);
}

TEST_F(LauncherThread, AnAppThatGoesDuringTheStartTakesTheChildAlong)
{
    fLauncher->fOnLaunch = [this] { fData->ClearConsoleApp(); };
    Run();
    EXPECT_EQ(fLauncher->fLaunches, 1);
    EXPECT_EQ(fLauncher->fKills, 1);
    EXPECT_THAT(Messages(),
                testing::Contains("ConsoleAppAccessor::NotifyFailure exc=Launcher: no console app "
                                  "could not notify app because Launcher: no console app\n"));
}

TEST_F(LauncherThread, AnAppThatGoesWhileTheChildRunsIsMissedAtTheEnd)
{
    const boost::weak_ptr<RecordingApp> app = fApp;
    fApp->fOnEvent = [this](const std::string& event) {
        if (event == "OnRunning")
            fData->ClearConsoleApp();
    };
    Run();
    EXPECT_EQ(fLauncher->fKills, 1) << "the wait was never reached";
    EXPECT_THAT(fApp->Events(), ElementsAre("OnLaunching", "OnRunning"));
}

TEST_F(LauncherThread, AChannelWithoutATaskIsMarkedSo)
{
    EXPECT_NE(fData->GetOutputTask(OutputChannel::kStdout), nullptr);
    Run();
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStdout), nullptr);
    EXPECT_EQ(fData->GetOutputTask(OutputChannel::kStderr), nullptr);
}

} // namespace
