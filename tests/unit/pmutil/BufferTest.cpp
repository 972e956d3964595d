#include "pmutil/Buffer.h"

#include <gmock/gmock.h>
#include <limits>

#include "Throws.h"
#include "pmutil/Requirement.h"
#include "pmutil/XUnderrun.h"

using namespace pmutil;

namespace {

constexpr std::uint64_t kLargest = std::numeric_limits<std::uint64_t>::max();
constexpr char kOwnership[] = "Buffer: ownership is required for this operation";

class OpenBuffer : public Buffer {
public:
    using Buffer::BinioWriteSome;
    using Buffer::Buffer;
    using Buffer::DoReadByte;
};

std::string ReadSomeText(Reader& reader, std::size_t most)
{
    std::string text(most, '?');
    text.resize(reader.ReadSome(text.data(), most));
    return text;
}

struct State {
    std::uint64_t offset, endOfData, capacity, dirtyBegin, dirtyEnd;
    const void* data;

    explicit State(const Buffer& buffer)
        : offset(buffer.GetOffset()),
          endOfData(buffer.GetEndOfData()),
          capacity(buffer.GetCapacity()),
          dirtyBegin(buffer.GetDirtyBegin()),
          dirtyEnd(buffer.GetDirtyEnd()),
          data(buffer.GetData())
    {}

    bool operator==(const State& other) const
    {
        return offset == other.offset && endOfData == other.endOfData &&
               capacity == other.capacity && dirtyBegin == other.dirtyBegin &&
               dirtyEnd == other.dirtyEnd && data == other.data;
    }
};

TEST(Buffer, ByCapacityIsEmptyOwnedAndGrowable)
{
    const Buffer buffer(10);
    EXPECT_EQ(buffer.GetCapacity(), 10U);
    EXPECT_EQ(buffer.GetEndOfData(), 0U);
    EXPECT_EQ(buffer.GetOffset(), 0U);
    EXPECT_EQ(buffer.GetDirtyBegin(), 0U);
    EXPECT_EQ(buffer.GetDirtyEnd(), 0U);
    EXPECT_TRUE(buffer.IsOwned());
    EXPECT_TRUE(buffer.IsGrowable());
    EXPECT_TRUE(buffer.IsOpen());
}

TEST(Buffer, OfCapacityZeroIsOpen)
{
    EXPECT_TRUE(Buffer(0).IsOpen());
}

TEST(Buffer, OverABlockTakesAllOfItForData)
{
    char block[] = "12345678";
    Buffer buffer(block, 8);
    EXPECT_EQ(buffer.GetCapacity(), 8U);
    EXPECT_EQ(buffer.GetEndOfData(), 8U);
    EXPECT_EQ(buffer.GetOffset(), 0U);
    EXPECT_FALSE(buffer.IsOwned());
    EXPECT_FALSE(buffer.IsGrowable());
    EXPECT_EQ(ReadSomeText(buffer, 100), "12345678");
}

TEST(Buffer, OverANullBlock)
{
    EXPECT_TRUE(
        ThrowsRuntimeError("Buffer: null buf with positive size", [] { Buffer(nullptr, 1); }));
    Buffer empty(nullptr, 0);
    EXPECT_FALSE(empty.IsOpen());
    empty.SetState(0, 0, 0, 0);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] { empty.SetOffset(1); }));
}

