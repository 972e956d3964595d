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
    EXPECT_EQ(ReadKernelRecord("6,,1000000,-;x"), "[    1.000000] x");
    EXPECT_EQ(ReadKernelRecord("6,1,999999;"), "[    0.999999] ");
    for (const char* const other : {"", "text", ";", "6;x", "6,1;x", "6,1,x,-;x", "6,1,;x",
                                    "6,1;7,8", "6,1,99999999999999999999,-;x"})
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

TEST(KernelMessages, EachDriverAndSubsystemIsFoundByItsName)
{
    for (const char* const name :
         {"drm",       "radeon", "i915",     "intel_fb", "nouveau",     "nvidia",
          "nvrm",      "vgaarb", "vga ",     "gpu",      "kfd",         "vmwgfx",
          "vboxvideo", "qxl",    "mgag200",  "simplefb", "efifb",       "framebuffer",
          "panfrost",  "lima",   "etnaviv",  "msm_dpu",  "v3d",         "vc4",
          "tegra",     "asahi",  "xe 0000:", " assay[",  "assay-worker"}) {
        const std::string text = name;
        EXPECT_TRUE(IsGraphicsMessage("[1] " + text + " x")) << text;
        // One letter less, or another one, is another word.
        for (std::size_t at = 0; at < text.size(); ++at) {
            std::string other = text;
            other[at] = '~';
            EXPECT_FALSE(IsGraphicsMessage("[1] " + other + " x")) << other;
            other.erase(at, 1);
            EXPECT_FALSE(IsGraphicsMessage("[1]" + other + "~")) << other;
        }
    }
}

TEST(KernelMessages, TheCaseOfLettersDoesNotMatter)
{
    EXPECT_TRUE(IsGraphicsMessage("ASAHI"));
    EXPECT_TRUE(IsGraphicsMessage("VBoxVideo"));
    EXPECT_TRUE(IsGraphicsMessage("[1] ASSAY[2]"));
}

TEST(KernelMessages, OnlyTheLastAreKept)
{
    std::vector<std::string> lines;
    for (std::size_t line = 0; line < 2 * kMaxKernelLines; ++line)
        lines.push_back((line % 4 == 0 ? "usb " : "drm ") + std::to_string(line));
    const std::vector<std::string> kept = SelectGraphicsMessages(lines);
    EXPECT_EQ(kept.size(), 2000U);
    EXPECT_EQ(kept.back(), lines.back());
    // All that are kept are the last of those about graphics.
    std::vector<std::string> graphics;
    for (const std::string& line : lines)
        if (line.rfind("drm", 0) == 0)
            graphics.push_back(line);
    EXPECT_EQ(kept, std::vector<std::string>(graphics.end() - 2000, graphics.end()));
    EXPECT_EQ(SelectGraphicsMessages({"gpu 1", "usb", "gpu 2"}),
              (std::vector<std::string>{"gpu 1", "gpu 2"}));
    EXPECT_EQ(SelectGraphicsMessages({"usb"}).size(), 0U);
}

} // namespace
} // namespace assay_host
