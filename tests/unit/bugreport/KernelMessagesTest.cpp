#include <gtest/gtest.h>

#include "bugreport/KernelLog.h"

namespace assay_host {
namespace {

TEST(KernelMessages, AreReadFromRecords)
{
    EXPECT_EQ(ReadKernelRecord("6,339,5140900,-;NET: Registered\n SUBSYSTEM=net\n"),
              "[    5.140900] NET: Registered");
    EXPECT_EQ(ReadKernelRecord("4,1,12345000001,c;a;b"), "[12345.000001] a;b");
    EXPECT_EQ(ReadKernelRecord("30,340,7,-,caller=T1;x"), "[    0.000007] x");
    for (const char* const other : {"", "text", ";", "6;x", "6,1;x", "6,1,x,-;x"})
        EXPECT_EQ(ReadKernelRecord(other), "") << other;
}

TEST(KernelMessages, AboutGraphics)
{
    for (const char* const line :
         {"[    1.000000] [drm] Initialized i915", "amdgpu 0000:03:00.0: ring gfx timeout",
          "NVRM: Xid (PCI:0000:01:00): 79, GPU has fallen off the bus.",
          "pci 0000:00:02.0: vgaarb: setting as boot VGA device", "simple-framebuffer: fb0",
          "[    9.000000] assay[123]: segfault at 0 ip 00007f", "xe 0000:00:02.0: GT0: reset"})
        EXPECT_TRUE(IsGraphicsMessage(line)) << line;
    for (const char* const line :
         {"usb 1-1: new device", "EXT4-fs (sda1): mounted", "audit: type=1400", ""})
        EXPECT_FALSE(IsGraphicsMessage(line)) << line;
}

TEST(KernelMessages, OnlyTheLastAreKept)
{
    std::vector<std::string> lines;
    for (std::size_t line = 0; line < 2 * kMaxKernelLines; ++line)
        lines.push_back((line % 4 == 0 ? "usb " : "drm ") + std::to_string(line));
    const std::vector<std::string> kept = SelectGraphicsMessages(lines);
    EXPECT_EQ(kept.size(), kMaxKernelLines);
    EXPECT_EQ(kept.back(), lines.back());
    EXPECT_EQ(SelectGraphicsMessages({"usb"}).size(), 0U);
}

} // namespace
} // namespace assay_host
