// The complete journal of launches: the log lines, calls and notifications of each party, in order.
// Every thread is blocked where another one's next entry could come before or after its own.
#include <gmock/gmock.h>

#include "FakeLauncher.h"
#include "Journal.h"
#include "Throws.h"

using namespace pmutil;
using consoleapp::Exception;
using testing::ElementsAreArray;

namespace {

using Entries = Journal::Entries;

constexpr char kReleased[] = "released"; // an entry of the client that a test adds
constexpr char kNoFailures[] = "ConsoleApp::ThrowIfFailurePendingLocked numFailures=0";

Entries operator+(Entries entries, const Entries& more)
{
    entries.insert(entries.end(), more.begin(), more.end());
    return entries;
}

// The entries of GetState in this pass, with this result.
Entries Look(const std::string& state, int pass = 0)
{
    return {"ConsoleApp::GetStateLocked nloops=" + std::to_string(pass) + " fState=" + state,
            kNoFailures};
}

class LaunchJournal : public testing::Test {
protected:
    class JournalLauncher : public FakeLauncher {
    public:
        explicit JournalLauncher(LaunchJournal& test) : fTest(test) {}

        LaunchResult Launch(const std::wstring& program,
                            const std::deque<std::string>& args) override
        {
            fTest.Happens("launcher.Launch");
            return FakeLauncher::Launch(program, args);
        }
        WaitResult Wait(int* exitCode) override
        {
            fTest.Happens("launcher.Wait");
            return FakeLauncher::Wait(exitCode);
        }
        void Kill() override
        {
            fTest.Happens("launcher.Kill");
            FakeLauncher::Kill();
        }

    private:
        LaunchJournal& fTest;
    };

    class JournalTask : public OutputTask {
    public:
        explicit JournalTask(LaunchJournal& test, std::string name)
            : fTest(test), fName(std::move(name))
        {}

    protected:
        void DoBegin(Lock& lock) override { Happens(lock, "DoBegin"); }
        void DoRun() override
        {
            fTest.Happens("DoRun " + fName);
            if (fName == "failing")
                throw std::runtime_error("no ink");
        }
        void DoEnd(Lock& lock) override { Happens(lock, "DoEnd"); }
        void CloseReader(Lock& lock) override
        {
            Happens(lock, "CloseReader");
            OutputTask::CloseReader(lock);
        }

    private:
        void Happens(const Lock& lock, const std::string& step)
        {
            fTest.Happens(step + (lock.owns_lock() ? " locked" : " not locked"));
        }

        LaunchJournal& fTest;
        const std::string fName;
    };

    LaunchJournal()
    {
        fApp->fOnEvent = [this](const std::string& event) { Happens(event); };
        fParams.SetOutputTask(OutputChannel::kStdout, fStdout);
        fParams.SetOutputTask(OutputChannel::kStderr, fStderr);
        fParams.fProgram = L"program";
        EXPECT_THAT(fJournal.Take("Client"), ElementsAreArray({"ConsoleApp::ConsoleApp()"}));

        // The client gets each state of the launch.
        Hold("launcher.Launch", "Client", "ConsoleApp::GetStateLocked nloops=1");
        Hold("begin stdout", "Client", "ConsoleApp::GetStateLocked nloops=2");
        Hold("OnRunning", "Client", "ConsoleApp::GetStateLocked nloops=3");
        // The launcher's thread waits for each task to start.
        Hold("begin stdout", "Launcher", "OutputTask::IsRunningLocked");
        Hold("begin stderr", "Launcher", "OutputTask::IsRunningLocked", 2);
        // The tasks run until the clean-up waits for them.
        const std::string joining = "CleanupLaunchThreadTask: joining output task thread for ";
        Hold("DoRun stdout", "Launcher", joining + "stdout");
        Hold("DoRun stderr", "Launcher", joining + "stderr");
    }

    ~LaunchJournal() override
    {
        fJournal.Add(kReleased);
        fLauncher->End(kEndedNormally);
    }

