#include "supervise/EventQueue.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <boost/thread/thread.hpp>

namespace assay_host {
namespace {

using std::chrono::milliseconds;

Event Bytes(std::string bytes)
{
    return {Event::Kind::kBytes, pmutil::OutputChannel::kStdout, std::move(bytes)};
}

TEST(EventQueue, GivesEventsInTheirOrder)
{
    EventQueue queue;
    queue.Push(Bytes("a"));
    queue.Push(Bytes("b"));
    EXPECT_EQ(queue.Pop(milliseconds(0))->fBytes, "a");
    EXPECT_EQ(queue.Pop(milliseconds(0))->fBytes, "b");
    EXPECT_FALSE(queue.Pop(milliseconds(0)));
}

TEST(EventQueue, CloseDropsWhatItHoldsAndWhatComes)
{
    EventQueue queue;
    queue.Push(Bytes("held"));
    queue.Close();
    EXPECT_FALSE(queue.Pop(milliseconds(0)));
    queue.Push(Bytes("late"));
    EXPECT_FALSE(queue.Pop(milliseconds(0)));
}

TEST(EventQueue, CloseEndsTheWaitOfAPush)
{
    const auto queue = boost::make_shared<EventQueue>();
    queue->Push(Bytes(std::string(std::size_t{1} << 18, 'x')));
    boost::thread pusher([queue] { queue->Push(Bytes("y")); });
    EXPECT_FALSE(pusher.timed_join(boost::posix_time::milliseconds(50))) << "the queue is full";
    queue->Close();
    pusher.join();
}

// These would wait for hours without Wake.
TEST(EventQueue, IsWokenWhileItWaits)
{
    EventQueue queue;
    boost::thread other([&queue] {
        boost::this_thread::sleep(boost::posix_time::milliseconds(50));
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
