// Many launches of real children, and a check for leaks.
#include <atomic>
#include <boost/thread/barrier.hpp>
#include <chrono>
#include <cstdlib>
#include <gtest/gtest.h>
#include <thread>

#include "CollectingTask.h"
#include "support/OpenThings.h"
#include "support/Waits.h"

using namespace pmutil;

namespace {

class LaunchStorm : public testing::Test {
protected:
    LaunchStorm()
    {
        // Objects that the first one leaves open are reused by all others.
        RealLaunch first({"exit", "0"});
        first.launcher.LaunchAndWait(nullptr, kLong);
        fOpen = CountOpenThings();
        fThreads = CountThreads();
    }

    ~LaunchStorm() override
    {
        fLaunch.reset();
        EXPECT_LE(CountOpenThings(), fOpen + fLaunches * kKeptPerLaunch + GetMaxGrowth(fLaunches));
        // The system may still list a thread that was joined.
        EXPECT_TRUE(Eventually([&] { return CountThreads() <= fThreads; })) << CountThreads();
        EXPECT_EQ(ManagedThread::GetRegisteredThreadCount(), fRegistered);
        EXPECT_FALSE(HasChildren()) << "a child is left, alive or as a zombie";
    }

    void Launch(std::deque<std::string> args)
    {
        fLaunch->SetArgs(std::move(args));
        fLaunch->launcher.Launch();
        ++fLaunches;
    }

    void LaunchInARow(int count)
    {
        for (int round = 0; round < count; ++round) {
            Launch({"exit", std::to_string(round % 256)});
            int exitCode = -1;
            ASSERT_EQ(fLaunch->launcher.Wait(&exitCode, kLong), State::kFinished);
            ASSERT_EQ(exitCode, round % 256);
        }
    }

    long fOpen = 0;
    long fThreads = 0;
    const std::size_t fRegistered = ManagedThread::GetRegisteredThreadCount();
    std::unique_ptr<RealLaunch> fLaunch = std::make_unique<RealLaunch>(std::deque<std::string>());
    long fLaunches = 0;
};

TEST_F(LaunchStorm, TwoHundredLaunchesInARow)
{
    LaunchInARow(200);
}

TEST_F(LaunchStorm, TenThousandLaunchesInARow)
{
    const char* const wanted = std::getenv("ASSAY_LONG_TESTS"); // NOLINT(concurrency-mt-unsafe):
                                                                // the environment is only read
    if (wanted == nullptr || std::string(wanted) != "1")
        GTEST_SKIP()
            << "10,000 launches take long: scripts/test --long sets ASSAY_LONG_TESTS=1 on Linux";
    LaunchInARow(10'000);
}

TEST_F(LaunchStorm, TwoHundredKillsRaceNaturalEnds)
{
    int kills = 0;
    for (int round = 0; round < 200; ++round) {
        Launch({"sleep", "2"});
        boost::thread killer([&] {
            std::this_thread::sleep_for(std::chrono::microseconds(50 * (round % 80)));
            fLaunch->app->Kill();
        });
        const State end = fLaunch->launcher.Wait(nullptr, kLong);
        killer.join();
        ASSERT_TRUE(end == State::kFinished || end == State::kKilled) << end;
        kills += end == State::kKilled;
    }
    RecordProperty("kills", kills);
}

TEST_F(LaunchStorm, TwoThreadsWaitWhileTwoKill)
{
    for (int round = 0; round < 50; ++round) {
        Launch({"sleep", round % 2 == 0 ? "60000" : "2"});
        State ends[2] = {State::kUndefined, State::kUndefined};
        boost::thread_group threads;
        for (State& end : ends)
            threads.create_thread([&] { end = fLaunch->app->Wait(nullptr, kLong); });
        for (int killer = 0; killer < 2; ++killer)
            threads.create_thread([&] { fLaunch->app->Kill(); });
        threads.join_all();
        int informed = 0;
        for (const State end : ends) {
            ASSERT_TRUE(end == State::kFinished || end == State::kKilled || end == State::kIdle)
                << end;
            informed += end != State::kIdle;
        }
        ASSERT_GE(informed, 1) << "one of them must learn the end";
        ASSERT_EQ(fLaunch->launcher.Wait(nullptr, 0.0), State::kIdle);
    }
}

// A child on pipes whose output a thread reads to its end.
class PipedChild {
public:
    void Launch(std::deque<std::string> args)
    {
        fEnds = fLauncher->Launch(TEST_CHILD, args);
        for (int channel = 1; channel < kOutputSlots; ++channel)
            fReaders.create_thread([this, channel] { ReadOutput(channel); });
    }

    void CloseInput() { fEnds.fAppInput->Close(); }

    std::string Text()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fText;
    }

    bool IsAtEnd() const { return fAtEnd == 2; }

    int Finish()
    {
        fReaders.join_all();
        int exitCode = -1;
        fLauncher->Wait(&exitCode);
        return exitCode;
    }

private:
    void ReadOutput(int channel)
    {
        char block[256];
        Reader& reader = *fEnds.fAppOutput[channel];
        while (const auto count = reader.ReadSome(block, sizeof block)) {
            const boost::lock_guard<boost::mutex> lock(fMutex);
            fText.append(block, count);
        }
        ++fAtEnd;
    }

    const boost::shared_ptr<Launcher> fLauncher = MakeLauncher();
    LaunchResult fEnds;
    boost::thread_group fReaders;
    boost::mutex fMutex;
    std::string fText;
    std::atomic<int> fAtEnd{0};
};

TEST(SimultaneousLaunches, HoldNoPipesOfEachOther)
{
    constexpr std::size_t kLaunches = 8;
    for (int round = 0; round < 5; ++round) {
        PipedChild children[kLaunches];
        boost::barrier start(kLaunches);
        boost::thread_group launching;
        for (PipedChild& child : children)
            launching.create_thread([&] {
                start.wait();
                child.Launch({"pipes", "echo", "exit", "3"});
            });
        launching.join_all();
        for (PipedChild& child : children) {
            EXPECT_TRUE(Eventually([&] { return child.Text().find('\n') != std::string::npos; }));
            EXPECT_EQ(child.Text(), "pipes 3\n");
        }
        // Each child and its output end with its own input, while the others run.
        for (PipedChild& child : children) {
            child.CloseInput();
            EXPECT_TRUE(Eventually([&] { return child.IsAtEnd(); }));
        }
        for (PipedChild& child : children)
            EXPECT_EQ(child.Finish(), 3);
    }
}

} // namespace