    struct Held {
        std::string party;
        std::string entry;
        int count;
    };

    // Blocks the thread of `event` there until the party has the entry. Call before the launch.
    void Hold(const std::string& event, const std::string& party, const std::string& entry,
              int count = 1)
    {
        fHolds[event].push_back({party, entry, count});
    }

    void Happens(const std::string& event)
    {
        fJournal.Add(event);
        const auto holds = fHolds.find(event);
        if (holds == fHolds.end())
            return;
        for (const Held& held : holds->second)
            fJournal.Await(held.party, held.entry, held.count);
    }

    void Launch()
    {
        fData = boost::make_shared<consoleapp::ExecutionData>(boost::weak_ptr<ConsoleApp>(fApp),
                                                              boost::weak_ptr<OutputTask>(fStdout),
                                                              boost::weak_ptr<OutputTask>(fStderr));
        fApp->Launch(fData, fParams);
    }

    // Launches, and takes the entries of the start from the client's and the launcher's journal.
    void LaunchUntilItWaits()
    {
        Launch();
        fJournal.Await("Launcher", "launcher.Wait");
        EXPECT_THAT(fJournal.Take("Client"), ElementsAreArray(ClientLaunches()));
        EXPECT_THAT(fJournal.Take("Launcher"), ElementsAreArray(LauncherUntilItWaits()));
    }

    static Entries ClientLaunches()
    {
        return Entries{"SetStateLocked state=Launching"} + Look("Launching") +
               Look("Launching", 1) + Look("Launched", 2) + Look("Running", 3);
    }

    static Entries LauncherStartsATask(const std::string& channel)
    {
        return {"LaunchThreadTask fAppOutput[" + channel + "] use_count=2",
                "LaunchThreadTask OutputThreadTask spawned, use_count[" + channel + "]=3",
                "OutputTask::IsRunning " + channel + " maxWaitSeconds=600",
                "OutputTask::IsRunningLocked waitSeconds=...",
                "timed_wait returns",
                "IsRunningLocked returns 1"};
    }

    static Entries LauncherUntilItRuns()
    {
        return Entries{"LaunchThreadTask::operator()()", "SetStateLocked state=Launching",
                       "OnLaunching", "launcher.Launch", "SetStateLocked state=Launched"} +
               LauncherStartsATask("stdout") + LauncherStartsATask("stderr") +
               Entries{"SetStateLocked state=Running", "OnRunning"};
    }

    static Entries LauncherUntilItWaits()
    {
        return LauncherUntilItRuns() + Entries{"calling fLauncher->Wait", "launcher.Wait"};
    }

    static Entries LauncherSeesTheEnd(const std::string& result, const std::string& state)
    {
        return {"fLauncher->Wait returns " + result, "SetStateLocked state=" + state};
    }

    static Entries LauncherCleansUp(const std::string& mustKill)
    {
        return {"LaunchThreadTask::CleanupLaunchThreadTask mustKill=" + mustKill};
    }

    static Entries LauncherJoins()
    {
        return {"CleanupLaunchThreadTask: joining output task thread for stdout maxWait=600",
                "CleanupLaunchThreadTask: joining output task thread for stderr maxWait=600"};
    }

    static Entries LauncherGivesUp(const std::string& channel)
    {
        return {"CleanupLaunchThreadTask: joining output task thread for " + channel + " maxWait=0",
                "CleanupLaunchThreadTask: giving up waiting for output task " + channel,
                "thread " + channel + " was abandoned",
                "NotifyFailureLocked: exc=Launcher: output task thread abandoned"};
    }

    // The entries of the end of a thread of an abandoned launch.
    static Entries MissesTheApp(const std::string& party)
    {
        return {"ConsoleAppAccessor::NotifyFailure exc=" + party +
                ": no console app could not notify app because " + party + ": no console app"};
    }

