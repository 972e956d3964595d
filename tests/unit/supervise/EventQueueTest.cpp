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

// A push that had to wait would wait without end.
TEST(EventQueue, TakesWhatItHasRoomFor)
{
    constexpr std::size_t kRoom = std::size_t{1} << 18;
    EventQueue queue;
    queue.Push(Bytes(std::string(kRoom + 1, 'x'))); // an empty queue takes any event
    EXPECT_TRUE(queue.Pop(milliseconds(0)));
    for (int round = 0; round < 2; ++round) {
        queue.Push(Bytes(std::string(kRoom - 1, 'x')));
        queue.Push(Bytes("y"));
        queue.Push({Event::Kind::kChildEnd, {}, {}});
        EXPECT_TRUE(queue.Pop(milliseconds(0)));
        queue.Push(Bytes(std::string(kRoom - 1, 'x')));
        for (int left = 0; left < 3; ++left)
            EXPECT_TRUE(queue.Pop(milliseconds(0)));
    }
}

TEST(EventQueue, KeepsAPushWaitingUntilThereIsRoom)
{
    constexpr std::size_t kRoom = std::size_t{1} << 18;
    const auto queue = boost::make_shared<EventQueue>();
    queue->Push(Bytes("a"));
    boost::thread pusher([queue] {
        queue->Push(Bytes(std::string(kRoom, 'x')));
        queue->Push(Bytes("b"));
    });
    EXPECT_FALSE(pusher.timed_join(boost::posix_time::milliseconds(20))) << "the queue is full";
    EXPECT_EQ(queue->Pop(milliseconds(0))->fBytes, "a");
    EXPECT_EQ(queue->Pop(std::chrono::hours(5))->fBytes.size(), kRoom);
    EXPECT_EQ(queue->Pop(std::chrono::hours(5))->fBytes, "b");
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