TEST(Buffer, SizesNearTheLimitNeverBecomeAnAllocation)
{
    EXPECT_THROW(Buffer{kLargest}, std::bad_alloc);
    EXPECT_THROW(Buffer{kLargest / 2 + 1}, std::bad_alloc);
    Buffer buffer(10);
    buffer.WriteAll("abc", 3);
    const State before(buffer);
    EXPECT_THROW(buffer.Grow(kLargest - 10), std::bad_alloc);
    EXPECT_THROW(buffer.SetCapacity(kLargest), std::bad_alloc);
    EXPECT_TRUE(
        ThrowsRuntimeError("cannot Grow Buffer that large", [&] { buffer.Grow(kLargest); }));
    EXPECT_TRUE(
        ThrowsRuntimeError("cannot Grow Buffer that large", [&] { buffer.Grow(kLargest - 9); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: CopyOut nbytes too large",
                                   [&] { buffer.CopyOut(nullptr, kLargest); }));
    EXPECT_TRUE(State(buffer) == before);
}

TEST(Buffer, CopyIsDeepAndOwned)
{
    char block[] = "12345678";
    Buffer wrapped(block, 8);
    wrapped.SetState(3, 6, 1, 5);
    Buffer copy(wrapped);
    EXPECT_EQ(copy.GetOffset(), 3U);
    EXPECT_EQ(copy.GetEndOfData(), 6U);
    EXPECT_EQ(copy.GetCapacity(), 8U);
    EXPECT_EQ(copy.GetDirtyBegin(), 1U);
    EXPECT_EQ(copy.GetDirtyEnd(), 5U);
    EXPECT_TRUE(copy.IsOwned());
    EXPECT_FALSE(copy.IsGrowable());
    EXPECT_NE(copy.GetData(), wrapped.GetData());
    block[4] = 'x';
    EXPECT_EQ(ReadSomeText(copy, 9), "456");

    EXPECT_TRUE(Buffer(Buffer(4)).IsOpen());
    const Buffer growable(4);
    EXPECT_TRUE(Buffer(growable).IsGrowable());
}

TEST(Buffer, CopyWithoutCapacityHasNoBlock)
{
    const Buffer source(0);
    Buffer copy(source);
    EXPECT_FALSE(copy.IsOpen());
    copy.CopyIn("ab", 2);
    EXPECT_TRUE(copy.IsOpen());
    EXPECT_EQ(copy.GetCapacity(), 4096U);
}

TEST(Buffer, CopyOfAClosedBufferIsClosed)
{
    Buffer source(4);
    source.Close();
    const Buffer copy(source);
    EXPECT_FALSE(copy.IsOpen());
    EXPECT_EQ(copy.GetCapacity(), 4U);
}

TEST(Buffer, AssignmentTakesTheOthersState)
{
    Buffer source(10);
    source.WriteAll("abcdef", 6);
    source.Seek(2);
    Buffer target(3);
    target.WriteAll("xyz", 3);
    target.Unread("q", 1);
    source.SetDirtyBounds(1, 4);
    target = source;
    EXPECT_EQ(target.GetDirtyBegin(), 1U);
    EXPECT_EQ(target.GetDirtyEnd(), 4U);
    EXPECT_EQ(ReadSomeText(target, 9), "cdef");
    EXPECT_EQ(target.GetCapacity(), 10U);
    target.Unread("q", 1);
    const Buffer& same = target;
    target = same;
    EXPECT_EQ(ReadSomeText(target, 9), "q") << "nothing changes";
    target.Seek(0);
    EXPECT_EQ(ReadSomeText(target, 9), "abcdef");
    EXPECT_EQ(ReadSomeText(source, 9), "cdef");
}

TEST(Buffer, AssignmentOwnsItsBlockAndGrowsAsTheOther)
{
    char block[] = "1234";
    const Buffer wrapped(block, 4);
    Buffer target(8);
    target = wrapped;
    EXPECT_TRUE(target.IsOwned());
    EXPECT_FALSE(target.IsGrowable());
    EXPECT_NE(target.GetData(), wrapped.GetData());
    target = Buffer(8);
    EXPECT_TRUE(target.IsGrowable());
}

TEST(Buffer, CloseKeepsThePositions)
{
    Buffer buffer(10);
    buffer.WriteAll("abc", 3);
    buffer.Close();
    EXPECT_FALSE(buffer.IsOpen());
    EXPECT_EQ(buffer.GetData(), nullptr);
    EXPECT_EQ(buffer.GetOffset(), 3U);
    EXPECT_EQ(buffer.GetEndOfData(), 3U);
    EXPECT_EQ(buffer.GetCapacity(), 10U);
    EXPECT_TRUE(ThrowsRuntimeError("pmutil::Channel not open", [&] { buffer.Tell(); }));
    EXPECT_TRUE(ThrowsRuntimeError("pmutil::Channel not open", [&] { buffer.WriteAll("a", 1); }));
    buffer.Close();
}

TEST(Buffer, ClosedBufferRefusesItsOwnOperations)
{
    char byte = 0;
    Buffer buffer(10);
    buffer.WriteAll("abc", 3);
    buffer.Seek(0);
    buffer.Close();
    const auto notOpen = [](auto call) {
        return ThrowsRuntimeError("pmutil::Channel not open", call);
    };
    EXPECT_TRUE(notOpen([&] { buffer.CopyOut(&byte, 1); }));
    EXPECT_TRUE(notOpen([&] { buffer.CopyIn(&byte, 1); }));
    EXPECT_TRUE(notOpen([&] { buffer.Grow(1); }));
    EXPECT_TRUE(notOpen([&] { buffer.SetCapacity(20); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] { buffer.SetOffset(0); }));
}

TEST(Buffer, NothingButAnotherBlockOpensAClosedBuffer)
{
    const auto notOpen = [](auto call) {
        return ThrowsRuntimeError("pmutil::Channel not open", call);
    };
    char byte = 'x';
    for (const std::uint64_t capacity : {0U, 10U}) {
        Buffer buffer(capacity);
        buffer.Close();
        EXPECT_TRUE(notOpen([&] { buffer.Grow(1); }));
        EXPECT_TRUE(notOpen([&] { buffer.SetCapacity(20); }));
        EXPECT_TRUE(notOpen([&] { buffer.CopyIn(&byte, 1); }));
        Buffer copy(buffer);
        EXPECT_TRUE(notOpen([&] { copy.Grow(1); }));
        EXPECT_FALSE(buffer.IsOpen());
        EXPECT_FALSE(copy.IsOpen());

        copy = Buffer(5);
        EXPECT_TRUE(copy.IsOpen());
        copy.Grow(1);
        buffer.Attach(&byte, 1);
        EXPECT_TRUE(buffer.IsOpen());
        EXPECT_EQ(ReadSomeText(buffer, 9), "x");
    }
}

TEST(Buffer, ForgetsWhatWasPutBackWhenItsBlockOrPositionIsSet)
{
    char block[] = "1234";
    char other[] = "56";
    Buffer buffer(block, 4);
    buffer.Unread("old", 3);
    buffer.SetOffset(1);
    EXPECT_EQ(ReadSomeText(buffer, 9), "234");
    buffer.Unread("old", 3);
    buffer.SetState(2, 4, 0, 0);
    EXPECT_EQ(ReadSomeText(buffer, 9), "34");
    buffer.Unread("old", 3);
    buffer.Attach(other, 2);
    EXPECT_EQ(ReadSomeText(buffer, 9), "56");
    buffer.Unread("old", 3);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] { buffer.SetOffset(9); }));
    EXPECT_EQ(ReadSomeText(buffer, 9), "old");
}

