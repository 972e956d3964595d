#include "supervise/StopRequest.h"

#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "supervise/EventQueue.h"

namespace assay_host {
namespace {

TEST(StopRequest, CallsItsListener)
{
    StopRequest stop;
    int calls = 0;
    stop.SetListener([&calls] { ++calls; });
    EXPECT_FALSE(stop.IsRaised());
    stop.Raise();
    EXPECT_TRUE(stop.IsRaised());
    EXPECT_EQ(calls, 1);
    stop.SetListener({});
    stop.Raise();
    EXPECT_TRUE(stop.IsRaised());
    EXPECT_EQ(calls, 1);
}

// These would wait for hours without Wake.
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

TEST(EventQueue, KeepsAWakeForTheNextWait)
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
