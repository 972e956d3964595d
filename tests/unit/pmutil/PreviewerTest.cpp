#include "pmutil/Previewer.h"

#include <gmock/gmock.h>

#include "FakeChannel.h"
#include "Throws.h"
#include "pmutil/Buffer.h"

using pmutil::Buffer;
using pmutil::Previewer;
using testing::ElementsAre;

namespace {

template <typename Source>
std::string ReadSomeText(Source& source, std::size_t most)
{
    std::string text(most, '?');
    text.resize(source.ReadSome(text.data(), most));
    return text;
}

TEST(Previewer, PutsBackEverythingItRead)
{
    FakeChannel source;
    source.fPieces = {"abc", "def", "ghi"};
    {
        Previewer preview(source);
        EXPECT_EQ(ReadSomeText(preview, 10), "abc");
        EXPECT_EQ(ReadSomeText(preview, 2), "de");
        preview.End();
    }
    EXPECT_THAT(source.fCalls, ElementsAre("read 10", "read 2", "unread 5"));
    EXPECT_EQ(ReadSomeText(source, 10), "abcde");
    EXPECT_EQ(ReadSomeText(source, 10), "f");
}

TEST(Previewer, PutsNothingBackAcrossASeek)
{
    Buffer source(10);
    source.WriteAll("abcdef", 6);
    source.Seek(0);
    {
        Previewer preview(source);
        EXPECT_EQ(ReadSomeText(preview, 2), "ab");
        source.Seek(4);
        EXPECT_EQ(ReadSomeText(preview, 1), "e");
    }
    EXPECT_EQ(ReadSomeText(source, 9), "f");
    source.Seek(1);
    {
        Previewer preview(source);
        EXPECT_EQ(ReadSomeText(preview, 2), "bc");
    }
    EXPECT_EQ(ReadSomeText(source, 9), "bc");
}

// Continues with a second buffer at the end of the first one.
class Chain : public pmutil::RandomAccess {
public:
    Chain(Buffer& first, Buffer& second) : RandomAccess(&first), fSecond(second) {}

private:
    std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes) override
    {
        const std::uint64_t count = RandomAccess::BinioReadSome(bytes, nbytes);
        if (count > 0)
            return count;
        SetRandomAccess(&fSecond, false);
        return RandomAccess::BinioReadSome(bytes, nbytes);
    }

    Buffer& fSecond;
};

TEST(Previewer, PutsBackWhatASourceReadsAcrossATargetThatItChangesItself)
{
    char one[] = "ab";
    char two[] = "cd";
    Buffer first(one, 2);
    Buffer second(two, 2);
    Chain chain(first, second);
    {
        Previewer preview(chain);
        EXPECT_EQ(ReadSomeText(preview, 9), "ab");
        EXPECT_EQ(ReadSomeText(preview, 9), "cd");
    }
    EXPECT_EQ(ReadSomeText(chain, 9), "abcd");
}

TEST(Previewer, PutsNothingBackAcrossASeekEvenIfTheSourceThenChangesItsTarget)
{
    char one[] = "ab";
    char two[] = "cd";
    Buffer first(one, 2);
    Buffer second(two, 2);
    Chain chain(first, second);
    {
        Previewer preview(chain);
        EXPECT_EQ(ReadSomeText(preview, 2), "ab");
        chain.SeekEnd();
        EXPECT_EQ(ReadSomeText(preview, 1), "c");
    }
    EXPECT_EQ(ReadSomeText(chain, 9), "d");
}

TEST(Previewer, EndsWithItsScope)
{
    FakeChannel source;
    source.fPieces = {"abc"};
    {
        Previewer preview(source);
        ReadSomeText(preview, 10);
    }
    EXPECT_EQ(ReadSomeText(source, 10), "abc");
}

TEST(Previewer, DirectReadsFailMeanwhile)
{
    FakeChannel source;
    source.fPieces = {"abc"};
    char byte = 0;
    Previewer preview(source);
    EXPECT_TRUE(
        ThrowsRuntimeError("direct read while preview active", [&] { source.ReadSome(&byte, 1); }));
    EXPECT_TRUE(
        ThrowsLogicError("direct read while preview active", [&] { source.ReadAll(&byte, 1); }));
    source.fOpen = false;
    EXPECT_TRUE(
        ThrowsRuntimeError("direct read while preview active", [&] { source.ReadSome(&byte, 0); }));
    source.fOpen = true;
    preview.End();
    EXPECT_EQ(source.ReadSome(&byte, 1), 1U);
}

