// The order and the number of the checks of channels.
#include <gtest/gtest.h>

#include "FakeChannel.h"
#include "Throws.h"
#include "pmutil/Previewer.h"

namespace {

// Counts the calls of IsOpen.
class CountingChannel : public FakeChannel {
public:
    mutable int fAsked = 0;

protected:
    bool BinioIsOpen() const override
    {
        ++fAsked;
        return FakeChannel::BinioIsOpen();
    }
};

TEST(ChannelOrder, ReadsCheckForAPreviewBeforeTheyAskForOpen)
{
    CountingChannel source;
    const pmutil::Previewer previewer(source);
    source.fOpen = false;
    char byte = 0;
    source.fAsked = 0;
    EXPECT_TRUE(
        ThrowsLogicError("direct read while preview active", [&] { source.ReadAll(&byte, 1); }));
    EXPECT_TRUE(
        ThrowsRuntimeError("direct read while preview active", [&] { source.ReadSome(&byte, 1); }));
    EXPECT_EQ(source.fAsked, 0);
}

TEST(ChannelOrder, WriteAllAsksOnceForOpen)
{
    CountingChannel sink;
    sink.fMostPerWrite = 1;
    sink.WriteAll("abcd", 4);
    EXPECT_EQ(sink.fWritten, "abcd");
    EXPECT_EQ(sink.fAsked, 1);
}

TEST(ChannelOrder, FlushReachesTheChannel)
{
    FakeChannel sink;
    sink.Flush();
    EXPECT_EQ(sink.fCalls, std::vector<std::string>{"flush"});
}

} // namespace