    static Entries TaskUntilItRuns(const std::string& channel)
    {
        return {"LaunchOutputThreadTask::operator()() fOutputChannel=" + channel,
                "begin " + channel,
                kNoFailures,
                "OutputTask::Run " + channel,
                "OutputTask::Run DoBegin",
                "DoBegin locked",
                "OutputTask::SetIsRunning(1)",
                "OutputTask::Run DoRun",
                "DoRun " + channel};
    }

    static Entries TaskEnds(const std::string& channel)
    {
        return {"OutputTask::SetIsRunning(0)",
                "OutputTask::Run DoEnd",
                "DoEnd locked",
                "OutputTask::Run CloseReader",
                "CloseReader locked",
                kNoFailures,
                "end " + channel};
    }

    void ExpectWholeTasks()
    {
        for (const std::string channel : {"stdout", "stderr"})
            EXPECT_THAT(fJournal.Take(channel),
                        ElementsAreArray(TaskUntilItRuns(channel) + TaskEnds(channel)));
        EXPECT_THAT(fJournal.Take(""), ElementsAreArray(Entries{})) << "of nobody";
    }

    static Entries ClientSleeps(const std::string& state)
    {
        return Entries{"ConsoleApp::Wait() maxWaitSeconds=300"} + Look(state) +
               Entries{"ConsoleApp::Wait fState=" + state + " fCond.timed_wait waitSeconds=..."};
    }

    static Entries ClientSeesTheEnd(const std::string& state)
    {
        return Look(state) + Entries{"ConsoleApp::Wait fLauncherThread.TimedJoin(...)",
                                     "SetStateLocked state=Idle", kNoFailures,
                                     "ConsoleApp::Wait returns " + state};
    }

    // Blocks the thread there until the test releases it.
    void HoldUntilReleased(const std::string& event) { fHolds[event] = {{"Client", kReleased, 1}}; }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    const LongShortWait fLongShortWait;
    Journal fJournal;
    std::map<std::string, std::vector<Held>> fHolds;
    boost::shared_ptr<JournalLauncher> fLauncher = boost::make_shared<JournalLauncher>(*this);
    boost::shared_ptr<RecordingApp> fApp = boost::make_shared<RecordingApp>(fLauncher);
    boost::shared_ptr<JournalTask> fStdout = boost::make_shared<JournalTask>(*this, "stdout");
    boost::shared_ptr<JournalTask> fStderr = boost::make_shared<JournalTask>(*this, "stderr");
    boost::shared_ptr<consoleapp::ExecutionData> fData;
    LaunchParams fParams;
    const ThreadsEnd fThreadsEnd;
};

// How a child ends, and the entries of all parties.
struct End {
    const char* name;
    WaitResult result;
    int code;
    const char* returned;
    const char* state;
    State outcome;
    const char* notification;
};

class LaunchEnd : public LaunchJournal, public testing::WithParamInterface<End> {};

TEST_P(LaunchEnd, IsJournaledWhole)
{
    const End& end = GetParam();
    Hold(end.notification, "Client", "ConsoleApp::Wait fLauncherThread.TimedJoin(");
    LaunchUntilItWaits();
    // The child ends while the client sleeps, and the thread after the client has seen it.
    boost::thread child([&] {
        fJournal.Await("Client", "ConsoleApp::Wait fState=Running");
        fLauncher->End(end.result, end.code);
    });
    int exitCode = -1;
    EXPECT_EQ(fApp->Wait(&exitCode, kLong), end.outcome);
    child.join();
    EXPECT_EQ(exitCode, end.code);
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray(ClientSleeps("Running") + ClientSeesTheEnd(end.state)));
    EXPECT_THAT(fJournal.Take("Launcher"),
                ElementsAreArray(LauncherSeesTheEnd(end.returned, end.state) +
                                 Entries{end.notification} + LauncherCleansUp("0") +
                                 LauncherJoins()));
    ExpectWholeTasks();
}

