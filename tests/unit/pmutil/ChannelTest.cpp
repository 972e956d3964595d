#include "pmutil/Channel.h"
#include "pmutil/RandomAccess.h"
#include "pmutil/XUnderrun.h"

#include <gmock/gmock.h>
#include <type_traits>

#include "FakeChannel.h"
#include "Throws.h"

using namespace pmutil;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

constexpr char kOverrideRequired[] = "pmutil binio function override required";
constexpr char kNotOpen[] = "pmutil::Channel not open";

// A channel that is open and implements no other operation.
class OnlyOpen : public RandomAccess {
protected:
    bool BinioIsOpen() const override { return true; }
};

TEST(Channel, HasOneChannelPartSharedByAllCapabilities)
{
    FakeChannel channel;
    EXPECT_EQ(static_cast<Channel*>(static_cast<Reader*>(&channel)),
              static_cast<Channel*>(static_cast<Writer*>(&channel)));
    EXPECT_EQ(static_cast<Channel*>(static_cast<Reader*>(&channel)),
              static_cast<Channel*>(static_cast<Seeker*>(&channel)));
}

TEST(Channel, WithoutTargetAndOverridesFailsEvenAtIsOpen)
{
    Channel channel;
    EXPECT_TRUE(ThrowsRuntimeError(kOverrideRequired, [&] { channel.IsOpen(); }));
    EXPECT_TRUE(ThrowsRuntimeError(kOverrideRequired, [&] { channel.Close(); }));
}

TEST(Channel, CloseTwiceClosesOnce)
{
    FakeChannel channel;
    channel.Close();
    EXPECT_FALSE(channel.IsOpen());
    channel.Close();
    EXPECT_THAT(channel.fCalls, ElementsAre("close"));
}

TEST(Channel, ForwardsIsOpenAndCloseToItsTarget)
{
    FakeChannel target;
    Channel channel(&target, false);
    EXPECT_TRUE(channel.IsOpen());
    channel.Close();
    EXPECT_FALSE(channel.IsOpen());
    channel.Close();
    EXPECT_THAT(target.fCalls, ElementsAre("close"));
}

TEST(Channel, DeletesItsTargetOnlyIfItOwnsIt)
{
    int destroyed = 0;
    FakeChannel stays;
    stays.fDestroyed = &destroyed;
    {
        const Channel notOwner(&stays, false);
    }
    EXPECT_EQ(destroyed, 0);
    stays.fDestroyed = nullptr;

    auto* const target = new FakeChannel;
    target->fDestroyed = &destroyed;
    {
        const Channel owner(target, true);
    }
    EXPECT_EQ(destroyed, 1);
}

TEST(Channel, ReplacingAnOwnedTargetDeletesIt)
{
    int destroyed = 0;
    auto* const first = new FakeChannel;
    first->fDestroyed = &destroyed;
    FakeChannel second;
    Channel channel(first, true);
    channel.SetTarget(first, false);
    EXPECT_EQ(destroyed, 0);
    channel.SetTarget(&second, false);
    EXPECT_EQ(destroyed, 1);
    channel.Close();
    EXPECT_FALSE(second.fOpen);
    channel.SetTarget(nullptr, false);
    EXPECT_TRUE(ThrowsRuntimeError(kOverrideRequired, [&] { channel.IsOpen(); }));
}

TEST(Channel, EachCapabilityForwardsToItsTarget)
{
    FakeChannel target;
    target.fPieces = {"abc"};
    target.fPosition = 77;
    char byte = 0;

    Reader reader(&target, false);
    EXPECT_EQ(reader.ReadSome(&byte, 1), 1U);
    EXPECT_EQ(byte, 'a');

    Writer writer(&target, false);
    EXPECT_EQ(writer.WriteSome("xyz", 3), 3U);
    writer.Flush();

    Seeker seeker(&target, false);
    EXPECT_EQ(seeker.Tell(), 77U);
    seeker.Seek(5);
    seeker.SeekRelative(-2);
    seeker.SeekEnd();

    EXPECT_THAT(target.fCalls,
                ElementsAre("read 1", "write 3", "tell", "seek 5", "seek relative -2", "seek end"));
}

