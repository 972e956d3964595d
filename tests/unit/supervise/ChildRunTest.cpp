#include "supervise/ChildRun.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <chrono>
#include <functional>
#include <optional>
#include <stdexcept>
#include <thread>
#include <utility>

#include "LongTimes.h"
#include "TestChild.h"
#include "pmutil/ConsoleApp.h"
#include "pmutil/PMLogging.h"
#include "pmutil/Reader.h"
#include "supervise/ChildLauncher.h"
#include "support/Waits.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

constexpr double kTimeout = 30;
constexpr int kLongShortWait = 600;

// Moves only by Advance, and by `step` seconds at each reading. For one thread.
class TestClock {
public:
    explicit TestClock(double step = 0) : fStep(step) {}

    void Advance(double seconds) { fSeconds += seconds; }

    RunTimes::Clock::time_point Read()
    {
        fSeconds += fStep;
        return RunTimes::Clock::time_point(
            std::chrono::duration_cast<RunTimes::Clock::duration>(RunTimes::Seconds(fSeconds)));
    }

private:
    const double fStep;
    double fSeconds = 1;
};

// Keeps what it is told.
class Recorder : public RunObserver {
public:
    void OnStart() override
    {
        ++fStarts;
        if (fOnStart)
            fOnStart();
    }
    void OnLine(const ReportLine& line, double /*seconds*/) override
    {
        fLines.push_back(line.fText);
        std::this_thread::sleep_for(fDelay);
        if (fClock != nullptr)
            std::exchange(fClock, nullptr)->Advance(kTimeout);
        if (fOnLine)
            fOnLine();
    }
    void OnErrorLine(const std::string& line, double /*seconds*/) override
    {
        fErrorLines.push_back(line);
        if (fOnErrorLine)
            fOnErrorLine();
    }
    void OnTick(double /*seconds*/) override
    {
        if (++fTicks == fStopAtTick)
            fStop->Raise();
        if (fOnTick)
            fOnTick();
    }

    std::shared_ptr<pmutil::StopRequest> fStop = std::make_shared<pmutil::StopRequest>();
    int fStarts = 0;
    int fTicks = 0;
    int fStopAtTick = 0;
    std::function<void()> fOnStart;
    std::function<void()> fOnLine;
    std::function<void()> fOnErrorLine;
    std::function<void()> fOnTick;
    TestClock* fClock = nullptr; // passes the timeout with the first line
    std::chrono::milliseconds fDelay{0};
    std::vector<std::string> fLines;
    std::vector<std::string> fErrorLines;
};

struct Watched {
    RunOutcome fOutcome;
    Recorder fRecorder;
};

void RunWith(Watched& run, const std::string& program, std::vector<std::string> args,
             double timeout, const RunTimes& times)
{
    ChildOptions options;
    options.fProgram = program;
    options.fArgs = std::move(args);
    options.fTimeoutSeconds = timeout;
    const pmutil::LongShortWait shortWait;
    run.fOutcome =
        RunChild(options, run.fRecorder, *run.fRecorder.fStop, MakeChildLauncher(), times);
}

Watched RunTestChild(std::vector<std::string> args, const std::string& program = TEST_CHILD)
{
    Watched run;
    RunWith(run, program, std::move(args), 0, GetLongTimes());
    return run;
}

// The child's time is up once it has written its first line.
Watched RunUntilFirstLine(std::vector<std::string> args)
{
    Watched run;
    TestClock clock;
    run.fRecorder.fClock = &clock;
    RunTimes times = GetLongTimes();
    times.fStreamGrace = RunTimes::Seconds(0); // as the clock stands still then
    times.fNow = [&clock] { return clock.Read(); };
    RunWith(run, TEST_CHILD, std::move(args), kTimeout, times);
    return run;
}

const std::vector<std::string> kWhole = {"out", "assayStart=\"x\"", "out", "assayEnd=\"y\""};

