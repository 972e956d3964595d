#include "pmutil/RunProgram.h"

#include <gmock/gmock.h>
#include <optional>

#include <boost/nowide/convert.hpp>

#include "FakeLauncher.h"
#include "RecordingLogger.h"
#include "TestChild.h"
#include "ThreadsEnd.h"
#include "Throws.h"

using namespace pmutil;
using testing::ElementsAre;

namespace {

const std::string kChild = boost::nowide::narrow(TEST_CHILD);

class RunProgramTest : public testing::Test {
protected:
    RunResult RunChild(const std::vector<std::string>& args)
    {
        return RunProgram(kChild, args, fOptions);
    }

    RunResult RunFake()
    {
        fOptions.fLauncher = fFake;
        return RunProgram("program", {}, fOptions);
    }

    const ThreadsEnd fThreadsEnd;
    const LongShortWait fLongShortWait;
    const DebugValueSetter fLongDefaultWait{"ConsoleAppDefaultWaitSecondsMinus10", 600};
    const boost::shared_ptr<FakeLauncher> fFake = boost::make_shared<FakeLauncher>();
    StopRequest fStop;
    RunOptions fOptions;
};

TEST_F(RunProgramTest, GivesBackCodeAndOutput)
{
    const RunResult run = RunChild({"out", "one", "err", "two", "out", "three", "exit", "7"});
    EXPECT_EQ(run.fEnd, State::kFinished);
    EXPECT_EQ(run.fExitCode, 7);
    EXPECT_EQ(run.fTerminationText, "");
    EXPECT_THAT(run.fOutput, testing::MatchesRegex("one\r?\nthree\r?\n"));
    EXPECT_THAT(run.fErrors, testing::MatchesRegex("two\r?\n"));
    EXPECT_FALSE(run.fTimedOut);
    EXPECT_FALSE(run.fStopped);
    EXPECT_FALSE(run.fIsOutputOpen);
    EXPECT_EQ(run.fDroppedBytes, 0U);
}

TEST_F(RunProgramTest, AProgramMayCrashAtOnce)
{
    for (int round = 0; round < 100; ++round) {
        const RunResult run = RunChild({"out", "begun", "abort"});
        ASSERT_EQ(run.fEnd, State::kCrashed) << "round " << round;
        EXPECT_EQ(run.fExitCode, 0);
        EXPECT_THAT(run.fTerminationText, testing::AnyOf("signal 6 (Aborted)", "code 0xC0000005"));
        EXPECT_EQ(run.fOutput.substr(0, 5), "begun");
    }
}

TEST_F(RunProgramTest, InputIsAtItsEnd)
{
    EXPECT_EQ(RunChild({"echo", "exit", "3"}).fExitCode, 3);
}

TEST_F(RunProgramTest, KillsAProgramWhoseTimeIsUp)
{
    fOptions.fTimeoutSeconds = 0;
    const RunResult run = RunChild({"sleep", "600000"});
    EXPECT_EQ(run.fEnd, State::kKilled);
    EXPECT_TRUE(run.fTimedOut);
    EXPECT_FALSE(run.fStopped);
    EXPECT_EQ(run.fExitCode, 0);
    EXPECT_THAT(run.fTerminationText, testing::AnyOf("signal 9 (Killed)", "code 0x00000101"));
}

TEST_F(RunProgramTest, KillsAProgramThatIsToStop)
{
    fOptions.fStop = &fStop;
    fOptions.fTakeOutput = [this](std::string_view block) {
        if (!block.empty())
            fStop.Raise();
    };
    const RunResult run = RunChild({"out", "begun", "sleep", "600000"});
    EXPECT_EQ(run.fEnd, State::kKilled);
    EXPECT_TRUE(run.fStopped);
    EXPECT_FALSE(run.fTimedOut);
}

TEST_F(RunProgramTest, StartsNothingOnceItIsToStop)
{
    fStop.Raise();
    fOptions.fStop = &fStop;
    const RunResult run = RunFake();
    EXPECT_EQ(run.fEnd, State::kIdle);
    EXPECT_TRUE(run.fStopped);
    EXPECT_EQ(fFake->fLaunches, 0);
}

TEST_F(RunProgramTest, AStopThatCameTooLateChangesNothing)
{
    fOptions.fStop = &fStop;
    fFake->fOnLaunch = [this] {
        fFake->fEnded = true;
        fFake->fExitCode = 5;
        fFake->fMortal = false;
    };
    fOptions.fTakeOutput = [this](std::string_view /*block*/) { fStop.Raise(); };
    const RunResult run = RunFake();
    EXPECT_EQ(run.fEnd, State::kFinished);
    EXPECT_EQ(run.fExitCode, 5);
    EXPECT_FALSE(run.fStopped);
}

// A start that lasts longer than the launch waits for it.
class SlowStart : public RunProgramTest {
protected:
    // Runs it, and does something while the launch has returned but the child isn't there.
    RunResult RunSlowly(const std::function<void()>& meanwhile)
    {
        std::optional<NoShortWait> noWait;
        noWait.emplace();
        RunResult result;
        fFake->fOnLaunch = [this] {
            fMayStart.Await();
            if (!fLateFailure.empty())
                throw std::runtime_error(fLateFailure);
        };
        boost::thread runner([&] {
            try {
                result = RunFake();
            } catch (const consoleapp::Exception& exc) {
                fFailure = exc.what();
            }
        });
        EXPECT_TRUE(Eventually([this] { return WasLogged("SetStateLocked state=Timeout"); }));
        noWait.reset();
        meanwhile();
        fMayStart.Open();
        runner.join();
        return result;
    }