TEST(Channel, CapabilitySettersReplaceTheTarget)
{
    FakeChannel first;
    FakeChannel second;
    char byte = 0;
    Reader reader(&first, false);
    reader.SetReader(&second, false);
    reader.ReadSome(&byte, 1);
    Writer writer;
    writer.SetWriter(&second, false);
    writer.WriteAll("x", 1);
    Seeker seeker(&first, false);
    seeker.SetSeeker(&second, false);
    seeker.SeekEnd();
    EXPECT_THAT(first.fCalls, IsEmpty());
    EXPECT_THAT(second.fCalls, ElementsAre("read 1", "write 1", "seek end"));
}

TEST(RandomAccess, ForwardsAllCapabilitiesToOneTarget)
{
    FakeChannel target;
    target.fPieces = {"ab"};
    RandomAccess channel(&target, false);
    char byte = 0;
    channel.ReadSome(&byte, 1);
    channel.WriteSome("x", 1);
    channel.Seek(9);
    channel.SetEOF();
    channel.Close();
    EXPECT_THAT(target.fCalls, ElementsAre("read 1", "write 1", "seek 9", "set EOF", "close"));
}

TEST(RandomAccess, OwnsItsTargetOnceIfToldSo)
{
    int destroyed = 0;
    auto* const target = new FakeChannel;
    target->fDestroyed = &destroyed;
    {
        RandomAccess channel(target, true);
        channel.WriteSome("x", 1);
        EXPECT_EQ(target->fWritten, "x");
    }
    EXPECT_EQ(destroyed, 1);

    FakeChannel other;
    RandomAccess channel;
    channel.SetRandomAccess(&other, false);
    channel.SeekEnd();
    EXPECT_THAT(other.fCalls, ElementsAre("seek end"));
}

TEST(RandomAccess, CapabilityWithAnotherTargetThanTheChannelFails)
{
    FakeChannel first;
    FakeChannel second;
    RandomAccess channel(&first, false);
    channel.SetWriter(&second, false);
    char byte = 0;
    channel.WriteSome("x", 1);
    EXPECT_TRUE(ThrowsRuntimeError(kOverrideRequired, [&] { channel.ReadSome(&byte, 1); }));
    EXPECT_TRUE(ThrowsRuntimeError(kOverrideRequired, [&] { channel.Tell(); }));
    EXPECT_EQ(second.fWritten, "x");
}

TEST(RandomAccess, SetEOFNeedsATargetThatHasAnEndToSet)
{
    FakeChannel target;
    Reader onlyReader(&target, false);
    RandomAccess channel;
    channel.SetReader(&onlyReader, false);
    EXPECT_TRUE(ThrowsRuntimeError(kOverrideRequired, [&] { channel.SetEOF(); }));
}

