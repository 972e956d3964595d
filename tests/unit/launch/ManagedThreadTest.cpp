#include "pmutil/ManagedThread.h"

#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/weak_ptr.hpp>
#include <chrono>
#include <gtest/gtest.h>
#include <limits>
#include <thread>

#include "RecordingLogger.h"
#include "pmutil/PMLogging.h"
#include "support/Waits.h"

using pmutil::ManagedThread;

namespace {

// A thread that runs until it is released.
class Gate {
public:
    ~Gate() { Open(); }

    boost::thread* NewThread()
    {
        return new boost::thread([state = fState] {
            while (!state->open)
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
            ++state->ended;
        });
    }

    void Open() { fState->open = true; }

    void AwaitEnds(int ends) const
    {
        while (fState->ended < ends)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }

private:
    struct Shared {
        std::atomic<bool> open{false};
        std::atomic<int> ended{0};
    };
    std::shared_ptr<Shared> fState = std::make_shared<Shared>();
};

std::size_t Count()
{
    return ManagedThread::GetRegisteredThreadCount();
}

TEST(ManagedThread, EmptyOneJoinsNothing)
{
    ManagedThread thread("label");
    EXPECT_FALSE(thread.TimedJoin(1000.0));
    thread.Join();
    thread.Abandon();
    EXPECT_FALSE(thread.HoldsThread());
}

TEST(ManagedThread, NullNameAndNullThread)
{
    ManagedThread thread(nullptr);
    thread.SetName(nullptr);
    thread.Assign(nullptr);
    EXPECT_FALSE(thread.HoldsThread());
}

TEST(ManagedThread, TimedJoinOfAThreadThatEnds)
{
    const std::size_t before = Count();
    Gate gate;
    ManagedThread thread("label");
    thread.Assign(gate.NewThread());
    EXPECT_EQ(Count(), before + 1);
    EXPECT_FALSE(thread.TimedJoin(0.0)) << "still runs";
    EXPECT_FALSE(thread.TimedJoin(0.02));
    EXPECT_FALSE(thread.TimedJoin(-5.0));
    EXPECT_FALSE(thread.TimedJoin(std::numeric_limits<double>::quiet_NaN()));
    EXPECT_FALSE(thread.TimedJoin(-std::numeric_limits<double>::infinity()));
    EXPECT_TRUE(thread.HoldsThread());
    gate.Open();
    gate.AwaitEnds(1);
    while (!thread.TimedJoin(0.0))
        boost::this_thread::yield();
    EXPECT_FALSE(thread.HoldsThread());
    EXPECT_EQ(Count(), before);
    EXPECT_FALSE(thread.TimedJoin(0.0)) << "nothing held any more";
}

TEST(ManagedThread, WaitsWithoutLimitHaveNoLimit)
{
    for (const double seconds : {1e12, std::numeric_limits<double>::infinity()}) {
        Gate gate;
        ManagedThread thread("label");
        thread.Assign(gate.NewThread());
        gate.Open();
        EXPECT_TRUE(thread.TimedJoin(seconds));
    }
}

TEST(ManagedThread, JoinWaitsForTheEnd)
{
    const std::size_t before = Count();
    Gate gate;
    ManagedThread thread("label");
    thread.Assign(gate.NewThread());
    gate.Open();
    thread.Join();
    EXPECT_FALSE(thread.HoldsThread());
    EXPECT_EQ(Count(), before);
}

TEST(ManagedThread, AbandonedThreadRunsOnAndStaysRegistered)
{
    const std::size_t before = Count();
    Gate gate;
    ManagedThread thread("label");
    thread.Assign(gate.NewThread());
    thread.Abandon();
    EXPECT_FALSE(thread.HoldsThread());
    EXPECT_EQ(Count(), before + 1);
    thread.Assign(gate.NewThread());
    EXPECT_EQ(Count(), before + 2);
    gate.Open();
    gate.AwaitEnds(2);
    EXPECT_TRUE(thread.TimedJoin(pmutil::kLong));
    EXPECT_EQ(Count(), before + 1);
}

TEST(ManagedThread, JoinedThreadThatSomebodySharesStaysRegistered)
{
    const std::size_t before = Count();
    Gate gate;
    ManagedThread thread("label");
    EXPECT_EQ(thread.GetThread(), nullptr);
    thread.Assign(gate.NewThread());
    const auto share = thread.GetThread();
    gate.Open();
    EXPECT_TRUE(thread.TimedJoin(pmutil::kLong));
    EXPECT_FALSE(thread.HoldsThread());
    EXPECT_FALSE(share->joinable());
    EXPECT_EQ(Count(), before + 1);
}

TEST(ManagedThread, OnlyTheJoinedThreadLeavesTheRegistry)
{
    Gate gate;
    Gate otherGate;
    ManagedThread thread("label");
    ManagedThread other("other");
    thread.Assign(gate.NewThread());
    other.Assign(otherGate.NewThread());
    const boost::weak_ptr<boost::thread> abandoned = thread.GetThread();
    const boost::weak_ptr<boost::thread> joined = other.GetThread();
    thread.Abandon();
    otherGate.Open();
    EXPECT_TRUE(other.TimedJoin(pmutil::kLong));
    EXPECT_TRUE(joined.expired());
    EXPECT_FALSE(abandoned.expired());
}

TEST(ManagedThread, AssignAbandonsWhatIsHeld)
{
    const std::size_t before = Count();
    Gate gate;
    ManagedThread thread("label");
    thread.Assign(gate.NewThread());
    thread.Assign(gate.NewThread());
    EXPECT_EQ(Count(), before + 2);
    thread.Assign(nullptr);
    EXPECT_FALSE(thread.HoldsThread());
    gate.Open();
    gate.AwaitEnds(2);
}

TEST(ManagedThread, DestructionNeverBlocksAndTheThreadGoesOn)
{
    const std::size_t before = Count();
    Gate gate;
    {
        ManagedThread thread("label");
        thread.Assign(gate.NewThread());
    }
    EXPECT_EQ(Count(), before + 1);
    gate.Open();
    gate.AwaitEnds(1);
}

TEST(ManagedThread, AThreadCannotWaitForItself)
{
    ManagedThread thread("label");
    std::atomic<bool> assigned{false};
    std::atomic<bool> joined{true};
    thread.Assign(new boost::thread([&] {
        while (!assigned)
            boost::this_thread::yield();
        joined = thread.TimedJoin(100.0);
    }));
    assigned = true;
    // Read only after the thread has finished with it.
    while (joined)
        boost::this_thread::yield();
    EXPECT_TRUE(thread.TimedJoin(pmutil::kLong));
}

TEST(ManagedThread, ArraysAreBuiltWithoutNames)
{
    ManagedThread threads[3];
    Gate gate;
    threads[1].SetName("stdout");
    threads[1].Assign(gate.NewThread());
    gate.Open();
    EXPECT_TRUE(threads[1].TimedJoin(pmutil::kLong));
}

class ManagedThreadLog : public testing::TestWithParam<const char*> {};

TEST_P(ManagedThreadLog, TellsOfAbandonedThreads)
{
    pmutil::InitLogging();
    const pmutil::RecordingLogger logger;
    pmutil::DebugValue log{GetParam(), 0};
    Gate gate;
    ManagedThread thread("label");
    pmutil::GetDebugValue(log) = 1;
    thread.Abandon();
    EXPECT_TRUE(logger.lines.empty()) << "nothing was held";
    thread.Assign(gate.NewThread());
    thread.Abandon();
    pmutil::GetDebugValue(log) = 0;
    ASSERT_EQ(logger.lines.size(), 1U);
    EXPECT_EQ(pmutil::MessageOf(logger.lines[0]), "thread label was abandoned\n");
    gate.Open();
    gate.AwaitEnds(1);
}

INSTANTIATE_TEST_SUITE_P(EachSwitch, ManagedThreadLog,
                         testing::Values("ManagedThreadLog", "ConsoleAppLog"));

} // namespace
