#include "qgf/AdapterName.h"

#include <filesystem>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/AdapterTree.h"

namespace QGF {
namespace {

using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::IsEmpty;

using Texts = std::vector<std::string>;

const char kRadeon[] =
    "/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/0000:02:00.0/0000:03:00.0";
const char kRadeonName[] =
    "Advanced Micro Devices, Inc. [AMD/ATI] Navi 31 [Radeon RX 7900 XT/7900 XTX]";

TEST(AdapterNameTest, AdaptersAreDisplayDevicesInOrder)
{
    const AdapterTree tree("server-bmc");
    EXPECT_THAT(DisplayAdapters(), ElementsAre("0000:02:00.0", "0000:41:00.0", "0000:81:00.0"));
}

TEST(AdapterNameTest, OtherFunctionsOfACardAreNotAdapters)
{
    const AdapterTree tree("amd-discrete");
    EXPECT_THAT(DisplayAdapters(), ElementsAre("0000:03:00.0"));
}

TEST(AdapterNameTest, ADeviceOfAnotherClassWithADrmNodeIsAnAdapter)
{
    const AdapterTree tree("amd-discrete");
    tree.write(std::string(kRadeon) + "/class", "0x120000\n");
    EXPECT_THAT(DisplayAdapters(), ElementsAre("0000:03:00.0"));
}

TEST(AdapterNameTest, NvidiaModelIsTheFirstSource)
{
    const AdapterTree tree("nvidia-drm");
    EXPECT_EQ(AdapterName("0000:01:00.0"), "NVIDIA GeForce RTX 3090");
}

TEST(AdapterNameTest, ProductNameIsTheSecondSource)
{
    const AdapterTree tree("amd-discrete");
    tree.write(std::string(kRadeon) + "/product_name", "AMD Radeon PRO W7900\n");
    EXPECT_EQ(AdapterName("0000:03:00.0"), "AMD Radeon PRO W7900");
}

TEST(AdapterNameTest, DatabaseIsTheThirdSource)
{
    const AdapterTree tree("amd-discrete");
    tree.write(std::string(kRadeon) + "/product_name", "\n");
    EXPECT_EQ(AdapterName("0000:03:00.0"), kRadeonName);
}

TEST(AdapterNameTest, HexadecimalIdsAreTheLastSource)
{
    const AdapterTree tree("amd-discrete");
    tree.remove("/usr");
    EXPECT_EQ(AdapterName("0000:03:00.0"), "1002:744c");
}

TEST(AdapterNameTest, OnlyWholeIdsOf16BitsCount)
{
    const std::pair<const char*, const char*> rows[] = {
        {"0xffff\n", "ffff:744c"},  {"0x1\n", "0001:744c"},      {"0x10000\n", "0000:744c"},
        {"0x1002z\n", "0000:744c"}, {"0x1002 1\n", "0000:744c"}, {"\n", "0000:744c"},
        {"vendor\n", "0000:744c"}};
    const AdapterTree tree("amd-discrete");
    tree.remove("/usr");
    for (const auto& [text, name] : rows) {
        tree.write(std::string(kRadeon) + "/vendor", text);
        EXPECT_EQ(AdapterName("0000:03:00.0"), name) << text;
    }
}

TEST(AdapterNameTest, ADeviceMissingInTheDatabaseIsNamedByItsIds)
{
    const AdapterTree tree("unnamed");
    EXPECT_EQ(AdapterName("0000:2d:00.0"), "1002:fffe");
}

TEST(AdapterNameTest, AnUnknownPlaceHasNoName)
{
    const AdapterTree tree("amd-discrete");
    EXPECT_EQ(AdapterName("0000:03:00.1"), "");
    EXPECT_EQ(AdapterName(""), "");
}

TEST(AdapterNameTest, AddressesAreAppendedToEqualNames)
{
    const AdapterTree tree("server-bmc");
    EXPECT_EQ(AdapterName("0000:41:00.0"), "AMD Instinct MI210 (0000:41:00.0)");
    EXPECT_EQ(AdapterName("0000:81:00.0"), "AMD Instinct MI210 (0000:81:00.0)");
    EXPECT_EQ(AdapterName("0000:02:00.0"), "ASPEED Technology, Inc. ASPEED Graphics Family");
}

TEST(AdapterNameTest, EightIdenticalCardsHaveEightNames)
{
    const AdapterTree tree("nvidia-eight");
    std::set<std::string> names;
    for (const std::string& address : DisplayAdapters()) {
        names.insert(AdapterName(address));
        EXPECT_THAT(AdapterName(address), EndsWith(" (" + address + ")"));
    }
    EXPECT_EQ(names.size(), 8U);
}

TEST(AdapterNameTest, CharactersThatWouldBeEscapedAreReplaced)
{
    const AdapterTree tree("amd-discrete");
    tree.write(std::string(kRadeon) + "/product_name", "A\"\\\xC2\xAE\xE2\x84\xA2\xFF\x01 z\n");
    EXPECT_EQ(AdapterName("0000:03:00.0"), "A'/???? z");
    tree.write(std::string(kRadeon) + "/product_name", "~\x7F\xBF\xC0\x1F\n");
    EXPECT_EQ(AdapterName("0000:03:00.0"), "~???");
}

TEST(AdapterNameTest, AnEmptyNameFallsBackToTheNextSource)
{
    const AdapterTree tree("amd-discrete");
    tree.write(std::string(kRadeon) + "/product_name", "\x80\xBF\n");
    EXPECT_EQ(AdapterName("0000:03:00.0"), kRadeonName);
}

TEST(AdapterNameTest, ALongNameIsTruncatedToFitItsAddress)
{
    const AdapterTree tree("server-bmc");
    for (const char* device : {"40/0000:40:01.1/0000:41:00.0", "80/0000:80:01.1/0000:81:00.0"}) {
        tree.write(std::string("/sys/devices/pci0000:") + device + "/product_name",
                   std::string(1000, 'n'));
    }
    EXPECT_EQ(AdapterName("0000:41:00.0"), std::string(108, 'n') + " (0000:41:00.0)");
    EXPECT_LE(AdapterName("0000:41:00.0").size(), 127U);
}

TEST(AdapterNameTest, NamesAreCachedUntilTheRootChanges)
{
    const AdapterTree tree("nvidia-drm");
    EXPECT_EQ(AdapterName("0000:01:00.0"), "NVIDIA GeForce RTX 3090");
    std::filesystem::remove_all(tree.root() + "/proc");
    EXPECT_EQ(AdapterName("0000:01:00.0"), "NVIDIA GeForce RTX 3090");
    tree.refresh();
    EXPECT_EQ(AdapterName("0000:01:00.0"), "NVIDIA Corporation GA102 [GeForce RTX 3090]");
}

TEST(AdapterNameTest, OutsidePciTheDeviceTreeIsTheFirstSource)
{
    const AdapterTree tree("soc-v3d");
    EXPECT_THAT(DisplayAdapters(), ElementsAre("platform/gpu", "platform/v3dbus/fec00000.gpu"));
    EXPECT_EQ(AdapterName("platform/gpu"), "brcm,bcm2711-vc5");
    EXPECT_EQ(AdapterName("platform/v3dbus/fec00000.gpu"), "brcm,2711-v3d");
}

TEST(AdapterNameTest, OutsidePciTheDriverIsTheSecondSource)
{
    const AdapterTree tree("soc-v3d");
    tree.remove("/sys/devices/platform/gpu/uevent");
    EXPECT_EQ(AdapterName("platform/gpu"), "vc4-drm");
}

TEST(AdapterNameTest, EqualNamesOutsidePciAreNumbered)
{
    const AdapterTree tree("soc-v3d");
    tree.write("/sys/devices/platform/gpu/uevent", "DRIVER=x\nOF_COMPATIBLE_0=brcm,2711-v3d\n");
    EXPECT_EQ(AdapterName("platform/gpu"), "brcm,2711-v3d (1)");
    EXPECT_EQ(AdapterName("platform/v3dbus/fec00000.gpu"), "brcm,2711-v3d (2)");
}

TEST(AdapterNameTest, PciAdaptersComeFirst)
{
    const AdapterTree tree("soc-beside-pci");
    EXPECT_THAT(DisplayAdapters(), ElementsAre("0000:01:00.0", "platform/ff9a0000.gpu"));
}

TEST(AdapterNameTest, AUsbDisplayIsAnAdapterAndItsControllerIsNot)
{
    const AdapterTree tree("usb-display");
    EXPECT_THAT(DisplayAdapters(),
                ElementsAre("0000:00:02.0", "pci0000:00/0000:00:14.0/usb1/1-2/1-2:1.0"));
}

TEST(AdapterNameTest, AnNvidiaDeviceWithoutANodeIsAssignedToTheDriversCard)
{
    const AdapterTree tree("nvidia-no-drm");
    EXPECT_THAT(NvidiaAdapters({""}, {}), ElementsAre("0000:65:00.0"));
    EXPECT_THAT(NvidiaAdapters({"NVIDIA A100 80GB PCIe"}, {}), ElementsAre("0000:65:00.0"));
}

TEST(AdapterNameTest, WithoutTheDriversListASingleDeviceIsAssignedToASingleCard)
{
    const AdapterTree tree("nvidia-no-drm");
    tree.remove("/proc/driver");
    EXPECT_THAT(NvidiaAdapters({""}, {}), ElementsAre("0000:65:00.0"));
    EXPECT_THAT(NvidiaAdapters({"", ""}, {}), ElementsAre("", ""));
}

TEST(AdapterNameTest, WithoutTheDriversListSeveralCardsAreAmbiguous)
{
    const AdapterTree tree("nvidia-eight");
    tree.remove("/proc/driver");
    EXPECT_THAT(NvidiaAdapters({""}, {}), ElementsAre(""));
}

TEST(AdapterNameTest, CardsOfOtherVendorsAreNotAssigned)
{
    const AdapterTree tree("amd-discrete");
    EXPECT_THAT(NvidiaAdapters({""}, {}), ElementsAre(""));
    EXPECT_THAT(NvidiaAdapters({}, {}), IsEmpty());
}

TEST(AdapterNameTest, AsManyDevicesAsCardsAreAssignedInOrder)
{
    const AdapterTree tree("nvidia-eight");
    EXPECT_EQ(NvidiaAdapters(Texts(8), {}), DisplayAdapters());
    EXPECT_EQ(NvidiaAdapters(Texts(7), {}), Texts(7));
}

TEST(AdapterNameTest, TakenCardsAreNotAssigned)
{
    const AdapterTree tree("nvidia-eight");
    const std::vector<std::string> all = DisplayAdapters();
    EXPECT_EQ(NvidiaAdapters(Texts(7), {all[0]}), Texts(all.begin() + 1, all.end()));
    EXPECT_EQ(NvidiaAdapters(Texts(1), all), Texts(1));
}

TEST(AdapterNameTest, DevicesAreAssignedByName)
{
    const AdapterTree tree("nvidia-eight");
    tree.write("/proc/driver/nvidia/gpus/0000:43:00.0/information", "Model: NVIDIA A100\n");
    EXPECT_THAT(
        NvidiaAdapters(
            {"NVIDIA H100 80GB HBM3", "NVIDIA A100", "NVIDIA H100 80GB HBM3", "NVIDIA H200"}, {}),
        ElementsAre("0000:1b:00.0", "0000:43:00.0", "0000:52:00.0", ""));
}

} // namespace
} // namespace QGF
