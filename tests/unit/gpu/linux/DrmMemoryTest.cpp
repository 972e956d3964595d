#include "linux/gpu/DrmMemory.h"

#include <cstring>

#include <drm.h>
#include <gtest/gtest.h>
#include <i915_drm.h>
#include <radeon_drm.h>

#include "linux/gpu/DriverStructures.h"

namespace pmutil {
namespace {

constexpr std::uint64_t kGiB = std::uint64_t{1} << 30;

template <typename Structure>
std::string Bytes(const Structure& structure)
{
    return std::string(reinterpret_cast<const char*>(&structure), sizeof structure);
}

std::string I915Region(std::uint16_t memoryClass, std::uint64_t size)
{
    drm_i915_memory_region_info region{};
    region.region.memory_class = memoryClass;
    region.probed_size = size;
    return Bytes(region);
}

std::string I915Head(std::uint32_t count)
{
    drm_i915_query_memory_regions head{};
    head.num_regions = count;
    return Bytes(head);
}

std::string XeRegionOf(std::uint16_t memoryClass, std::uint64_t size)
{
    XeRegion region{};
    region.mem_class = memoryClass;
    region.total_size = size;
    return Bytes(region);
}

std::string XeHead(std::uint32_t count)
{
    XeRegionsHead head{};
    head.num_mem_regions = count;
    return Bytes(head);
}

TEST(DrmMemoryTest, I915DeviceRegionsAreDedicated)
{
    EXPECT_EQ(
        ParseDedicatedMemory("i915", I915Head(2) + I915Region(0, 32 * kGiB) + I915Region(1, 4)),
        4U);
    EXPECT_EQ(ParseDedicatedMemory("i915", I915Head(3) + I915Region(0, 32 * kGiB) +
                                               I915Region(1, kGiB) + I915Region(1, kGiB)),
              2 * kGiB);
}

TEST(DrmMemoryTest, XeVramRegionsAreDedicated)
{
    EXPECT_EQ(ParseDedicatedMemory("xe", XeHead(3) + XeRegionOf(0, 32 * kGiB) +
                                             XeRegionOf(1, kGiB) + XeRegionOf(1, kGiB)),
              2 * kGiB);
}

TEST(DrmMemoryTest, SystemMemoryOnlyIsZero)
{
    EXPECT_EQ(ParseDedicatedMemory("i915", I915Head(1) + I915Region(0, 32 * kGiB)), 0U);
    EXPECT_EQ(ParseDedicatedMemory("xe", XeHead(1) + XeRegionOf(0, 32 * kGiB)), 0U);
}

TEST(DrmMemoryTest, RadeonAndNouveauReportOneFigure)
{
    drm_radeon_gem_info info{};
    info.vram_size = 2 * kGiB;
    info.vram_visible = kGiB;
    EXPECT_EQ(ParseDedicatedMemory("radeon", Bytes(info)), 2 * kGiB);
    NouveauParameter parameter{};
    parameter.param = kNouveauFbSize;
    parameter.value = 6 * kGiB;
    EXPECT_EQ(ParseDedicatedMemory("nouveau", Bytes(parameter)), 6 * kGiB);
    parameter.param = kNouveauFbSize + 1;
    EXPECT_FALSE(ParseDedicatedMemory("nouveau", Bytes(parameter)));
}

TEST(DrmMemoryTest, ATruncatedAnswerIsRejected)
{
    const std::string whole = I915Head(2) + I915Region(0, kGiB) + I915Region(1, kGiB);
    for (std::size_t length = 0; length != whole.size(); ++length)
        EXPECT_FALSE(ParseDedicatedMemory("i915", whole.substr(0, length))) << length;
    EXPECT_FALSE(ParseDedicatedMemory("xe", XeHead(1)));
    EXPECT_FALSE(ParseDedicatedMemory("radeon", std::string(23, '\1')));
    EXPECT_FALSE(ParseDedicatedMemory("nouveau", std::string(15, '\1')));
    EXPECT_FALSE(ParseDedicatedMemory("i915", I915Head(0xFFFFFFFFU) + I915Region(1, kGiB)));
}

TEST(DrmMemoryTest, NoRegionsAndOverflowAreRejected)
{
    EXPECT_FALSE(ParseDedicatedMemory("i915", I915Head(0)));
    EXPECT_FALSE(ParseDedicatedMemory("xe", XeHead(0)));
    EXPECT_FALSE(ParseDedicatedMemory("xe", XeHead(2) + XeRegionOf(1, ~std::uint64_t{0}) +
                                                XeRegionOf(1, 1)));
}

TEST(DrmMemoryTest, OtherDriversAreUnknown)
{
    EXPECT_FALSE(ParseDedicatedMemory("amdgpu", std::string(100, '\1')));
    EXPECT_FALSE(ParseDedicatedMemory("", ""));
}

const char kNothing[] = "0x0000000000000000 0x0000000000000000 0x0000000000000000\n";

TEST(DrmMemoryTest, TheLargestPrefetchableBarCounts)
{
    EXPECT_EQ(LargestPrefetchableBar(std::string("0x00000000fb000000 0x00000000fbffffff "
                                                 "0x0000000000140204\n") +
                                     kNothing +
                                     "0x0000006000000000 0x00000063ffffffff 0x000000000014220c\n"
                                     "0x0000000000000000 0x000000000fffffff 0x000000000014220c\n"),
              16 * kGiB);
}

TEST(DrmMemoryTest, OtherRangesAreIgnored)
{
    EXPECT_EQ(LargestPrefetchableBar(""), 0U);
    EXPECT_EQ(LargestPrefetchableBar(kNothing), 0U);
    // Of one byte, and of a size that 64 bits hold.
    EXPECT_EQ(LargestPrefetchableBar("0x1 0x1 0x220c\n"), 0U);
    EXPECT_EQ(LargestPrefetchableBar("0x1 0x2 0x220c\n"), 2U);
    EXPECT_EQ(LargestPrefetchableBar("0x1 0xfffffffffffffffe 0x220c\n"), 0xFFFFFFFFFFFFFFFEU);
    // Registers and ports.
    EXPECT_EQ(LargestPrefetchableBar("0x0 0x3fffffff 0x140204\n0x0 0xff 0x40101\n"), 0U);
    // The lines after the sixth are the ROM and the BARs of virtual functions.
    std::string lines;
    for (int i = 0; i != 6; ++i)
        lines += kNothing;
    EXPECT_EQ(LargestPrefetchableBar(lines + "0x0 0x3fffffff 0x14220c\n"), 0U);
    for (const char* broken : {"0x0\n", "0x0 0x1000 what\n", "0x2 0x1 0x220c\n", "\n\n\n", "x x x",
                               "0x0 0xffffffffffffffff 0x220c"})
        EXPECT_EQ(LargestPrefetchableBar(broken), 0U) << broken;
}

} // namespace
} // namespace pmutil
