// The states of a launch: every transition, with its calls and locks.
#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "RecordingLogger.h"

using namespace pmutil;
using testing::ElementsAre;

namespace {

// The states in the order in which they were set, by the log.
class StateLog {
public:
    std::vector<std::string> Get() const
    {
        const std::string before = "SetStateLocked state=";
        std::vector<std::string> states;
        for (const std::string& line : fLogger.lines) {
            const std::string message = MessageOf(line);
            if (message.compare(0, before.size(), before) == 0)
                states.push_back(message.substr(before.size(), message.size() - before.size() - 1));
        }
        return states;
    }

private:
    const DebugValueSetter fSwitch{"ConsoleAppLog", 1};
    const RecordingLogger fLogger;
};

using StateSequence = ConsoleAppFixture;

TEST_F(StateSequence, OfALaunchThatEndsByItself)
{
    const StateLog log;
    Launch();
    End(kEndedNormally);
    fApp->Wait(nullptr, kLong);
    // Both Launch and the launcher's thread log Launching.
    EXPECT_THAT(log.Get(),
                ElementsAre("Launching", "Launching", "Launched", "Running", "Finished", "Idle"));
}

TEST_F(StateSequence, OfACrash)
{
    const StateLog log;
    Launch();
    End(kEndedByCrash);
    fApp->Wait(nullptr, kLong);
    EXPECT_THAT(log.Get(),
                ElementsAre("Launching", "Launching", "Launched", "Running", "Crashed", "Idle"));
}

TEST_F(StateSequence, OfAKill)
{
    const StateLog log;
    Launch();
    fApp->Kill();
    fApp->Wait(nullptr, kLong);
    EXPECT_THAT(log.Get(), ElementsAre("Launching", "Launching", "Launched", "Running", "Killing",
                                       "Killed", "Idle"));
}

TEST_F(StateSequence, OfAKillAfterATimedOutWait)
{
    const StateLog log;
    fLauncher->fMortal = false;
    Launch();
    fApp->Wait(nullptr, 0.0);
    KillAtTimeout();
    End(kEndedByKill);
    fApp->Wait(nullptr, kLong);
    EXPECT_THAT(log.Get(), ElementsAre("Launching", "Launching", "Launched", "Running", "Timeout",
                                       "Timeout", "Killing", "Killed", "Idle"));
}

TEST_F(StateSequence, OfAnEndThatNobodyKnows)
{
    const StateLog log;
    Launch();
    End(static_cast<WaitResult>(3));
    EXPECT_TRUE(Eventually([&] { return fApp->CountEvents("OnFinished 0") == 1; }));
    fApp->Reset();
    EXPECT_THAT(log.Get(),
                ElementsAre("Launching", "Launching", "Launched", "Running", "Undefined", "Idle"));
}

TEST_F(StateSequence, OfALaunchThatFails)
{
    fLauncher->fLaunchFailure = "no wings";
    const StateLog log;
    EXPECT_THROW(Launch(), consoleapp::Exception);
    EXPECT_THAT(log.Get(), ElementsAre("Launching", "Launching", "Idle"));
}

// From each state.
class Transition : public ConsoleAppFixture, public testing::WithParamInterface<State> {
protected:
    // Whether the event leads to `expected`. GetState returns Timeout for an unstable state.
    template <typename Event>
    void ExpectState(const Event& event, State expected)
    {
        fApp->SetState(GetParam());
        const DebugValueSetter log("ConsoleAppLog", 1);
        const RecordingLogger logger;
        event();
        std::ostringstream line;
        line << "SetStateLocked state=" << expected << "\n";
        std::string last;
        for (const std::string& each : logger.lines)
            if (MessageOf(each).compare(0, 14, "SetStateLocked") == 0)
                last = MessageOf(each);
        EXPECT_EQ(last, line.str());
        EXPECT_EQ(Peek(), IsStable(expected) ? expected : State::kTimeout);
        fApp->Reset();
    }
};

TEST_P(Transition, NotifyLaunching)
{
    ExpectState([&] { fApp->NotifyLaunching(TaskID::kLauncher); }, State::kLaunching);
}

TEST_P(Transition, NotifyLaunched)
{
    ExpectState([&] { fApp->NotifyLaunched(TaskID::kLauncher); }, State::kLaunched);
}

TEST_P(Transition, NotifyRunning)
{
    ExpectState([&] { fApp->NotifyRunning(TaskID::kLauncher, LaunchResult()); }, State::kRunning);
}

TEST_P(Transition, NotifyFinishedByItself)
{
    ExpectState([&] { fApp->NotifyFinished(TaskID::kLauncher, 0, State::kFinished); },
                State::kFinished);
}

TEST_P(Transition, NotifyFinishedByACrash)
{
    ExpectState([&] { fApp->NotifyFinished(TaskID::kLauncher, 0, State::kCrashed); },
                State::kCrashed);
}

TEST_P(Transition, NotifyFinishedByAKill)
{
    ExpectState([&] { fApp->NotifyFinished(TaskID::kLauncher, 0, State::kKilled); },
                State::kKilled);
}

TEST_P(Transition, NotifyFinishedWithAnUnknownResult)
{
    ExpectState([&] { fApp->NotifyFinished(TaskID::kLauncher, 0, State::kUndefined); },
                State::kUndefined);
}

TEST_P(Transition, Reset)
{
    ExpectState([&] { fApp->Reset(); }, State::kIdle);
}

TEST_P(Transition, GetStateRunsOutOfTime)
{
    fApp->SetState(GetParam());
    EXPECT_EQ(fApp->GetState(0.01), IsStable(GetParam()) ? GetParam() : State::kTimeout);
    fApp->SetState(State::kRunning);
    EXPECT_EQ(fApp->GetState(0.01), State::kRunning) << "a later state overwrites it";
}

TEST_P(Transition, Kill)
{
    const NoShortWait noWait;
    fApp->SetState(GetParam());
    fApp->Kill();
    // The wait for an unstable state timed out first, and Timeout counts as Running.
    const bool kills = !IsStable(GetParam()) || GetParam() == State::kRunning;
    EXPECT_EQ(fLauncher->fKills, kills ? 1 : 0);
    EXPECT_EQ(Peek(), kills ? State::kTimeout : GetParam()) << "Killing is not stable";
}

INSTANTIATE_TEST_SUITE_P(From, Transition,
                         testing::Values(State::kUndefined, State::kIdle, State::kLaunching,
                                         State::kLaunched, State::kRunning, State::kFinishing,
                                         State::kFinished, State::kCrashed, State::kKilling,
                                         State::kKilled, State::kTimeout),
                         [](const auto& parameter) {
                             std::ostringstream name;
                             name << parameter.param;
                             return name.str();
                         });

using Notification = ConsoleAppFixture;

TEST_F(Notification, EachComesOnceWithoutTheLock)
{
    Launch();
    End(kEndedNormally, 7);
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kFinished);
    const auto events = fApp->Events(); // marks an event with the lock held
    EXPECT_THAT(events, testing::UnorderedElementsAre("OnLaunching", "begin stdout", "begin stderr",
                                                      "OnRunning", "end stdout", "end stderr",
                                                      "OnFinished 7"));
    EXPECT_EQ(events.front(), "OnLaunching");
    const auto at = [&](const char* event) {
        return std::find(events.begin(), events.end(), event) - events.begin();
    };
    EXPECT_LT(at("begin stdout"), at("OnRunning"))
        << "the tasks run before the child counts as running";
    EXPECT_LT(at("begin stderr"), at("OnRunning"));
    EXPECT_LT(at("OnRunning"), at("OnFinished 7"));
}