    bool WasLogged(const std::string& text) const
    {
        const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
        return std::any_of(fLogger.lines.begin(), fLogger.lines.end(),
                           [&](const auto& line) { return line.find(text) != std::string::npos; });
    }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    const RecordingLogger fLogger;
    Gate fMayStart;
    std::string fLateFailure;
    std::string fFailure;
    const ThreadsEnd fThreadsEndFirst; // before the logger and the gate, which they use
};

TEST_F(SlowStart, LosesNoStop)
{
    fOptions.fStop = &fStop;
    const RunResult run = RunSlowly([this] { fStop.Raise(); });
    EXPECT_EQ(run.fEnd, State::kKilled);
    EXPECT_TRUE(run.fStopped);
    EXPECT_EQ(fFake->fKills, 1);
}

TEST_F(SlowStart, LosesNoTimeout)
{
    fOptions.fTimeoutSeconds = 0;
    const RunResult run = RunSlowly([] {});
    EXPECT_EQ(run.fEnd, State::kKilled);
    EXPECT_TRUE(run.fTimedOut);
    EXPECT_EQ(fFake->fKills, 1);
}

TEST_F(SlowStart, MayFailInTheEnd)
{
    fLateFailure = "no such program";
    RunSlowly([] {});
    EXPECT_EQ(fFailure, "Launcher: no such program");
    EXPECT_EQ(fFake->fKills, 0);
}

TEST_F(RunProgramTest, HandsLinesToAFunction)
{
    std::vector<std::string> lines;
    fOptions.fTakeOutput = ByLine([&](std::string_view line) { lines.emplace_back(line); });
    const RunResult run = RunChild({"out", "one", "err", "two", "out", "three"});
    EXPECT_THAT(lines, ElementsAre("one", "three"));
    EXPECT_EQ(run.fOutput, "");
    EXPECT_EQ(run.fErrors.substr(0, 3), "two");
}

TEST_F(RunProgramTest, KeepsNoMoreThanItMay)
{
    fOptions.fMaxKeptBytes = 1000;
    const RunResult run = RunChild({"flood", "1000000", "err", "words"});
    EXPECT_EQ(run.fOutput, std::string(1000, 'x'));
    EXPECT_EQ(run.fErrors.substr(0, 5), "words");
    EXPECT_EQ(run.fDroppedBytes, 999'000U);
}

struct Full {};

TEST_F(RunProgramTest, AnExceptionOfAFunctionKillsTheProgramAndComesThrough)
{
    for (TakeBytes RunOptions::*take : {&RunOptions::fTakeOutput, &RunOptions::fTakeErrors}) {
        fOptions = {};
        fOptions.*take = [](std::string_view block) {
            if (!block.empty())
                throw Full();
        };
        EXPECT_THROW(RunChild({"out", "x", "err", "x", "sleep", "600000"}), Full);
    }
}

TEST_F(RunProgramTest, AProgramWhoseOutputCannotBeReadIsKilled)
{
    fFake->fOnLaunch = [this] { fFake->fOutput[1]->fExcess = 1; }; // reads more than was asked for
    EXPECT_TRUE(ThrowsExactly<consoleapp::Exception>("stdout: read returned more than asked",
                                                     [this] { RunFake(); }));
    EXPECT_EQ(fFake->fKills, 1);
}

TEST_F(RunProgramTest, AProgramThatCannotBeStartedThrows)
{
    fFake->fLaunchFailure = "no such program";
    EXPECT_TRUE(
        ThrowsExactly<consoleapp::Exception>("Launcher: no such program", [this] { RunFake(); }));
    EXPECT_THROW(RunProgram("/nonexistent/program", {}), consoleapp::Exception);
}

TEST_F(RunProgramTest, AProgramThatCannotBeWaitedForThrows)
{
    fFake->fWaitFailure = "lost";
    fFake->fOnLaunch = [this] { fFake->fEnded = true; };
    EXPECT_TRUE(ThrowsExactly<consoleapp::Exception>("Launcher: lost", [this] { RunFake(); }));
}

TEST_F(RunProgramTest, AnInterruptionKillsTheProgram)
{
    Gate begun;
    bool interrupted = false;
    fFake->fOnLaunch = [&] { begun.Open(); };
    boost::thread runner([&] {
        try {
            RunFake();
        } catch (const boost::thread_interrupted&) {
            interrupted = true;
        }
    });
    begun.Await();
    runner.interrupt();
    runner.join();
    EXPECT_TRUE(interrupted);
    EXPECT_GE(fFake->fKills, 1);
}

TEST_F(RunProgramTest, RunsAtTheSameTimeKeepApart)
{
    boost::thread_group threads;
    for (int thread = 0; thread < 8; ++thread)
        threads.create_thread([thread] {
            const std::string name = std::to_string(thread);
            for (int round = 0; round < 10; ++round) {
                const RunResult run = RunProgram(kChild, {"out", name, "err", name, "exit", name});
                EXPECT_EQ(run.fEnd, State::kFinished);
                EXPECT_EQ(run.fExitCode, thread);
                EXPECT_EQ(run.fOutput.substr(0, 1), name);
                EXPECT_EQ(run.fErrors.substr(0, 1), name);
            }
        });
    threads.join_all();
}

TEST_F(RunProgramTest, AProgramThatCannotBeKilledIsLeftBehind)
{
    const DebugValueSetter noDefaultWait("ConsoleAppDefaultWaitSecondsMinus10", -10);
    const ThreadsEnd threadsEnd;
    std::optional<NoShortWait> noWait;
    fFake->fMortal = false;
    fFake->fOnKill = [&] {
        if (!noWait)
            noWait.emplace();
    };
    fOptions.fTimeoutSeconds = 0;
    const RunResult run = RunFake();
    EXPECT_EQ(run.fEnd, State::kTimeout);
    EXPECT_TRUE(run.fTimedOut);
    EXPECT_EQ(run.fExitCode, 0);
    fFake->End(kEndedNormally);
}

// An output that somebody else holds open when it has brought what the child wrote.
class HeldChannel : public FakeChannel {
public:
    explicit HeldChannel(boost::shared_ptr<Gate> gate) : fGate(std::move(gate))
    {
        fPieces = {"begun"};
    }
    ~HeldChannel() override = default;

protected:
    std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes) override
    {
        if (fPieces.empty())
            fGate->Await();
        return FakeChannel::BinioReadSome(bytes, nbytes);
    }

private:
    const boost::shared_ptr<Gate> fGate;
};

// Its child ends when its output was taken, which goes on. From then on no short wait lasts.
class HeldLauncher : public FakeLauncher {
public:
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        LaunchResult result = FakeLauncher::Launch(program, args);
        for (int channel = 1; channel < kOutputSlots; ++channel)
            result.fAppOutput[channel] = boost::make_shared<HeldChannel>(fOutputEnd);
        return result;
    }

