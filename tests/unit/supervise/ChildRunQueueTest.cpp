// The end of a run whose child's output goes on: what still waits in the queue is taken, and who
// brings more is kept no longer.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <chrono>
#include <deque>
#include <functional>
#include <optional>
#include <stdexcept>
#include <utility>
#include <vector>

#include "pmutil/PMLogging.h"
#include "pmutil/Reader.h"
#include "supervise/ChildRun.h"
#include "supervise/Containment.h"
#include "support/Waits.h"

namespace assay_host {
namespace {

// A stream that brings what the test feeds, and waits for it.
class FedReader : public pmutil::Reader {
public:
    ~FedReader() override = default;

    void Feed(std::string piece)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fPieces.push_back(std::move(piece));
        fCond.notify_all();
    }

    void End()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fEnded = true;
        fCond.notify_all();
    }

    int CountAsked()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fAsked;
    }

    // False if it isn't asked so many times for long.
    bool AwaitAsked(int times)
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        return fCond.timed_wait(lock, kLong, [&] { return fAsked >= times; });
    }

    bool AwaitClosed()
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        return fCond.timed_wait(lock, kLong, [this] { return !fOpen; });
    }

protected:
    void BinioClose() override
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fOpen = false;
        fCond.notify_all();
    }
    bool BinioIsOpen() const override
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fOpen;
    }
    std::uint64_t BinioReadSome(void* bytes, std::uint64_t /*nbytes*/) override
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        ++fAsked;
        fCond.notify_all();
        fCond.wait(lock, [this] { return fEnded || !fPieces.empty(); });
        if (fPieces.empty())
            return 0;
        const std::string piece = fPieces.front();
        fPieces.pop_front();
        piece.copy(static_cast<char*>(bytes), piece.size());
        return piece.size();
    }

private:
    const boost::posix_time::seconds kLong{static_cast<long>(pmutil::kLong)};

    mutable boost::mutex fMutex;
    boost::condition_variable fCond;
    std::deque<std::string> fPieces;
    bool fOpen = true;
    bool fEnded = false;
    int fAsked = 0;
};

// Its child lives until the test ends it, and a kill is only counted.
class FedLauncher : public pmutil::Launcher {
public:
    pmutil::LaunchResult Launch(const std::wstring& /*program*/,
                                const std::deque<std::string>& /*args*/) override
    {
        pmutil::LaunchResult result;
        result.fAppOutput[1] = fOut;
        result.fAppOutput[2] = fErr;
        return result;
    }
    pmutil::WaitResult Wait(int* exitCode) override
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        fCond.wait(lock, [this] { return fEnded; });
        *exitCode = 0;
        return pmutil::kEndedNormally;
    }
    void Kill() override
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        ++fKills;
    }
    void End()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fEnded = true;
        fCond.notify_all();
    }
    int CountKills()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fKills;
    }

    const boost::shared_ptr<FedReader> fOut = boost::make_shared<FedReader>();
    const boost::shared_ptr<FedReader> fErr = boost::make_shared<FedReader>();

private:
    boost::mutex fMutex;
    boost::condition_variable fCond;
    bool fEnded = false;
    int fKills = 0;
};

// There are no descendants. Counts how often they are ended.
class CountedContainment : public Containment {
public:
    explicit CountedContainment(boost::shared_ptr<pmutil::Launcher> launcher)
        : fLauncher(std::move(launcher))
    {}

    boost::shared_ptr<pmutil::Launcher> GetLauncher() override { return fLauncher; }
    bool EndAll(double /*seconds*/) override
    {
        ++fEnds;
        return fLeavesNone;
    }

    int fEnds = 0;
    bool fLeavesNone = true;

private:
    const boost::shared_ptr<pmutil::Launcher> fLauncher;
};

// Lets a launch fail after the child's start: the thread of standard error's task begins only once
// the failure, that it never started, is thrown.
class LateErrorTask : public pmutil::PMLogger {
public:
    LateErrorTask() : PMLogger("late error task") {}

    void Write(const char* data, std::size_t size) override { fLine.append(data, size); }

    void Flush() override
    {
        const std::string line = std::exchange(fLine, {});
        const auto has = [&](const char* text) { return line.find(text) != std::string::npos; };
        if (has("LaunchOutputThreadTask::operator()() fOutputChannel=stderr"))
            AwaitFailure();
        else if (has("OutputThreadTask spawned, use_count[stderr]"))
            fNoWait.emplace();
        else if (has("ThrowIfFailurePendingLocked throwing"))
            NoteFailure();
    }

private:
    // Others log meanwhile.
    void AwaitFailure()
    {
        constexpr int kLocks = 2; // of a statement and of its logger
        for (int lock = 0; lock < kLocks; ++lock)
            pmutil::GetLogMutex().unlock();
        {
            boost::unique_lock<boost::mutex> lock(fMutex);
            fCond.wait(lock, [this] { return fHasFailed; });
        }
        for (int lock = 0; lock < kLocks; ++lock)
            pmutil::GetLogMutex().lock();
    }