TEST_F(Notification, OfACrashHasTheCodeZero)
{
    Launch();
    End(kEndedByCrash);
    fApp->Wait(nullptr, kLong);
    EXPECT_THAT(fApp->Events(), testing::Contains("OnFinished 0"));
}

TEST_F(Notification, MayCallBackIn)
{
    fApp->fOnEvent = [&](const std::string& event) {
        if (event == "OnRunning")
            fApp->Kill();
        else if (event == "end stdout")
            fApp->GetState(0.0);
    };
    Launch();
    EXPECT_EQ(fApp->Wait(nullptr, kLong), State::kKilled);
}

TEST_F(Notification, KillOfThePlatformIsCalledUnderTheLock)
{
    bool locked = false;
    fLauncher->fMortal = false;
    fLauncher->fOnKill = [&] { locked = fApp->IsLocked(0.05); };
    LaunchUntilItWaits();
    fApp->Kill();
    fApp->JoinAskers();
    EXPECT_TRUE(locked);
    End(kEndedByKill);
    fApp->Wait(nullptr, kLong);
}

TEST_F(Notification, OutputNotificationsCheckTheChannel)
{
    for (const int bad : {-1, 0, 3}) {
        const auto channel = static_cast<OutputChannel>(bad);
        EXPECT_TRUE(ThrowsRuntimeError("invalid OutputChannel",
                                       [&] { fApp->NotifyOutputTaskBegin(channel); }));
        EXPECT_TRUE(ThrowsRuntimeError("invalid OutputChannel",
                                       [&] { fApp->NotifyOutputTaskEnd(channel); }));
    }
    EXPECT_THAT(fApp->Events(), ElementsAre());
}

} // namespace
