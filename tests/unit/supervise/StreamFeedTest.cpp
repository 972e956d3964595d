#include "supervise/StreamFeed.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

namespace assay_host {
namespace {

using std::chrono::milliseconds;

class StreamFeedTest : public testing::Test {
protected:
    // "PIECE" for bytes, "end" for the end; empty if there is no event.
    std::string Pop() const
    {
        const std::optional<Event> event = fQueue->Pop(milliseconds(0));
        if (!event)
            return {};
        EXPECT_EQ(event->fChannel, pmutil::OutputChannel::kStderr);
        return event->fKind == Event::Kind::kStreamEnd ? "end" : event->fBytes;
    }

    const boost::shared_ptr<EventQueue> fQueue = boost::make_shared<EventQueue>();
    StreamFeed fFeed{pmutil::OutputChannel::kStderr, fQueue, 4};
};

TEST_F(StreamFeedTest, PassesTheBlocksAndTheEnd)
{
    fFeed.Take("abc");
    fFeed.Take("");
    EXPECT_EQ(Pop(), "abc");
    EXPECT_EQ(Pop(), "end");
    EXPECT_EQ(Pop(), "");
    EXPECT_EQ(fFeed.GetDroppedByteCount(), 0U);
}

TEST_F(StreamFeedTest, PassesOneBlockBeyondItsLimitAndCountsTheRest)
{
    for (const char* block : {"ab", "cd", "e", "fg", "h"})
        fFeed.Take(block);
    fFeed.Take("");
    EXPECT_EQ(Pop(), "ab");
    EXPECT_EQ(Pop(), "cd");
    EXPECT_EQ(Pop(), "e") << "shows that there is more than the limit";
    EXPECT_EQ(Pop(), "end");
    EXPECT_EQ(fFeed.GetDroppedByteCount(), 3U);
}

} // namespace
} // namespace assay_host