TEST(Previewer, OnlyOneIsActive)
{
    FakeChannel source;
    const Previewer first(source);
    EXPECT_TRUE(
        ThrowsRuntimeError("Reader: Previewer already active", [&] { Previewer second(source); }));
}

TEST(Previewer, StaysActiveWhenAReadThrows)
{
    FakeChannel source;
    Previewer preview(source);
    source.fExcess = 1;
    char byte = 0;
    EXPECT_TRUE(
        ThrowsLogicError("read returned more than asked", [&] { preview.ReadSome(&byte, 1); }));
    source.fExcess = 0;
    EXPECT_TRUE(
        ThrowsRuntimeError("direct read while preview active", [&] { source.ReadSome(&byte, 1); }));
    source.fPieces = {"abc"};
    EXPECT_EQ(ReadSomeText(preview, 3), "abc");
    preview.End();
    EXPECT_EQ(ReadSomeText(source, 3), "abc");
}

TEST(Previewer, MovesBackPushbackThatItOnlyPartlyRead)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    source.Unread("abcd", 4);
    Previewer preview(source);
    EXPECT_EQ(ReadSomeText(preview, 2), "ab");
    EXPECT_EQ(ReadSomeText(preview, 1), "c");
    preview.End();
    // No second notification: the bytes were put back before.
    EXPECT_THAT(source.fCalls, ElementsAre("unread 4"));
    EXPECT_EQ(ReadSomeText(source, 9), "abcd");
    EXPECT_EQ(ReadSomeText(source, 9), "xyz");
}

TEST(Previewer, ReadsBeyondThePushbackAndPutsBoth)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    source.Unread("abcd", 4);
    Previewer preview(source);
    EXPECT_EQ(ReadSomeText(preview, 9), "abcd");
    EXPECT_EQ(ReadSomeText(preview, 2), "xy");
    preview.End();
    EXPECT_EQ(ReadSomeText(source, 9), "abcdxy");
    EXPECT_EQ(ReadSomeText(source, 9), "z");
}

TEST(Previewer, OfNothingPutsNothingBack)
{
    FakeChannel source;
    source.fPieces = {"xyz"};
    {
        const Previewer preview(source);
    }
    EXPECT_EQ(ReadSomeText(source, 9), "xyz");
}

TEST(Previewer, CollectsMoreThanOneBlock)
{
    FakeChannel source;
    std::string all;
    for (int piece = 0; piece < 50; ++piece) {
        source.fPieces.emplace_back(10'000, static_cast<char>('A' + piece));
        all += source.fPieces.back();
    }
    Previewer preview(source);
    std::string seen;
    for (std::string piece = ReadSomeText(preview, 1 << 20); !piece.empty();
         piece = ReadSomeText(preview, 1 << 20))
        seen += piece;
    EXPECT_EQ(seen, all);
    preview.End();
    std::string again(all.size(), '?');
    EXPECT_TRUE(source.ReadAll(again.data(), again.size()));
    EXPECT_EQ(again, all);
}

TEST(Previewer, ReadsAtMost64KiBAtOnce)
{
    FakeChannel source;
    source.fPieces = {std::string(70'000, 'x')};
    Previewer preview(source);
    EXPECT_EQ(ReadSomeText(preview, 1 << 20).size(), 65536U);
    EXPECT_EQ(ReadSomeText(preview, 1 << 20).size(), 4464U);
}

TEST(Previewer, FailsAfterItsEnd)
{
    FakeChannel source;
    Previewer preview(source);
    preview.End();
    preview.End();
    char byte = 0;
    EXPECT_TRUE(
        ThrowsRuntimeError("Previewer: preview ended", [&] { preview.ReadSome(&byte, 1); }));
}

TEST(Previewer, RefusesABufferThatIsNotValid)
{
    FakeChannel source;
    source.fPieces = {"abc"};
    Previewer preview(source);
    auto closed = std::make_unique<Buffer>(4);
    closed->Close();
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: bad offset param",
                                   [&] { source.EndPreview(std::move(closed)); }));
    EXPECT_EQ(ReadSomeText(source, 9), "abc");
}

TEST(Previewer, RefusesMoreThanThePushbackGave)
{
    FakeChannel source;
    source.Unread("abc", 3);
    Previewer preview(source);
    EXPECT_EQ(ReadSomeText(preview, 2), "ab");
    source.Unread("x", 1);
    EXPECT_TRUE(ThrowsRuntimeError("Buffer: offset would be negative", [&] { preview.End(); }));
    EXPECT_EQ(ReadSomeText(source, 9), "x");
}

} // namespace
