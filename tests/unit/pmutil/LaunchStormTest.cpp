// Many launches of real children, and what is left of them.
#include <chrono>
#include <cstdlib>
#include <gtest/gtest.h>
#include <thread>

#include "CollectingTask.h"
#include "OpenThings.h"

using namespace pmutil;

namespace {

class LaunchStorm : public testing::Test {
protected:
    LaunchStorm()
    {
        // What the first one leaves open is used again by all others.
        RealLaunch first({"exit", "0"});
        first.launcher.LaunchAndWait(nullptr, kLong);
        fOpen = CountOpenThings();
        fThreads = CountThreads();
    }

    ~LaunchStorm() override
    {
        fLaunch.reset();
        EXPECT_LE(CountOpenThings(), fOpen + fLaunches * kKeptPerLaunch);
        EXPECT_LE(CountThreads(), fThreads);
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

} // namespace