TEST(Channel, EachMissingOverrideFailsLoudly)
{
    OnlyOpen channel;
    char byte = 0;
    const auto fails = [](auto call) { return ThrowsRuntimeError(kOverrideRequired, call); };
    EXPECT_TRUE(fails([&] { channel.Close(); }));
    EXPECT_TRUE(fails([&] { channel.ReadSome(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.ReadAll(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.WriteSome(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.WriteAll(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.Tell(); }));
    EXPECT_TRUE(fails([&] { channel.Seek(0); }));
    EXPECT_TRUE(fails([&] { channel.SeekRelative(0); }));
    EXPECT_TRUE(fails([&] { channel.SeekEnd(); }));
    EXPECT_TRUE(fails([&] { channel.SetEOF(); }));
    channel.Flush();
    channel.Unread("x", 1);
}

TEST(Channel, EachOperationNeedsAnOpenChannel)
{
    FakeChannel channel;
    channel.fOpen = false;
    char byte = 0;
    const auto fails = [](auto call) { return ThrowsRuntimeError(kNotOpen, call); };
    EXPECT_TRUE(fails([&] { channel.ReadSome(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.ReadSome(&byte, 0); }));
    EXPECT_TRUE(fails([&] { channel.ReadAll(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.ReadAll(&byte, 0); }));
    EXPECT_TRUE(fails([&] { channel.Unread(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.WriteSome(&byte, 1); }));
    EXPECT_TRUE(fails([&] { channel.WriteSome(&byte, 0); }));
    EXPECT_TRUE(fails([&] { channel.WriteAll(&byte, 0); }));
    EXPECT_TRUE(fails([&] { channel.Flush(); }));
    EXPECT_TRUE(fails([&] { channel.Tell(); }));
    EXPECT_TRUE(fails([&] { channel.Seek(0); }));
    EXPECT_TRUE(fails([&] { channel.SeekRelative(0); }));
    EXPECT_TRUE(fails([&] { channel.SeekEnd(); }));
    EXPECT_TRUE(fails([&] { channel.SetEOF(); }));
    EXPECT_THAT(channel.fCalls, IsEmpty());
}

TEST(Writer, WriteSomeOfNothingDoesNotCallDown)
{
    FakeChannel channel;
    EXPECT_EQ(channel.WriteSome(nullptr, 0), 0U);
    channel.WriteAll(nullptr, 0);
    EXPECT_THAT(channel.fCalls, IsEmpty());
}

TEST(Writer, WriteSomeMayWriteFewer)
{
    FakeChannel channel;
    channel.fMostPerWrite = 2;
    EXPECT_EQ(channel.WriteSome("abcde", 5), 2U);
    EXPECT_THAT(channel.fCalls, ElementsAre("write 5"));
}

TEST(Writer, WriteAllWritesTheRestUntilDone)
{
    FakeChannel channel;
    channel.fMostPerWrite = 2;
    channel.WriteAll("abcde", 5);
    EXPECT_EQ(channel.fWritten, "abcde");
    EXPECT_THAT(channel.fCalls, ElementsAre("write 5", "write 3", "write 1"));
}

TEST(Writer, ZeroFromBelowIsALogicError)
{
    FakeChannel channel;
    channel.fMostPerWrite = 0;
    EXPECT_TRUE(ThrowsLogicError("DoWriteSome should never return 0 if nbytes > 0",
                                 [&] { channel.WriteSome("a", 1); }));
    EXPECT_TRUE(
        ThrowsLogicError("WriteFunc should never return 0", [&] { channel.WriteAll("a", 1); }));
}

TEST(Writer, FailedWriteLeavesWhatWasWritten)
{
    class Failing : public FakeChannel {
        std::uint64_t BinioWriteSome(const void* bytes, std::uint64_t nbytes) override
        {
            if (fWritten.size() >= 4)
                throw std::runtime_error("disk gone");
            return FakeChannel::BinioWriteSome(bytes, nbytes);
        }
    };
    Failing channel;
    channel.fMostPerWrite = 2;
    EXPECT_TRUE(ThrowsRuntimeError("disk gone", [&] { channel.WriteAll("abcdef", 6); }));
    EXPECT_EQ(channel.fWritten, "abcd");
}

TEST(XUnderrun, TellsTheCountAndKeepsTheBytes)
{
    const XUnderrun bare(12);
    EXPECT_STREQ(bare.what(), "I/O underrun, actual count=12");
    EXPECT_EQ(bare.GetCount(), 12U);
    EXPECT_FALSE(bare.HasData());
    EXPECT_THAT(bare.GetData(), IsEmpty());

    const XUnderrun full(3, "abcd");
    EXPECT_STREQ(full.what(), "I/O underrun, actual count=3");
    EXPECT_TRUE(full.HasData());
    EXPECT_THAT(full.GetData(), ElementsAre('a', 'b', 'c'));
    static_assert(std::is_base_of_v<std::runtime_error, XUnderrun>);
}

} // namespace