TEST(Buffer, CloseOfAWrappedBlockDoesNotFreeIt)
{
    char block[] = "1234";
    {
        Buffer buffer(block, 4);
        buffer.Close();
        EXPECT_FALSE(buffer.IsOpen());
    }
    EXPECT_STREQ(block, "1234");
}

TEST(Buffer, ReadsUpToTheEndOfData)
{
    Buffer buffer(100);
    buffer.WriteAll("abcdef", 6);
    EXPECT_EQ(ReadSomeText(buffer, 4), "");
    buffer.Seek(1);
    EXPECT_EQ(ReadSomeText(buffer, 2), "bc");
    EXPECT_EQ(buffer.Tell(), 3U);
    EXPECT_EQ(ReadSomeText(buffer, 50), "def");
}

TEST(Buffer, ReadByteTellsTheEndFromTheHighestByte)
{
    char block[] = "\xFF";
    OpenBuffer buffer(block, 1);
    EXPECT_EQ(buffer.DoReadByte(), 0xFFU);
    EXPECT_EQ(buffer.DoReadByte(), 0xFFFFFFFFU);
    EXPECT_EQ(buffer.Tell(), 1U);
}

TEST(Buffer, WrappedBlockRunsFull)
{
    char block[] = "12345678";
    Buffer buffer(block, 8);
    buffer.WriteAll("abcdefgh", 8);
    EXPECT_STREQ(block, "abcdefgh");
    EXPECT_TRUE(ThrowsRuntimeError("Buffer full", [&] { buffer.WriteSome("i", 1); }));
    EXPECT_EQ(buffer.Tell(), 8U);
}