INSTANTIATE_TEST_SUITE_P(Of, LaunchEnd,
                         testing::Values(End{"AChildThatEndsByItself", kEndedNormally, 7,
                                             "0 exitCode=7", "Finished", State::kFinished,
                                             "OnFinished 7"},
                                         End{"ACrash", kEndedByCrash, 0, "1 exitCode=0", "Crashed",
                                             State::kCrashed, "OnFinished 0"},
                                         End{"AKill", kEndedByKill, 0, "2 exitCode=0", "Killed",
                                             State::kKilled, "OnFinished 0"}),
                         [](const auto& parameter) { return parameter.param.name; });

TEST_F(LaunchJournal, OfAChildThatIsKilled)
{
    LaunchUntilItWaits();
    fApp->Kill();
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray(Look("Running") +
                                 Entries{"SetStateLocked state=Killing", "launcher.Kill"}));
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled);
    EXPECT_THAT(fJournal.Take("Launcher"),
                ElementsAreArray(LauncherSeesTheEnd("2 exitCode=0", "Killed") +
                                 Entries{"OnFinished 0"} + LauncherCleansUp("0") +
                                 LauncherJoins()));
    ExpectWholeTasks();
}

TEST_F(LaunchJournal, OfAStartThatFails)
{
    fLauncher->fLaunchFailure = "no wings";
    EXPECT_TRUE(ThrowsExactly<Exception>("Launcher: no wings", [&] { Launch(); }));
    EXPECT_THAT(
        fJournal.Take("Client"),
        ElementsAreArray(
            Entries{"SetStateLocked state=Launching"} + Look("Launching") + Look("Launching", 1) +
            Entries{"ConsoleApp::GetStateLocked nloops=2 fState=Launching",
                    "ConsoleApp::ThrowIfFailurePendingLocked numFailures=1",
                    "ThrowIfFailurePendingLocked throwing exc=Launcher: no wings",
                    "ConsoleApp::LaunchHandleException exc=Launcher: no wings joinWaitSEconds=600",
                    "fLauncherThread.TimedJoin returns 1", "Launch exception: calling Reset()",
                    "SetStateLocked state=Idle"}));
    EXPECT_THAT(
        fJournal.Take("Launcher"),
        ElementsAreArray(Entries{"LaunchThreadTask::operator()()", "SetStateLocked state=Launching",
                                 "OnLaunching", "launcher.Launch",
                                 "LaunchThreadTask inner exception=no wings",
                                 "NotifyFailureLocked: exc=Launcher: no wings"} +
                         LauncherCleansUp("0")));
}