std::vector<std::string> operator+(std::vector<std::string> left,
                                   const std::vector<std::string>& right)
{
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

TEST(ChildRun, BringsTheLinesOfAWholeReport)
{
    const Watched run = RunTestChild(kWhole + std::vector<std::string>{"err", "words"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kComplete) << run.fOutcome.fReason;
    EXPECT_EQ(run.fOutcome.fExitStatus, 0);
    EXPECT_THAT(run.fRecorder.fLines, ElementsAre("assayStart=\"x\"", "assayEnd=\"y\""));
    EXPECT_THAT(run.fRecorder.fErrorLines, ElementsAre("words"));
    EXPECT_THAT(run.fOutcome.fErrorLines, ElementsAre("words"));
    EXPECT_EQ(run.fOutcome.fCommand.front(), TEST_CHILD);
    EXPECT_EQ(run.fOutcome.fCommand.size(), 7U);
    EXPECT_EQ(run.fOutcome.fLastReportLine, "assayEnd=\"y\"");
    EXPECT_EQ(run.fOutcome.fTimeoutSeconds, 0);
    EXPECT_EQ(run.fRecorder.fStarts, 1);
    EXPECT_FALSE(run.fOutcome.fLeftBehind);
    EXPECT_EQ(run.fOutcome.fLostOutputBytes, 0U);
    EXPECT_GT(run.fOutcome.fSeconds, 0);
}

TEST(ChildRun, BringsALastErrorLineThatLacksItsEnd)
{
    const Watched run =
        RunTestChild(kWhole + std::vector<std::string>{"err", "first", "part", "last words"});
    EXPECT_THAT(run.fRecorder.fErrorLines, ElementsAre("first", "last words"));
    EXPECT_THAT(run.fOutcome.fErrorLines, ElementsAre("first", "last words"));
}

TEST(ChildRun, GivesTheChildTheEndOfItsInput)
{
    EXPECT_EQ(RunTestChild(std::vector<std::string>{"echo"} + kWhole).fOutcome.fVerdict,
              Verdict::kComplete);
}

TEST(ChildRun, TellsAChildThatEndsTooEarly)
{
    const Watched run = RunTestChild({"out", "assayStart=\"x\"", "exit", "7"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kFailedTests);
    EXPECT_EQ(run.fOutcome.fExitStatus, 7);
    EXPECT_THAT(run.fOutcome.fReason, HasSubstr("status 7"));
}

TEST(ChildRun, TellsACrashAndWhereItCame)
{
    const Watched run =
        RunTestChild({"out", "QGFOGLInitialized=1", "out", "# a log line", "abort"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kCrashed);
    EXPECT_EQ(run.fOutcome.fExitStatus, std::nullopt);
    EXPECT_THAT(run.fOutcome.fTermination,
                testing::AnyOf(StartsWith("signal "), StartsWith("code 0x")));
    EXPECT_EQ(run.fOutcome.fLastReportLine, "QGFOGLInitialized=1");
    EXPECT_EQ(run.fOutcome.fLastLogLine, "# a log line");
    EXPECT_THAT(run.fOutcome.fReason, HasSubstr("(OGLContextCreated)"));
}

TEST(ChildRun, KillsAChildThatHangs)
{
    const Watched run = RunUntilFirstLine({"out", "Tester=x", "sleep", "600000"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kHung);
    EXPECT_THAT(run.fOutcome.fReason, HasSubstr("30 s"));
    EXPECT_EQ(run.fOutcome.fTimeoutSeconds, kTimeout);
    EXPECT_EQ(run.fOutcome.fSeconds, kTimeout);
    EXPECT_THAT(run.fRecorder.fLines, ElementsAre("Tester=x"));
    EXPECT_FALSE(run.fOutcome.fLeftBehind);
    EXPECT_EQ(run.fRecorder.fTicks, 1);
}

TEST(ChildRun, StopsWhenItIsToldTo)
{
    Watched run;
    run.fRecorder.fStopAtTick = 3;
    RunWith(run, TEST_CHILD, {"sleep", "600000"}, 0, GetLongTimes());
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kInterrupted);
    EXPECT_GE(run.fRecorder.fTicks, 3);
    EXPECT_FALSE(run.fOutcome.fLeftBehind);
}

TEST(ChildRun, StartsNothingOnceItIsToldToStop)
{
    Recorder recorder;
    recorder.fStop->Raise();
    ChildOptions options;
    options.fProgram = TEST_CHILD;
    options.fArgs = kWhole;
    const RunOutcome outcome = RunChild(options, recorder, *recorder.fStop);
    EXPECT_EQ(outcome.fVerdict, Verdict::kInterrupted);
    EXPECT_EQ(recorder.fStarts, 0);
    EXPECT_THAT(recorder.fLines, IsEmpty());
}

TEST(ChildRun, FollowsAChildThatClosedItsStreams)
{
    const Watched run =
        RunTestChild(kWhole + std::vector<std::string>{"close", "sleep", "300", "exit", "7"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kFailedTests);
    EXPECT_EQ(run.fOutcome.fExitStatus, 7);
}

TEST(ChildRun, EndsAGrandchildThatHoldsTheStreams)
{
    const Watched run = RunTestChild(kWhole + std::vector<std::string>{"spawn", "600000"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kComplete);
    EXPECT_FALSE(run.fOutcome.fLeftBehind);
}

TEST(ChildRun, EndsAHangingChildTogetherWithItsGrandchild)
{
    const Watched run =
        RunUntilFirstLine({"spawn", "600000", "out", "Tester=x", "sleep", "600000"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kHung);
    EXPECT_FALSE(run.fOutcome.fLeftBehind);
}

TEST(ChildRun, CutsAFloodAndSaysSo)
{
    constexpr std::uint64_t kFlood = std::uint64_t{1} << 30;
    const Watched run =
        RunTestChild(kWhole + std::vector<std::string>{"flood", std::to_string(kFlood)});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kComplete) << run.fOutcome.fReason;
    EXPECT_GT(run.fOutcome.fLostOutputBytes, kFlood - (std::uint64_t{16} << 20));
    EXPECT_LE(run.fOutcome.fLostOutputBytes, kFlood);
    EXPECT_EQ(run.fRecorder.fLines.size(), 3U);
}

TEST(ChildRun, KillsAnEndlessFlood)
{
    const Watched run = RunUntilFirstLine({"out", "Tester=x", "flood", "9000000000000000000"});
    EXPECT_EQ(run.fOutcome.fVerdict, Verdict::kHung);
}

TEST(ChildRun, LosesNothingToASlowObserver)
{
    Watched run;
    run.fRecorder.fDelay = std::chrono::milliseconds(100);
    std::vector<std::string> args;
    for (int line = 0; line < 10; ++line) {
        args.emplace_back("out");
        args.push_back("line" + std::to_string(line) + "=1");
    }
    RunWith(run, TEST_CHILD, args, 0, GetLongTimes());
    EXPECT_EQ(run.fRecorder.fLines.size(), 10U);
}

TEST(ChildRun, TellsWhatNeverStarted)
{
    const Watched missing = RunTestChild({}, "no/such/program");
    EXPECT_EQ(missing.fOutcome.fVerdict, Verdict::kNeverStarted);
    EXPECT_THAT(missing.fOutcome.fReason, HasSubstr("there is no file no/such/program"));
    EXPECT_EQ(missing.fRecorder.fStarts, 0);
    const Watched directory = RunTestChild({}, ".");
    EXPECT_EQ(directory.fOutcome.fVerdict, Verdict::kNeverStarted);
    EXPECT_THAT(directory.fOutcome.fReason, HasSubstr(". is a directory"));
    const Watched foreign = RunTestChild({}, __FILE__);
    EXPECT_EQ(foreign.fOutcome.fVerdict, Verdict::kNeverStarted);
    EXPECT_EQ(RunTestChild({}, "").fOutcome.fVerdict, Verdict::kNeverStarted);
}

TEST(ChildRun, WorksAgainAndAgain)
{
    for (int round = 0; round < 20; ++round)
        EXPECT_EQ(RunTestChild(kWhole).fOutcome.fVerdict, Verdict::kComplete);
}

// Something that happens once, and that any thread may wait for.
class Moment {
public:
    void Come()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fCame = true;
        fCond.notify_all();
    }
    void Await()
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        fCond.wait(lock, [this] { return fCame; });
    }

private:
    boost::mutex fMutex;
    boost::condition_variable fCond;
    bool fCame = false;
};

struct Moments {
    Moment fWords; // the child says something on each stream
    Moment fChildEnds;
    Moment fStreamsEnd;
};

// Its child does nothing but at those moments.
class ScriptedLauncher : public pmutil::Launcher {
public:
    explicit ScriptedLauncher(boost::shared_ptr<Moments> moments) : fMoments(std::move(moments)) {}

    pmutil::LaunchResult Launch(const std::wstring& /*program*/,
                                const std::deque<std::string>& /*args*/) override
    {
        pmutil::LaunchResult result;
        result.fAppOutput[1] = boost::make_shared<Stream>(fMoments);
        result.fAppOutput[2] = boost::make_shared<Stream>(fMoments);
        return result;
    }
    pmutil::WaitResult Wait(int* exitCode) override
    {
        fMoments->fChildEnds.Await();
        if (fKilled)
            return pmutil::kEndedByKill;
        *exitCode = 0;
        return pmutil::kEndedNormally;
    }
    void Kill() override
    {
        if (!fOnKill)
            throw std::runtime_error("no");
        fKilled = true;
        fOnKill();
    }

    std::function<void()> fOnKill; // or it can't be killed

private:
    class Stream : public pmutil::Reader {
    public:
        explicit Stream(boost::shared_ptr<Moments> moments) : fMoments(std::move(moments)) {}
        ~Stream() override = default;

    protected:
        void BinioClose() override { fOpen = false; }
        bool BinioIsOpen() const override { return fOpen; }
        std::uint64_t BinioReadSome(void* bytes, std::uint64_t /*nbytes*/) override
        {
            if (std::exchange(fSilent, false)) {
                fMoments->fWords.Await();
                static_cast<char*>(bytes)[0] = '\n';
                return 1;
            }
            fMoments->fStreamsEnd.Await();
            return 0;
        }

    private:
        const boost::shared_ptr<Moments> fMoments;
        bool fSilent = true;
        bool fOpen = true;
    };

    const boost::shared_ptr<Moments> fMoments;
    std::atomic<bool> fKilled{false};
};

class ScriptedChild : public testing::Test {
protected:
    // What is given up ends with the test.
    ~ScriptedChild() override { ComeAll(); }

    void ComeAll()
    {
        fMoments->fWords.Come();
        fMoments->fChildEnds.Come();
        fMoments->fStreamsEnd.Come();
    }

    // The clock goes on by `step` seconds at each reading.
    RunOutcome Run(double step, RunTimes times = {})
    {
        TestClock clock(step);
        times.fNow = [&clock] { return clock.Read(); };
        std::optional<pmutil::ShortWait> shortWait{std::in_place, kLongShortWait};
        // The start takes what it takes; what is given up later isn't waited for.
        fRecorder.fOnStart = [&] { shortWait.emplace(0); };
        ChildOptions options;
        options.fProgram = "scripted";
        options.fTimeoutSeconds = 1;
        return RunChild(options, fRecorder, *fRecorder.fStop, fLauncher, times);
    }

    const boost::shared_ptr<Moments> fMoments = boost::make_shared<Moments>();
    const boost::shared_ptr<ScriptedLauncher> fLauncher =
        boost::make_shared<ScriptedLauncher>(fMoments);
    Recorder fRecorder;
};

constexpr double kSmallStep = 0.05; // less than each of the times that pass
constexpr double kLeap = 10'000;    // more than any

TEST_F(ScriptedChild, IsGivenUpIfItOutlivesItsKill)
{
    const RunOutcome outcome = Run(kSmallStep);
    EXPECT_EQ(outcome.fVerdict, Verdict::kHung);
    EXPECT_THAT(outcome.fReason, HasSubstr("could not be killed"));
    EXPECT_TRUE(outcome.fLeftBehind);
    EXPECT_GE(outcome.fSeconds, 1 + RunTimes().fKillGrace.count());
}

TEST_F(ScriptedChild, IsGivenUpIfItsStreamsDoNotEnd)
{
    fMoments->fChildEnds.Come();
    const RunOutcome outcome = Run(kSmallStep);
    EXPECT_EQ(outcome.fVerdict, Verdict::kFailedTests);
    EXPECT_TRUE(outcome.fLeftBehind);
}

class GivenUpChild : public ScriptedChild {
protected:
    // Runs until the child is given up after its kill. Returns the number of pauses from the kill
    // on, each of which a real clock ends after fTick, or after a part of fStreamGrace.
    int CountPauses(std::function<void()> onKill)
    {
        bool killed = false;
        fLauncher->fOnKill = [&] {
            killed = true;
            onKill();
        };
        int pauses = 0;
        fRecorder.fOnTick = [&] { pauses += killed ? 1 : 0; };
        const RunOutcome outcome = Run(RunTimes::Seconds(fTimes.fTick).count());
        EXPECT_EQ(outcome.fVerdict, Verdict::kHung);
        EXPECT_TRUE(outcome.fLeftBehind);
        return pauses;
    }

    const RunTimes fTimes;
    const double fShortWait = pmutil::ConsoleApp::GetShortWaitSeconds(); // to give up its threads
};

constexpr double kMaxSecondsAfterTimeout = 2;

TEST_F(GivenUpChild, IsJudgedWithinTwoSecondsIfItOutlivesItsKill)
{
    const int pauses = CountPauses([] {});
    EXPECT_GE(pauses * fTimes.fTick, fTimes.fKillGrace);
    EXPECT_LE((pauses * RunTimes::Seconds(fTimes.fTick)).count() + fTimes.fTreeSeconds + fShortWait,
              kMaxSecondsAfterTimeout);
}

TEST_F(GivenUpChild, IsJudgedWithinTwoSecondsIfItsStreamsDoNotEnd)
{
    const int pauses = CountPauses([this] { fMoments->fChildEnds.Come(); });
    EXPECT_LE((pauses * fTimes.fStreamGrace / 4).count() + fTimes.fTreeSeconds +
                  fTimes.fJoinSeconds + fShortWait,
              kMaxSecondsAfterTimeout);
}

// Comes when the launcher's thread gives a stream up.
class StreamGivenUp : public pmutil::PMLogger {
public:
    StreamGivenUp() : PMLogger("stream given up") {}

    void Write(const char* data, std::size_t size) override { fLine.append(data, size); }
    void Flush() override
    {
        if (fLine.find("exc=Launcher: output task thread abandoned") != std::string::npos)
            fMoment.Come();
        fLine.clear();
    }

    Moment fMoment;

private:
    const pmutil::DebugValueSetter fLog{"ConsoleAppLog", 1};
    std::string fLine;
};

// The supervision sees the failure before it takes the child's end from its queue.
TEST_F(ScriptedChild, HasStartedThoughAStreamIsGivenUp)
{
    StreamGivenUp givenUp;
    fRecorder.fOnTick = [&] {
        fMoments->fChildEnds.Come();
        givenUp.fMoment.Await();
    };
    EXPECT_EQ(Run(kSmallStep).fVerdict, Verdict::kFailedTests);
}

// As when the system stops this process just then.
TEST_F(ScriptedChild, HasItsGraceThoughTheClockLeapsAfterItsKill)
{
    bool killed = false;
    fLauncher->fOnKill = [&] { killed = true; };
    fRecorder.fOnTick = [&] {
        if (killed)
            ComeAll();
    };
    RunTimes times = GetLongTimes();
    times.fStreamGrace = times.fKillGrace;
    const RunOutcome outcome = Run(kLeap, times);
    EXPECT_EQ(outcome.fVerdict, Verdict::kHung);
    EXPECT_FALSE(outcome.fLeftBehind) << outcome.fReason;
}

TEST_F(ScriptedChild, HasItsStreamsReadThoughTheClockLeapsAfterItsEnd)
{
    fMoments->fChildEnds.Come();
    int words = 0;
    const auto count = [&] {
        if (++words == 2)
            fMoments->fStreamsEnd.Come();
    };
    fRecorder.fOnLine = count;
    fRecorder.fOnErrorLine = count;
    fRecorder.fOnTick = [this] { fMoments->fWords.Come(); };
    RunTimes times = GetLongTimes();
    times.fStreamGrace = times.fKillGrace;
    const RunOutcome outcome = Run(kLeap, times);
    EXPECT_EQ(words, 2);
    EXPECT_FALSE(outcome.fLeftBehind);
}

} // namespace
} // namespace assay_host