TEST(Buffer, WriteAtCapacityGrowsToAPage)
{
    Buffer buffer(10);
    buffer.WriteAll("0123456789", 10);
    EXPECT_EQ(buffer.GetCapacity(), 10U);
    EXPECT_EQ(buffer.WriteSome("x", 1), 1U);
    EXPECT_EQ(buffer.GetCapacity(), 4096U);
    EXPECT_EQ(buffer.GetEndOfData(), 11U);
}

TEST(Buffer, WriteAtAFullPageGrowsByAPage)
{
    Buffer buffer(4096);
    buffer.WriteAll(std::string(4096, 'a').data(), 4096);
    EXPECT_EQ(buffer.WriteSome("x", 1), 1U);
    EXPECT_EQ(buffer.GetCapacity(), 8192U);
    buffer.Seek(4090);
    EXPECT_EQ(ReadSomeText(buffer, 20), "aaaaaax");
}

TEST(Buffer, WriteFillsTheRoomLeftBeforeItGrows)
{
    Buffer buffer(10);
    buffer.WriteAll("01234567", 8);
    EXPECT_EQ(buffer.WriteSome("abcdef", 6), 2U);
    EXPECT_EQ(buffer.GetCapacity(), 10U);
    buffer.WriteAll("cdef", 4);
    EXPECT_EQ(buffer.GetCapacity(), 4096U);
    buffer.Seek(0);
    EXPECT_EQ(ReadSomeText(buffer, 50), "01234567abcdef");
}

TEST(Buffer, DirtyRangeStartsAtZeroAndOnlyWidens)
{
    Buffer buffer(200);
    buffer.SetEndOfData(150);
    buffer.Seek(100);
    buffer.WriteAll("abc", 3);
    EXPECT_EQ(buffer.GetDirtyBegin(), 0U);
    EXPECT_EQ(buffer.GetDirtyEnd(), 103U);
    EXPECT_EQ(buffer.GetEndOfData(), 150U);
    buffer.SetDirtyBounds(100, 103);
    buffer.Seek(50);
    buffer.WriteAll("x", 1);
    EXPECT_EQ(buffer.GetDirtyBegin(), 50U);
    EXPECT_EQ(buffer.GetDirtyEnd(), 103U);
    buffer.Seek(140);
    buffer.CopyIn("0123456789abcdef", 16);
    EXPECT_EQ(buffer.GetDirtyEnd(), 156U);
    EXPECT_EQ(buffer.GetEndOfData(), 156U);
}

TEST(Buffer, CopyOutAdvances)
{
    char block[] = "12345678";
    Buffer buffer(block, 8);
    char bytes[8] = {};
    buffer.CopyOut(bytes, 3);
    EXPECT_STREQ(bytes, "123");
    EXPECT_EQ(buffer.Tell(), 3U);
    EXPECT_TRUE(
        ThrowsRuntimeError("Buffer: CopyOut nbytes too large", [&] { buffer.CopyOut(bytes, 6); }));
    EXPECT_EQ(buffer.Tell(), 3U);
    buffer.CopyOut(bytes, 5);
    EXPECT_STREQ(bytes, "45678");
    EXPECT_EQ(buffer.Tell(), 8U);
}

TEST(Buffer, CopyInBeyondAFixedCapacityIsAnUnderrun)
{
    char block[] = "12345678";
    Buffer buffer(block, 8);
    buffer.Seek(6);
    const State before(buffer);
    EXPECT_TRUE(
        ThrowsExactly<XUnderrun>("I/O underrun, actual count=0", [&] { buffer.CopyIn("abc", 3); }));
    EXPECT_TRUE(State(buffer) == before);
    buffer.CopyIn("ab", 2);
    EXPECT_STREQ(block, "123456ab");
}

