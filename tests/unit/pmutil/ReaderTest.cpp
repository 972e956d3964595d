#include "pmutil/Reader.h"

#include <functional>

#include <gmock/gmock.h>

#include "FakeChannel.h"
#include "Throws.h"
#include "pmutil/Buffer.h"

using testing::ElementsAre;
using testing::IsEmpty;

namespace {

std::string ReadSomeText(pmutil::Reader& reader, std::size_t most)
{
    std::string text(most, '?');
    text.resize(reader.ReadSome(text.data(), most));
    return text;
}

TEST(Reader, ReadSomeOfNothingDoesNotTouchTheSource)
{
    FakeChannel source;
    source.fPieces = {"abc"};
    EXPECT_EQ(source.ReadSome(nullptr, 0), 0U);
    EXPECT_TRUE(source.ReadAll(nullptr, 0));
    EXPECT_THAT(source.fCalls, IsEmpty());
}

TEST(Reader, ReadSomeGivesZeroAtTheEnd)
{
    FakeChannel source;
    source.fPieces = {"abc"};
    EXPECT_EQ(ReadSomeText(source, 10), "abc");
    EXPECT_EQ(ReadSomeText(source, 10), "");
}

TEST(Reader, ReadAllPutsPiecesTogether)
{
    FakeChannel source;
    source.fPieces = {"ab", "cd", "efg"};
    std::string text(6, '?');
    EXPECT_TRUE(source.ReadAll(text.data(), 6));
    EXPECT_EQ(text, "abcdef");
    EXPECT_EQ(ReadSomeText(source, 10), "g");
}

TEST(Reader, ReadAllThatComesShortLosesNothing)
{
    FakeChannel source;
    source.fPieces = {"ab", "cd"};
    char bytes[10];
    EXPECT_FALSE(source.ReadAll(bytes, 10));
    EXPECT_THAT(source.fCalls, ElementsAre("read 10", "read 8", "read 6", "unread 4"));
    EXPECT_EQ(ReadSomeText(source, 10), "abcd");
    EXPECT_EQ(ReadSomeText(source, 10), "");
}

TEST(Reader, ReadAllThatComesShortCanBeRepeated)
{
    FakeChannel source;
    source.fPieces = {"abcd"};
    char bytes[10];
    EXPECT_FALSE(source.ReadAll(bytes, 10));
    EXPECT_FALSE(source.ReadAll(bytes, 10));
    EXPECT_TRUE(source.ReadAll(bytes, 4));
    EXPECT_EQ(std::string(bytes, 4), "abcd");
}

TEST(Reader, ReadAllOnAnEmptySourcePutsNothingBack)
{
    FakeChannel source;
    char bytes[10];
    EXPECT_FALSE(source.ReadAll(bytes, 10));
    EXPECT_THAT(source.fCalls, ElementsAre("read 10"));
}

TEST(Reader, PushbackComesAloneAndFirst)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    source.Unread("abc", 3);
    EXPECT_EQ(ReadSomeText(source, 5), "abc");
    EXPECT_THAT(source.fCalls, ElementsAre("unread 3"));
    EXPECT_EQ(ReadSomeText(source, 5), "xyz");
    EXPECT_THAT(source.fCalls, ElementsAre("unread 3", "read 5"));
}

TEST(Reader, PushbackIsDrainedBitByBit)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    source.Unread("abc", 3);
    EXPECT_EQ(ReadSomeText(source, 2), "ab");
    EXPECT_EQ(ReadSomeText(source, 2), "c");
    EXPECT_EQ(ReadSomeText(source, 2), "xy");
}

TEST(Reader, ReadAllGoesOnFromPushbackToTheSource)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    source.Unread("abc", 3);
    std::string text(5, '?');
    EXPECT_TRUE(source.ReadAll(text.data(), 5));
    EXPECT_EQ(text, "abcxy");
}

TEST(Reader, UnreadReplacesEarlierPushback)
{
    FakeChannel source;
    source.Unread("abc", 3);
    source.Unread("de", 2);
    EXPECT_EQ(ReadSomeText(source, 5), "de");
    EXPECT_EQ(ReadSomeText(source, 5), "");
}

TEST(Reader, PushbackOfAnotherPlaceIsForgotten)
{
    const std::function<void(FakeChannel&)> moves[] = {
        [](FakeChannel& source) { source.Seek(5); },
        [](FakeChannel& source) { source.SeekRelative(-1); },
        [](FakeChannel& source) { source.SeekEnd(); },
        [](FakeChannel& source) {
            source.Close();
            source.fOpen = true;
        },
    };
    for (const auto& move : moves) {
        FakeChannel source;
        source.fPieces = {"new"};
        source.Unread("old", 3);
        move(source);
        EXPECT_EQ(ReadSomeText(source, 9), "new");
    }
}

TEST(Reader, PushbackOfAnotherTargetIsForgotten)
{
    FakeChannel first;
    FakeChannel second;
    second.fPieces = {"second"};
    pmutil::RandomAccess channel(&first);
    channel.Unread("first", 5);
    channel.SetRandomAccess(&first, false);
    EXPECT_EQ(ReadSomeText(channel, 2), "fi");
    channel.SetRandomAccess(&second, false);
    EXPECT_EQ(ReadSomeText(channel, 9), "second");
}

TEST(Reader, PushbackOutlivesASeekThatFails)
{
    pmutil::Buffer source(3);
    source.Unread("old", 3);
    EXPECT_ANY_THROW(source.Seek(9));
    EXPECT_EQ(ReadSomeText(source, 9), "old");
}

TEST(Reader, EmptyPushbackGoesStraightOnToTheSource)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    source.Unread(nullptr, 0);
    EXPECT_EQ(ReadSomeText(source, 5), "xyz");
    EXPECT_THAT(source.fCalls, ElementsAre("unread 0", "read 5"));
}

TEST(Reader, MoreThanAskedIsALogicErrorInBothReads)
{
    FakeChannel source;
    source.fExcess = 1;
    char bytes[4];
    EXPECT_TRUE(
        ThrowsLogicError("read returned more than asked", [&] { source.ReadSome(bytes, 4); }));
    EXPECT_TRUE(
        ThrowsLogicError("read returned more than asked", [&] { source.ReadAll(bytes, 4); }));
}

TEST(Reader, ReadByteGivesTheByteOrAllOnes)
{
    FakeChannel source;
    source.fPieces = {"\xFF"};
    EXPECT_EQ(source.ReadOneByte(), 0xFFU);
    EXPECT_EQ(source.ReadOneByte(), 0xFFFFFFFFU);
    source.Unread("b", 1);
    EXPECT_EQ(source.ReadOneByte(), 0x62U);
}

TEST(Reader, SourceFailurePassesToTheCaller)
{
    class Failing : public FakeChannel {
        std::uint64_t BinioReadSome(void*, std::uint64_t) override
        {
            throw std::runtime_error("cable pulled");
        }
    };
    Failing source;
    char bytes[4];
    EXPECT_TRUE(ThrowsRuntimeError("cable pulled", [&] { source.ReadSome(bytes, 4); }));
    EXPECT_TRUE(ThrowsRuntimeError("cable pulled", [&] { source.ReadAll(bytes, 4); }));
}

} // namespace