    void NoteFailure()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fHasFailed = true;
        fCond.notify_all();
    }

    std::string fLine;
    std::optional<pmutil::NoShortWait> fNoWait;
    boost::mutex fMutex;
    boost::condition_variable fCond;
    bool fHasFailed = false;
};

class ChildRunQueue : public testing::Test, public RunObserver {
protected:
    ChildRunQueue()
    {
        fOptions.fProgram = "fed";
        fOptions.fTimeoutSeconds = 30;
        fTimes.fNow = [this] { return fNow; };
        fTimes.fKillGrace = RunTimes::Seconds(0);
    }

    // The threads of the run must not outlive the test.
    ~ChildRunQueue() override
    {
        fLauncher->End();
        for (const auto& reader : {fLauncher->fOut, fLauncher->fErr}) {
            reader->End();
            EXPECT_TRUE(reader->AwaitClosed());
        }
    }

    void OnLine(const ReportLine& line, double /*seconds*/) override
    {
        fLines.push_back(line.fText);
        if (fOnLine)
            fOnLine();
    }

    // The start takes what it takes; what is given up later isn't waited for.
    RunOutcome Run()
    {
        fShortWait.emplace(static_cast<int>(pmutil::kLong));
        const RunOutcome outcome = RunChild(fOptions, *this, fStop, fContainment, fTimes);
        fShortWait.reset();
        return outcome;
    }

    void OnStart() override
    {
        fShortWait.emplace(0);
        if (fOnStart)
            fOnStart();
    }

    void OnTick(double /*seconds*/) override { fHasTicked = true; }

    void PassTheTimeout() { fNow += std::chrono::seconds(30); }

    // Whether the child's output is still taken from it, more of it than the queue holds.
    bool GoesOnReading()
    {
        constexpr int kPieces = 8;
        const int asked = fLauncher->fOut->CountAsked();
        for (int piece = 0; piece < kPieces; ++piece)
            fLauncher->fOut->Feed(std::string(std::size_t{1} << 16, 'x'));
        return fLauncher->fOut->AwaitAsked(asked + kPieces);
    }

    const boost::shared_ptr<FedLauncher> fLauncher = boost::make_shared<FedLauncher>();
    CountedContainment fContainment{fLauncher};
    int fEndsBefore = -1; // of the descendants, when something was fed
    ChildOptions fOptions;
    pmutil::StopRequest fStop;
    RunTimes fTimes;
    RunTimes::Clock::time_point fNow{std::chrono::seconds(1)};
    std::function<void()> fOnStart;
    std::function<void()> fOnLine;
    bool fHasTicked = false;
    std::optional<pmutil::ShortWait> fShortWait;
    std::vector<std::string> fLines;
};

TEST_F(ChildRunQueue, WhatItHoldsAtTheEndIsTaken)
{
    fLauncher->fOut->Feed("first=1\n");
    fLauncher->fOut->Feed("second=2\n");
    fOnLine = [this] {
        EXPECT_TRUE(fLauncher->fOut->AwaitAsked(3)) << "the second line is in the queue";
        PassTheTimeout();
    };
    EXPECT_EQ(Run().fVerdict, Verdict::kHung);
    EXPECT_EQ(fLines, (std::vector<std::string>{"first=1", "second=2"}));
    EXPECT_EQ(fLauncher->CountKills(), 1);
}

// Ticks that are rarer than all that happens: only the child's end lets the first one come.
TEST_F(ChildRunQueue, WhatComesAfterTheChildsEndIsTaken)
{
    constexpr std::chrono::hours kTick{1};
    fOptions.fTimeoutSeconds = 0;
    fTimes.fTick = kTick;
    fTimes.fStreamGrace = 1000 * kTick;
    bool hasFed = false;
    fTimes.fNow = [&] {
        if (fHasTicked && !hasFed) {
            hasFed = true;
            fEndsBefore = fContainment.fEnds;
            fLauncher->fOut->Feed("late=1\n");
            fLauncher->fOut->End();
            fLauncher->fErr->End();
        }
        return fNow += 2 * kTick;
    };
    fOnStart = [this] { fLauncher->End(); };
    EXPECT_FALSE(Run().fLeftBehind);
    EXPECT_EQ(fLines, std::vector<std::string>{"late=1"});
    EXPECT_EQ(fEndsBefore, 0) << "the descendants are ended before the streams";
}