TEST(Buffer, CopyInGrowsByTheShortfall)
{
    Buffer buffer(4096);
    buffer.CopyIn(std::string(4090, 'a').data(), 4090);
    buffer.CopyIn("0123456789", 10);
    EXPECT_EQ(buffer.GetCapacity(), 8192U);
    EXPECT_EQ(buffer.GetEndOfData(), 4100U);
    EXPECT_EQ(buffer.GetDirtyEnd(), 4100U);
    buffer.Seek(4088);
    EXPECT_EQ(ReadSomeText(buffer, 50), "aa0123456789");
}

TEST(Buffer, CopyInGrowsByNoMoreThanTheShortfall)
{
    Buffer buffer(4096);
    buffer.CopyIn("012345", 6);
    buffer.CopyIn(std::string(4096, 'a').data(), 4096);
    EXPECT_EQ(buffer.GetCapacity(), 8192U);
}

TEST(Buffer, WritesOfNothingLeaveTheDirtyRange)
{
    OpenBuffer buffer(8);
    buffer.WriteAll("abcdefgh", 8);
    buffer.SetDirtyBounds(5, 6);
    buffer.Seek(2);
    buffer.CopyIn("", 0);
    EXPECT_EQ(buffer.GetDirtyBegin(), 5U);
    buffer.CopyIn("x", 1);
    EXPECT_EQ(buffer.GetDirtyBegin(), 2U);

    buffer.SetDirtyBounds(8, 8);
    buffer.SeekEnd();
    EXPECT_EQ(buffer.BinioWriteSome("", 0), 0U);
    EXPECT_EQ(buffer.GetCapacity(), 4096U) << "it grows by nothing, up to a page";
    buffer.Seek(3);
    EXPECT_EQ(buffer.BinioWriteSome("", 0), 0U);
    EXPECT_EQ(buffer.GetDirtyBegin(), 8U);
    buffer.Seek(0);
    EXPECT_EQ(ReadSomeText(buffer, 9), "abxdefgh");
}

TEST(Buffer, SetStateChecksEachInvariant)
{
    char block[] = "12345678";
    Buffer buffer(block, 8);
    buffer.SetState(2, 6, 1, 4);
    const State before(buffer);
    const auto bad = [&](std::uint64_t offset, std::uint64_t end, std::uint64_t dirtyBegin,
                         std::uint64_t dirtyEnd) {
        return ThrowsInvalidArgument("Buffer::SetState: bad args",
                                     [&] { buffer.SetState(offset, end, dirtyBegin, dirtyEnd); });
    };
    EXPECT_TRUE(bad(7, 6, 0, 0));
    EXPECT_TRUE(bad(0, 9, 0, 0));
    EXPECT_TRUE(bad(0, 6, 3, 2));
    EXPECT_TRUE(bad(0, 6, 3, 7));
    EXPECT_TRUE(bad(kLargest, kLargest, kLargest, kLargest));
    EXPECT_TRUE(State(buffer) == before);
}

TEST(Buffer, SettersCheckTheInvariants)
{
    char block[] = "12345678";
    Buffer buffer(block, 8);
    buffer.SetState(2, 6, 1, 4);
    const State before(buffer);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad endOfData param", [&] { buffer.SetEndOfData(1); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad endOfData param", [&] { buffer.SetEndOfData(3); }))
        << "below the dirty end";
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad endOfData param", [&] { buffer.SetEndOfData(9); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] { buffer.SetOffset(7); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] { buffer.Seek(7); }));
    EXPECT_TRUE(
        ThrowsRuntimeError("Buffer: bad dirty bounds", [&] { buffer.SetDirtyBounds(3, 2); }));
    EXPECT_TRUE(
        ThrowsRuntimeError("Buffer: bad dirty bounds", [&] { buffer.SetDirtyBounds(3, 7); }));
    EXPECT_TRUE(State(buffer) == before);
    buffer.SetEndOfData(4);
    buffer.SetOffset(4);
    buffer.SetDirtyBounds(4, 4);
    EXPECT_EQ(buffer.GetEndOfData(), 4U);
}

