#include "supervise/StopRequest.h"

#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "supervise/EventQueue.h"

namespace assay_host {
namespace {

TEST(StopRequest, TellsItsListener)
{
    StopRequest stop;
    int heard = 0;
    stop.SetListener([&heard] { ++heard; });
    EXPECT_FALSE(stop.IsRaised());
    stop.Raise();
    EXPECT_TRUE(stop.IsRaised());
    EXPECT_EQ(heard, 1);
    stop.SetListener({});
    stop.Raise();
    EXPECT_TRUE(stop.IsRaised());
    EXPECT_EQ(heard, 1);
}

// Without the wake these would wait for hours.
TEST(EventQueue, IsWokenWhileItWaits)
{
    EventQueue queue;
    std::thread other([&queue] {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        queue.Wake();
    });
    EXPECT_FALSE(queue.Pop(std::chrono::hours(5)));
    other.join();
}

TEST(EventQueue, RemembersAWakeForTheNextWait)
{
    EventQueue queue;
    queue.Wake();
    EXPECT_FALSE(queue.Pop(std::chrono::hours(5)));
}

TEST(EventQueue, LosesNoEventToAWake)
{
    EventQueue queue;
    queue.Wake();
    queue.Push({Event::Kind::kChildEnd, {}, {}});
    EXPECT_TRUE(queue.Pop(std::chrono::hours(5)));
    EXPECT_FALSE(queue.Pop(std::chrono::milliseconds(0)));
}

} // namespace
} // namespace assay_host