// An interrupt of the terminal reaches the child too, which may end before it is noticed.
TEST_F(ChildRunQueue, AnInterruptThatReachedTheChildFirstIsOne)
{
    fOptions.fTimeoutSeconds = 0;
    fTimes.fTick = std::chrono::hours(1);
    fTimes.fStreamGrace = std::chrono::hours(1000);
    fTimes.fNow = [this] {
        if (fHasTicked) {
            fStop.Raise();
            fLauncher->fOut->End();
            fLauncher->fErr->End();
        }
        return fNow += std::chrono::hours(2);
    };
    fOnStart = [this] { fLauncher->End(); };
    EXPECT_EQ(Run().fVerdict, Verdict::kInterrupted);
}

TEST_F(ChildRunQueue, TicksOnceATickHasPassed)
{
    constexpr std::chrono::hours kTick{1};
    fOptions.fTimeoutSeconds = 0;
    fTimes.fTick = kTick;
    for (const char* const line : {"first=1\n", "second=2\n", "third=3\n"})
        fLauncher->fOut->Feed(line);
    fOnLine = [&] {
        if (fLines.size() == 1) {
            fNow += kTick - std::chrono::nanoseconds(1);
        } else if (fLines.size() == 2) {
            EXPECT_FALSE(fHasTicked);
            fNow += std::chrono::nanoseconds(1);
        } else {
            EXPECT_TRUE(fHasTicked);
            fStop.Raise();
        }
    };
    EXPECT_EQ(Run().fVerdict, Verdict::kInterrupted);
    EXPECT_EQ(fLines.size(), 3U);
}

TEST_F(ChildRunQueue, EndsTheDescendantsOnceAndSaysWhatIsLeft)
{
    fContainment.fLeavesNone = false;
    fOnStart = [this] {
        fLauncher->fOut->End();
        fLauncher->fErr->End();
        fLauncher->End();
    };
    fTimes.fStreamGrace = fTimes.fLastStreamGrace = RunTimes::Seconds(pmutil::kLong);
    EXPECT_TRUE(Run().fLeftBehind);
    EXPECT_EQ(fContainment.fEnds, 1);
}

// The stream that ended did so before the child.
TEST_F(ChildRunQueue, OneStreamThatGoesOnIsLeftBehind)
{
    fTimes.fStreamGrace = fTimes.fLastStreamGrace = RunTimes::Seconds(0);
    fLauncher->fOut->Feed("first=1\n");
    fOnLine = [this] {
        fLauncher->fOut->End();
        EXPECT_TRUE(fLauncher->fOut->AwaitClosed());
        fLauncher->End();
    };
    EXPECT_TRUE(Run().fLeftBehind);
}

TEST_F(ChildRunQueue, ARunThatIsOverKeepsNobodyWaiting)
{
    fLauncher->fOut->Feed("first=1\n");
    fOnLine = [this] { PassTheTimeout(); };
    EXPECT_TRUE(Run().fLeftBehind);
    EXPECT_TRUE(GoesOnReading());
}

TEST_F(ChildRunQueue, AnExceptionOfTheObserverEndsTheChildAndKeepsNobodyWaiting)
{
    fLauncher->fOut->Feed("first=1\n");
    fOnLine = [] { throw std::runtime_error("no room"); };
    try {
        Run();
        ADD_FAILURE() << "the exception is lost";
    } catch (const std::runtime_error& exc) {
        EXPECT_STREQ(exc.what(), "no room");
    }
    EXPECT_EQ(fLauncher->CountKills(), 1);
    EXPECT_TRUE(GoesOnReading());
}

TEST_F(ChildRunQueue, AnExceptionAfterTheChildKeepsNobodyWaiting)
{
    fLauncher->fOut->Feed("first=1\n");
    fLauncher->fOut->Feed("second=2\n");
    fOnLine = [this] {
        if (fLines.size() == 2)
            throw std::runtime_error("no room");
        EXPECT_TRUE(fLauncher->fOut->AwaitAsked(3)) << "the second line is in the queue";
        PassTheTimeout();
    };
    EXPECT_THROW(Run(), std::runtime_error);
    EXPECT_EQ(fLines.size(), 2U);
    EXPECT_TRUE(GoesOnReading());
}

TEST_F(ChildRunQueue, ALaunchThatFailsLateKeepsNobodyWaiting)
{
    new LateErrorTask; // never deleted: threads of the launch may still log
    const pmutil::DebugValueSetter log("ConsoleAppLog", 1);
    fOptions.fProgram = testing::internal::GetArgvs().front(); // any file that exists
    const RunOutcome outcome = Run();
    EXPECT_EQ(outcome.fVerdict, Verdict::kNeverStarted);
    EXPECT_THAT(outcome.fReason, testing::HasSubstr("output task stderr never started"));
    EXPECT_GE(fLauncher->CountKills(), 1);
    EXPECT_TRUE(GoesOnReading());
}

} // namespace
} // namespace assay_host