TEST(Buffer, AttachWrapsAnotherBlock)
{
    char block[] = "1234";
    Buffer buffer(100);
    buffer.WriteAll("abc", 3);
    buffer.Attach(block, 4);
    EXPECT_FALSE(buffer.IsOwned());
    EXPECT_FALSE(buffer.IsGrowable());
    EXPECT_EQ(buffer.GetOffset(), 0U);
    EXPECT_EQ(buffer.GetDirtyEnd(), 0U);
    EXPECT_EQ(buffer.GetCapacity(), 4U);
    EXPECT_EQ(ReadSomeText(buffer, 9), "1234");
}

TEST(Buffer, AttachOfANullBlockIsAFailedRequirement)
{
    static std::string told;
    told.clear();
    const FailureHandler before = SetFailureHandler([](const char* text) { told = text; });
    Buffer buffer(100);
    buffer.WriteAll("abc", 3);
    std::string thrown;
    try {
        buffer.Attach(nullptr, 5);
    } catch (const std::runtime_error& error) {
        thrown = error.what();
    }
    EXPECT_THAT(thrown, testing::EndsWith("): Failed requirement: buf != NULL"));
    EXPECT_EQ(told, thrown);
    EXPECT_FALSE(buffer.IsOpen()) << "the old block is gone";
    EXPECT_TRUE(State(buffer) == State(Buffer(nullptr, 0)));
    EXPECT_FALSE(buffer.IsOwned());

    Buffer kept(100);
    kept.WriteAll("abc", 3);
    EXPECT_THROW(kept.Attach(nullptr, 0), std::runtime_error);
    EXPECT_EQ(kept.GetEndOfData(), 3U);
    EXPECT_TRUE(kept.IsOpen());
    SetFailureHandler(before);
}

TEST(Buffer, GrowRoundsUpToWholePages)
{
    Buffer buffer(4095);
    buffer.Grow(0);
    EXPECT_EQ(buffer.GetCapacity(), 4096U);
    buffer.Grow(0);
    EXPECT_EQ(buffer.GetCapacity(), 4096U);
    buffer.Grow(1);
    EXPECT_EQ(buffer.GetCapacity(), 8192U);
    buffer.Grow(4096);
    EXPECT_EQ(buffer.GetCapacity(), 12288U);
}

TEST(Buffer, GrowKeepsTheDataAndPositions)
{
    Buffer buffer(6);
    buffer.WriteAll("abcdef", 6);
    buffer.Seek(2);
    buffer.Grow(1);
    EXPECT_EQ(buffer.GetDirtyEnd(), 6U);
    EXPECT_EQ(ReadSomeText(buffer, 9), "cdef");
}

TEST(Buffer, GrowOfAFixedBufferFails)
{
    char block[] = "1234";
    Buffer buffer(block, 4);
    EXPECT_TRUE(ThrowsRuntimeError("not IsGrowable", [&] { buffer.Grow(1); }));
    EXPECT_TRUE(ThrowsRuntimeError("not IsGrowable", [&] { buffer.Grow(kLargest); }));
}

TEST(Buffer, SetCapacityNeedsOwnershipOnlyForAChange)
{
    char block[] = "1234";
    Buffer wrapped(block, 4);
    wrapped.SetCapacity(4);
    EXPECT_TRUE(ThrowsRuntimeError(kOwnership, [&] { wrapped.SetCapacity(5); }));
    EXPECT_TRUE(ThrowsRuntimeError(kOwnership, [&] { wrapped.SetCapacity(3); }));
    EXPECT_TRUE(ThrowsRuntimeError(kOwnership, [&] { wrapped.RequireOwnership(); }));
    Buffer(1).RequireOwnership();
}

TEST(Buffer, SetCapacityIsExact)
{
    Buffer buffer(100);
    buffer.WriteAll("abcdef", 6);
    buffer.Seek(1);
    EXPECT_TRUE(ThrowsRuntimeError("shrinking Buffer would invalidate data",
                                   [&] { buffer.SetCapacity(5); }));
    EXPECT_EQ(buffer.GetCapacity(), 100U);
    buffer.SetCapacity(6);
    EXPECT_EQ(buffer.GetCapacity(), 6U);
    buffer.SetCapacity(1001);
    EXPECT_EQ(buffer.GetCapacity(), 1001U);
    EXPECT_EQ(ReadSomeText(buffer, 9), "bcdef");
}