TEST_F(LaunchJournal, OfAFaultWhileTheChildRuns)
{
    fApp->SetInjectedFault(Fault::kLauncherWait);
    Hold("OnRunning", "Client", "ConsoleApp::Wait fState=Running");
    // The tasks' threads throw a pending failure too.
    for (const std::string run : {"DoRun stdout", "DoRun stderr"})
        Hold(run, "Client", "ThrowIfFailurePendingLocked throwing");
    Launch();
    EXPECT_THAT(fJournal.Take("Client"), ElementsAreArray(ClientLaunches()));
    EXPECT_TRUE(
        ThrowsExactly<Exception>("Launcher: LauncherWait", [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_THAT(
        fJournal.Take("Client"),
        ElementsAreArray(
            ClientSleeps("Running") +
            Entries{"ConsoleApp::GetStateLocked nloops=0 fState=Running",
                    "ConsoleApp::ThrowIfFailurePendingLocked numFailures=1",
                    "ThrowIfFailurePendingLocked throwing exc=Launcher: LauncherWait",
                    "ConsoleApp::HandleWaitException exc=Launcher: LauncherWait waitSeconds=... "
                    "fState=Running",
                    "TimedJoin(...)", "fLauncherThread.TimedJoin timeout=1",
                    "SetStateLocked state=Idle"}));
    EXPECT_THAT(fJournal.Take("Launcher"),
                ElementsAreArray(
                    LauncherUntilItRuns() +
                    Entries{"ConsoleApp::ThrowIfInjectedLocked throwing, caller=Launcher "
                            "fault=LauncherWait msg=LauncherWait",
                            "LaunchThreadTask inner exception=Launcher: LauncherWait",
                            "NotifyFailureLocked: exc=Launcher: LauncherWait"} +
                    LauncherCleansUp("1") +
                    Entries{"CleanupLaunchThreadTask: calling fLauncher->Kill()", "launcher.Kill"} +
                    LauncherJoins()));
    ExpectWholeTasks();
}

TEST_F(LaunchJournal, OfAWaitThatRunsOutOfTime)
{
    LaunchUntilItWaits();
    EXPECT_EQ(fApp->Wait(nullptr, 0.0), State::kTimeout);
    EXPECT_THAT(
        fJournal.Take("Client"),
        ElementsAreArray(Entries{"ConsoleApp::Wait() maxWaitSeconds=0"} + Look("Running") +
                         Entries{"ConsoleApp::Wait fState=Running fCond.timed_wait "
                                 "waitSeconds=0",
                                 "ConsoleApp::Wait Wait timed out", "SetStateLocked state=Timeout",
                                 kNoFailures, "ConsoleApp::Wait returns Timeout"}));
    EXPECT_EQ(fApp->GetState(0.0), State::kTimeout);
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray(Look("Timeout") +
                                 Entries{"ConsoleApp::GetStateLocked timeout, fState=Timeout",
                                         "SetStateLocked state=Timeout"}));
    EXPECT_EQ(fApp->GetTasksRunning(), 14U);
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray({"OutputTask::IsRunning stdout maxWaitSeconds=0",
                                  "IsRunningLocked returns 1",
                                  "OutputTask::IsRunning stderr maxWaitSeconds=0",
                                  "IsRunningLocked returns 1", "GetTasksRunning result=14"}));
    fLauncher->End(kEndedNormally);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
}

// The launcher's thread waits for the child, and no thread waits for it any more.
TEST_F(LaunchJournal, OfAWaitThatGivesALaunchUp)
{
    LaunchUntilItWaits();
    fApp->NotifyFailure(Exception(TaskID::kClient, "ouch"));
    EXPECT_TRUE(ThrowsExactly<Exception>("Client: ouch", [&] { fApp->Wait(nullptr, 0.0); }));
    EXPECT_THAT(
        fJournal.Take("Client"),
        ElementsAreArray(
            {"NotifyFailureLocked: exc=Client: ouch", "ConsoleApp::Wait() maxWaitSeconds=0",
             "ConsoleApp::GetStateLocked nloops=0 fState=Running",
             "ConsoleApp::ThrowIfFailurePendingLocked numFailures=1",
             "ThrowIfFailurePendingLocked throwing exc=Client: ouch",
             "ConsoleApp::HandleWaitException exc=Client: ouch waitSeconds=0 fState=Running",
             "TimedJoin(0)", "fLauncherThread.TimedJoin timeout=0", "abandon fLauncherThread",
             "thread Launcher was abandoned", "SetStateLocked state=Idle"}));
    fLauncher->End(kEndedNormally);
    fJournal.Await("Launcher", LauncherJoins().back());
    fJournal.Await("stderr", MissesTheApp("stderr").back());
    EXPECT_THAT(
        fJournal.Take("Launcher"),
        ElementsAreArray(Entries{"fLauncher->Wait returns 0 exitCode=0",
                                 "LaunchThreadTask inner exception=Launcher: no console app"} +
                         MissesTheApp("Launcher") + LauncherCleansUp("0") + LauncherJoins()));
    for (const std::string channel : {"stdout", "stderr"}) {
        Entries ends = TaskEnds(channel);
        ends.resize(ends.size() - 2);
        EXPECT_THAT(fJournal.Take(channel),
                    ElementsAreArray(TaskUntilItRuns(channel) + ends + MissesTheApp(channel)));
    }
}

TEST_F(LaunchJournal, OfAWaitAfterATimeoutThatGivesALaunchUp)
{
    LaunchUntilItWaits();
    fApp->SetState(State::kTimeout);
    fApp->NotifyFailure(Exception(TaskID::kClient, "ouch"));
    EXPECT_THROW(fApp->Wait(nullptr, kLong), Exception);
    const Entries client = fJournal.Take("Client");
    const auto caught = std::find_if(client.begin(), client.end(), [](const std::string& entry) {
        return entry.rfind("ConsoleApp::HandleWaitException", 0) == 0;
    });
    EXPECT_THAT(Entries(caught, client.end()),
                ElementsAreArray({"ConsoleApp::HandleWaitException exc=Client: ouch "
                                  "waitSeconds=... fState=Timeout",
                                  "abandon fLauncherThread", "thread Launcher was abandoned",
                                  "SetStateLocked state=Idle"}))
        << "no join";
}

TEST_F(LaunchJournal, OfAThreadThatNeverFinishes)
{
    HoldUntilReleased("OnFinished 7");
    LaunchUntilItWaits();
    fLauncher->End(kEndedNormally, 7);
    fJournal.Await("Launcher", "OnFinished 7");
    {
        const NoShortWait noWait;
        EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kTimeout);
    }
    EXPECT_THAT(
        fJournal.Take("Client"),
        ElementsAreArray(Entries{"ConsoleApp::Wait() maxWaitSeconds=300"} + Look("Finished") +
                         Entries{"ConsoleApp::Wait fLauncherThread.TimedJoin(0)",
                                 "ConsoleApp::Wait fLauncherThread never finished",
                                 "thread Launcher was abandoned", "SetStateLocked state=Idle",
                                 kNoFailures, "ConsoleApp::Wait returns Timeout"}));
}

