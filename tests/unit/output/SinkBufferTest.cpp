#include "output/SinkBuffer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::size_t kBlock = 65536;

class SinkBufferTest : public testing::Test {
protected:
    // The sizes of the blocks so far.
    std::vector<std::size_t> GetSizes() const
    {
        std::vector<std::size_t> sizes;
        for (const std::string& block : fBlocks)
            sizes.push_back(block.size());
        return sizes;
    }

    std::vector<std::string> fBlocks;
    SinkBuffer fBuffer{[this](std::string_view block) { fBlocks.emplace_back(block); }};
    std::ostream fOut{&fBuffer};
};

TEST_F(SinkBufferTest, KeepsTheBytesUntilABlockIsFull)
{
    fOut << std::string(kBlock - 1, 'x');
    EXPECT_THAT(fBlocks, IsEmpty());
    fOut.put('y');
    EXPECT_THAT(GetSizes(), ElementsAre(kBlock));
    EXPECT_EQ(fBlocks[0].back(), 'y');
    fOut << std::string(3 * kBlock, 'z');
    EXPECT_THAT(GetSizes(), ElementsAre(kBlock, 3 * kBlock));
}

TEST_F(SinkBufferTest, PassesTheRestWithAFlush)
{
    fOut.flush();
    EXPECT_THAT(fBlocks, IsEmpty());
    fOut << "one" << 2 << '\xFF';
    fOut.put('\0');
    fOut.flush();
    fOut.flush();
    EXPECT_THAT(fBlocks, ElementsAre(std::string("one2\xFF\0", 6)));
    EXPECT_TRUE(fOut);
}

TEST(SinkBuffer, PassesOnWhatTheSinkThrows)
{
    SinkBuffer buffer([](std::string_view) { throw std::runtime_error("full"); });
    std::ostream out(&buffer);
    out.exceptions(std::ios::badbit);
    out << "text";
    EXPECT_THROW(out.flush(), std::runtime_error);
}

} // namespace
} // namespace assay_host
