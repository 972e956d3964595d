#include "qgf/qgf_core/linux/PciAddress.h"

#include <gtest/gtest.h>

namespace QGF {
namespace {

TEST(PciAddressTest, AcceptsAddresses)
{
    for (const char* text : {"0000:01:00.0", "0000:ff:1f.7", "10000:e1:00.0", "deadbeef:00:02.0"})
        EXPECT_TRUE(IsPciAddress(text)) << text;
}

TEST(PciAddressTest, RejectsOtherTexts)
{
    for (const char* text :
         {"", "0000", "01:00.0", "000:01:00.0", "0000:01:00.8", "0000:01:00.x", "0000:0G:00.0",
          "0000:01:00:0", "0000-01:00.0", "0000:01:00.0 ", "123456789:01:00.0", "pci0000:00"})
        EXPECT_FALSE(IsPciAddress(text)) << text;
}

} // namespace
} // namespace QGF