TEST_F(LaunchJournal, OfAResetThatGivesALaunchUp)
{
    LaunchUntilItWaits();
    {
        const NoShortWait noWait;
        fApp->Reset();
    }
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray({"ConsoleApp::Reset abandon fLauncherThread",
                                  "thread Launcher was abandoned", "SetStateLocked state=Idle"}));
}

TEST_F(LaunchJournal, OfOutputThatIsGivenUp)
{
    HoldUntilReleased("DoRun stdout");
    HoldUntilReleased("DoRun stderr");
    LaunchUntilItWaits();
    const NoShortWait noWait;
    fLauncher->End(kEndedNormally);
    fJournal.Await("Launcher", "NotifyFailureLocked: fFailures.size()=2");
    EXPECT_TRUE(ThrowsExactly<Exception>("Launcher: output task thread abandoned",
                                         [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_THAT(fJournal.Take("Launcher"),
                ElementsAreArray(LauncherSeesTheEnd("0 exitCode=0", "Finished") +
                                 Entries{"OnFinished 0"} + LauncherCleansUp("0") +
                                 LauncherGivesUp("stdout") + LauncherGivesUp("stderr") +
                                 Entries{"NotifyFailureLocked: fFailures.size()=2"}));
}

TEST_F(LaunchJournal, OfATaskThatNeverStarts)
{
    HoldUntilReleased("begin stdout");
    fHolds["launcher.Launch"] = {{"Client", "ConsoleApp::GetStateLocked timeout", 1}};
    const NoShortWait noWait;
    Launch();
    fJournal.Await("Launcher", "NotifyFailureLocked: fFailures.size()=2");
    const std::string text = "LauncherTask: output task stdout never started";
    EXPECT_TRUE(ThrowsExactly<Exception>("Launcher: " + text, [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_THAT(
        fJournal.Take("Launcher"),
        ElementsAreArray(
            Entries{"LaunchThreadTask::operator()()", "SetStateLocked state=Launching",
                    "OnLaunching", "launcher.Launch", "SetStateLocked state=Launched",
                    "LaunchThreadTask fAppOutput[stdout] use_count=2",
                    "LaunchThreadTask OutputThreadTask spawned, use_count[stdout]=3",
                    "OutputTask::IsRunning stdout maxWaitSeconds=0", "IsRunningLocked returns 0",
                    kNoFailures, text, "LaunchThreadTask inner exception=" + text,
                    "NotifyFailureLocked: exc=Launcher: " + text} +
            LauncherCleansUp("1") +
            Entries{"CleanupLaunchThreadTask: calling fLauncher->Kill()", "launcher.Kill"} +
            LauncherGivesUp("stdout") +
            Entries{"NotifyFailureLocked: fFailures.size()=2", "CloseReader locked"}));
}

// A task that has already ended counts as one that never started.
TEST_F(LaunchJournal, OfATaskThatEndsBeforeAnybodyLooks)
{
    fHolds["launcher.Launch"] = {{"Client", "ConsoleApp::GetStateLocked timeout", 1}};
    fHolds.erase("begin stdout");
    fHolds.erase("DoRun stdout");
    fJournal.SetOnLine([this](const std::string& line) {
        if (line.rfind("LaunchThreadTask OutputThreadTask spawned, use_count[stdout]", 0) == 0)
            fJournal.AwaitWithoutLogMutex("stdout", "end stdout");
    });
    const NoShortWait noWait;
    Launch();
    fJournal.Await("Launcher", "NotifyFailureLocked: exc=");
    EXPECT_TRUE(ThrowsExactly<Exception>("Launcher: LauncherTask: output task stdout never started",
                                         [&] { fApp->Wait(nullptr, kLong); }));
    EXPECT_THAT(fJournal.Take("stdout"),
                ElementsAreArray(TaskUntilItRuns("stdout") + TaskEnds("stdout")));
}

TEST_F(LaunchJournal, OfATaskThatFails)
{
    JournalTask task(*this, "failing");
    EXPECT_TRUE(ThrowsRuntimeError("no ink", [&] { task.Run(); }));
    EXPECT_THAT(
        fJournal.Take("Client"),
        ElementsAreArray({"OutputTask::Run Undefined", "OutputTask::Run DoBegin", "DoBegin locked",
                          "OutputTask::SetIsRunning(1)", "OutputTask::Run DoRun", "DoRun failing",
                          "OutputTask::SetIsRunning(0)", "CloseReader locked"}));
}

TEST_F(LaunchJournal, OfATaskThatDoesNothing)
{
    OutputTask task;
    task.Run();
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray({"OutputTask::Run Undefined", "OutputTask::Run DoBegin",
                                  "OutputTask::SetIsRunning(1)", "OutputTask::Run DoRun",
                                  "OutputTask::SetIsRunning(0)", "OutputTask::Run DoEnd",
                                  "OutputTask::Run CloseReader"}));
}

TEST_F(LaunchJournal, OfAFaultWithoutAName)
{
    ConsoleAppAccessor client(TaskID::kClient,
                              boost::make_shared<consoleapp::ExecutionData>(
                                  boost::weak_ptr<ConsoleApp>(fApp), boost::weak_ptr<OutputTask>(),
                                  boost::weak_ptr<OutputTask>()));
    client.SetInjectedFault(Fault::kLauncherKill);
    EXPECT_THROW(fApp->ThrowIfInjected(TaskID::kStderr, Fault::kLauncherKill, nullptr, nullptr),
                 Exception);
    EXPECT_THAT(fJournal.Take("Client"),
                testing::ElementsAre("ConsoleApp::ThrowIfInjectedLocked throwing, caller=stderr "
                                     "fault=LauncherKill msg=<NULL>"));
}

TEST_F(LaunchJournal, OfTheDestructor)
{
    fApp.reset();
    EXPECT_THAT(fJournal.Take("Client"),
                ElementsAreArray({"ConsoleApp::~ConsoleApp()", "SetStateLocked state=Idle"}));
}

} // namespace
