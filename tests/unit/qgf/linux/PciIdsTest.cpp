#include "qgf/qgf_core/linux/PciIds.h"

#include <gtest/gtest.h>
#include <pciaccess.h>

#include "qgf/Core.h"
#include "qgf/SystemFiles.h"
#include "support/AdapterTree.h"

namespace QGF {
namespace {

const char kText[] = "# comment\n"
                     "\n"
                     "0014  Before\n"
                     "\t744c  Another vendor's\n"
                     "1002  Advanced Micro Devices, Inc. [AMD/ATI]\n"
                     "\t744b  Before\n"
                     "\t\t744c 0001  A subsystem, not a device\n"
                     "\t744c  Navi 31 [Radeon RX 7900 XT/7900 XTX]\n"
                     "1003  After\n"
                     "\t744d  After\n"
                     "C 03  Display controller\n"
                     "\t00  VGA compatible controller\n";

TEST(PciIdsTest, ANameConsistsOfVendorAndDevice)
{
    EXPECT_EQ(FindPciName(kText, 0x1002, 0x744C),
              "Advanced Micro Devices, Inc. [AMD/ATI] Navi 31 [Radeon RX 7900 XT/7900 XTX]");
}

TEST(PciIdsTest, ABlankFollowsAnId)
{
    const std::string text = "1002x  Wrong\n1002 \n10020 Wrong\n1002 A vendor  \r\n"
                             "\t744cx  Wrong\n\t744c    A card \r\n";
    EXPECT_EQ(FindPciName(text, 0x1002, 0x744C), "A vendor A card");
}

TEST(PciIdsTest, AnUnknownDeviceHasNoName)
{
    EXPECT_EQ(FindPciName(kText, 0x1002, 0x744D), "");
    EXPECT_EQ(FindPciName(kText, 0x1002, 0x0001), "");
}

TEST(PciIdsTest, AnUnknownVendorHasNoName)
{
    EXPECT_EQ(FindPciName(kText, 0xFFFF, 0x744C), "");
}

TEST(PciIdsTest, DeviceClassesAreNoVendors)
{
    EXPECT_EQ(FindPciName("c003  Display\n\t0000  VGA\n", 0xC003, 0), "Display VGA");
    EXPECT_EQ(FindPciName("C 03  Display\n\t0000  VGA\n", 0xC003, 0), "");
}

TEST(PciIdsTest, LineEndsAndBlanksAreTrimmed)
{
    EXPECT_EQ(FindPciName("1002  A \r\n\t744c  B \r\n", 0x1002, 0x744C), "A B");
    EXPECT_EQ(FindPciName("1002  A\n\t744c  B", 0x1002, 0x744C), "A B");
}

TEST(PciIdsTest, CommentsAndEmptyLinesEndNoVendor)
{
    EXPECT_EQ(FindPciName("1002  A\n\n# text\n#\n\t744b  C\n\t744c  B\n", 0x1002, 0x744C), "A B");
}

TEST(PciIdsTest, TruncatedTextsHaveNoName)
{
    const std::string text = "1002  A\n\t744c  B\n";
    for (std::size_t length = 0; length + 2 < text.size(); ++length)
        EXPECT_EQ(FindPciName(text.substr(0, length), 0x1002, 0x744C), "") << length;
}

TEST(PciIdsTest, TheDatabaseIsReadFromEitherPath)
{
    const AdapterTree tree("empty");
    tree.remove("/usr");
    EXPECT_EQ(PciIds().name(0x1002, 0x744C), "");
    tree.write("/usr/share/misc/pci.ids", kText);
    EXPECT_NE(PciIds().name(0x1002, 0x744C), "");
    tree.write("/usr/share/hwdata/pci.ids", "1002  A\n\t744c  B\n");
    EXPECT_EQ(PciIds().name(0x1002, 0x744C), "A B");
}

TEST(PciIdsTest, TheDatabaseIsReadUpTo16MiB)
{
    const AdapterTree tree("empty");
    tree.remove("/usr");
    const std::string entry = "\n1002  A\n\t744c  B";
    const std::size_t most = 16 * 1024 * 1024;
    const std::string comment = "#" + std::string(most - entry.size() - 1, 'x');
    tree.write("/usr/share/misc/pci.ids", comment + entry);
    EXPECT_EQ(PciIds().name(0x1002, 0x744C), "A B");
    tree.write("/usr/share/misc/pci.ids", comment + "x" + entry);
    EXPECT_EQ(PciIds().name(0x1002, 0x744C), "");
}

// libpciaccess and FindPciName must return the same names.
TEST(PciIdsTest, TheLibraryAndTheTextAgree)
{
    std::string database;
    if (!ReadSystemFile("/usr/share/misc/pci.ids", database, std::size_t{16} << 20))
        GTEST_SKIP() << "no PCI id database on this machine";
    const char* const names[] = {"libpciaccess.so.0", nullptr};
    try {
        Core::OpenLibrary(names);
    } catch (const LogicalException&) {
        GTEST_SKIP() << "no libpciaccess on this machine";
    }
    int named = 0;
    PciIds ids;
    const std::uint16_t vendors[] = {0x1002, 0x10DE, 0x8086, 0x1AF4, 0x1A03};
    for (const std::uint16_t vendor : vendors) {
        for (unsigned device = 0; device < 0x10000; device += 0x135) {
            const auto id = static_cast<std::uint16_t>(device);
            const std::string name = ids.name(vendor, id);
            EXPECT_EQ(name, FindPciName(database, vendor, id));
            named += name.empty() ? 0 : 1;
        }
    }
    EXPECT_GT(named, 10);
}

} // namespace
} // namespace QGF