TEST(Buffer, SeekRelative)
{
    Buffer buffer(100);
    buffer.WriteAll("abcdef", 6);
    buffer.SeekRelative(-6);
    EXPECT_EQ(buffer.Tell(), 0U);
    EXPECT_TRUE(
        ThrowsRuntimeError("Buffer: offset would be negative", [&] { buffer.SeekRelative(-1); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: offset would be negative", [&] {
        buffer.SeekRelative(std::numeric_limits<std::int64_t>::min());
    }));
    buffer.SeekRelative(6);
    buffer.SeekRelative(0);
    EXPECT_EQ(buffer.Tell(), 6U);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] { buffer.SeekRelative(1); }));
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param", [&] {
        buffer.SeekRelative(std::numeric_limits<std::int64_t>::max());
    }));
    EXPECT_EQ(buffer.Tell(), 6U);
}

TEST(Buffer, SeekRelativePast64BitsNamesTheEnd)
{
    // No allocation is this long; only the bounds are checked.
    char byte = 0;
    Buffer buffer(&byte, kLargest);
    buffer.Seek(kLargest - 5);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: seek past EOF", [&] { buffer.SeekRelative(6); }));
    buffer.SeekRelative(5);
    EXPECT_EQ(buffer.Tell(), kLargest);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: seek past EOF", [&] { buffer.SeekRelative(1); }));
}

TEST(Buffer, SeekRelativeGoesThroughTheVirtualSeek)
{
    class Watched : public Buffer {
    public:
        using Buffer::Buffer;
        std::uint64_t fSeen = 0;

    protected:
        void DoSeek(std::uint64_t position) override
        {
            fSeen = position;
            Buffer::DoSeek(position);
        }
    };
    char block[] = "1234";
    Watched buffer(block, 4);
    buffer.SeekRelative(3);
    EXPECT_EQ(buffer.fSeen, 3U);
}

TEST(Buffer, SeekEndGoesToTheEndOfData)
{
    Buffer buffer(100);
    buffer.WriteAll("abcdef", 6);
    buffer.Seek(0);
    buffer.SeekEnd();
    EXPECT_EQ(buffer.Tell(), 6U);
}

TEST(Buffer, SetEOFCutsDataAndBlock)
{
    Buffer buffer(100);
    buffer.WriteAll("abcdef", 6);
    buffer.SetDirtyBounds(5, 6);
    buffer.Seek(4);
    buffer.SetEOF();
    EXPECT_EQ(buffer.GetEndOfData(), 4U);
    EXPECT_EQ(buffer.GetCapacity(), 4U);
    EXPECT_EQ(buffer.GetDirtyBegin(), 4U);
    EXPECT_EQ(buffer.GetDirtyEnd(), 4U);
    buffer.Seek(0);
    EXPECT_EQ(ReadSomeText(buffer, 9), "abcd");
    buffer.WriteAll("xy", 2);
    EXPECT_EQ(buffer.GetCapacity(), 4096U);
}

TEST(Buffer, SetEOFAtCapacityDoesNothing)
{
    char block[] = "1234";
    Buffer wrapped(block, 4);
    wrapped.SeekEnd();
    const State before(wrapped);
    wrapped.SetEOF();
    EXPECT_TRUE(State(wrapped) == before);
}

TEST(Buffer, SetEOFNeedsOwnership)
{
    char block[] = "1234";
    Buffer wrapped(block, 4);
    wrapped.Seek(2);
    const State before(wrapped);
    EXPECT_TRUE(ThrowsRuntimeError(kOwnership, [&] { wrapped.SetEOF(); }));
    EXPECT_TRUE(State(wrapped) == before);
}

TEST(Buffer, SetEOFAtTheStartLeavesAnOpenEmptyBuffer)
{
    Buffer buffer(10);
    buffer.WriteAll("abc", 3);
    buffer.Seek(0);
    buffer.SetEOF();
    EXPECT_TRUE(buffer.IsOpen());
    EXPECT_EQ(buffer.GetCapacity(), 0U);
    buffer.WriteAll("z", 1);
    buffer.Seek(0);
    EXPECT_EQ(ReadSomeText(buffer, 9), "z");
}

} // namespace