    WaitResult Wait(int* exitCode) override
    {
        fTaken.Await();
        fNoShortWait.emplace();
        End(kEndedNormally, 7);
        return FakeLauncher::Wait(exitCode);
    }

    Gate fTaken;
    const boost::shared_ptr<Gate> fOutputEnd = boost::make_shared<Gate>();

private:
    std::optional<NoShortWait> fNoShortWait;
};

TEST_F(RunProgramTest, TheCodeOutlivesAnOutputThatIsHeldOpen)
{
    HeldLauncher held;
    std::optional<ThreadsEnd> threadsEnd;
    threadsEnd.emplace();
    std::atomic<int> calls{0};
    std::string output;
    fOptions.fLauncher.reset(&held, [](Launcher*) {});
    fOptions.fTakeOutput = [&](std::string_view block) {
        output += block;
        if (++calls == 2)
            held.fTaken.Open();
    };
    fOptions.fTakeErrors = [&](std::string_view) {
        if (++calls == 2)
            held.fTaken.Open();
    };
    const RunResult run = RunProgram("program", {}, fOptions);
    EXPECT_EQ(run.fEnd, State::kFinished);
    EXPECT_EQ(run.fExitCode, 7);
    EXPECT_TRUE(run.fIsOutputOpen);
    EXPECT_EQ(output, "begun");
    held.fOutputEnd->Open();
    threadsEnd.reset();
    EXPECT_EQ(calls, 2) << "no call comes after the return";
}

} // namespace
