// The memory of buffers, by the C library's count of the blocks that are mapped one by one.
#include "pmutil/Buffer.h"

#include <gtest/gtest.h>
#include <malloc.h>

using namespace pmutil;

namespace {

// Above the largest limit from which on a block is mapped by itself (DEFAULT_MMAP_THRESHOLD_MAX).
constexpr std::uint64_t kLarge = std::uint64_t{64} << 20;

class BufferMemory : public testing::Test {
protected:
    void SetUp() override
    {
        const Buffer buffer(kLarge);
        if (CountBlocks() != 1)
            GTEST_SKIP() << "the memory is another library's, which looks for leaks itself";
    }

    // Since the start of the test.
    std::size_t CountBlocks() const { return ::mallinfo2().hblks - fBefore; }

private:
    const std::size_t fBefore = ::mallinfo2().hblks;
};

TEST_F(BufferMemory, IsFreedAtTheEnd)
{
    {
        const Buffer first(kLarge);
        const Buffer second(first); // NOLINT: a copy has memory of its own
        EXPECT_EQ(CountBlocks(), 2U);
    }
    EXPECT_EQ(CountBlocks(), 0U);
}

TEST_F(BufferMemory, IsFreedWhenItIsReplaced)
{
    Buffer buffer(kLarge);
    buffer.SetCapacity(2 * kLarge);
    EXPECT_EQ(CountBlocks(), 1U);
    buffer = Buffer(kLarge);
    EXPECT_EQ(CountBlocks(), 1U);
    char byte = 0;
    buffer.Attach(&byte, 1);
    EXPECT_EQ(CountBlocks(), 0U);
}

TEST_F(BufferMemory, IsFreedByClose)
{
    Buffer buffer(kLarge);
    buffer.Close();
    EXPECT_EQ(CountBlocks(), 0U);
}

} // namespace
