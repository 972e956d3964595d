#include "linux/gpu/DrmAdapters.h"

#include <filesystem>

#include <gtest/gtest.h>

#include "support/AdapterTree.h"

namespace pmutil {
namespace {

DrmAdapter OnlyAdapter()
{
    const std::vector<DrmAdapter> adapters = ReadDrmAdapters();
    return adapters.size() == 1 ? adapters[0] : DrmAdapter();
}

TEST(DrmAdaptersTest, AModesSizeIsParsedFromItsName)
{
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    EXPECT_TRUE(ParseModeSize("1920x1080", width, height));
    EXPECT_EQ(width, 1920U);
    EXPECT_EQ(height, 1080U);
    EXPECT_TRUE(ParseModeSize("720x576i", width, height));
    EXPECT_EQ(width, 720U);
    EXPECT_EQ(height, 576U);
    EXPECT_TRUE(ParseModeSize("65536x1", width, height));
    EXPECT_EQ(width, 65536U);
    EXPECT_EQ(height, 1U);
    EXPECT_TRUE(ParseModeSize("1x65536", width, height));
    EXPECT_EQ(height, 65536U);
}

TEST(DrmAdaptersTest, OtherTextsAreNotModes)
{
    for (const char* mode : {"", "x", "1920", "1920x", "x1080", "0x1080", "1920x0", "-1x1", "1x-1",
                             "65537x1", "1x65537", "99999999999x1", "1x99999999999", "1920x1080p",
                             "1920 x 1080", "1920x1080ii", "a", "1x", "1xx1"}) {
        std::uint32_t width = 7;
        std::uint32_t height = 7;
        EXPECT_FALSE(ParseModeSize(mode, width, height)) << mode;
        EXPECT_EQ(width, 7U);
        EXPECT_EQ(height, 7U);
    }
}

TEST(DrmAdaptersTest, ADiscreteCardWithEverything)
{
    const AdapterTree tree("amd-discrete");
    const DrmAdapter adapter = OnlyAdapter();
    EXPECT_EQ(adapter.place, "0000:03:00.0");
    EXPECT_EQ(adapter.vendor, 0x1002U);
    EXPECT_EQ(adapter.device, 0x744CU);
    EXPECT_EQ(adapter.subsystem, 0x471E1DA2U);
    EXPECT_EQ(adapter.revision, 0xC8U);
    EXPECT_EQ(adapter.dedicatedBytes, 25753026560U);
    EXPECT_EQ(adapter.sharedBytes, 16767705088U);
    EXPECT_EQ(adapter.driver, "amdgpu");
    EXPECT_EQ(adapter.driverVersion, "6.12.117+deb12-amd64");
    EXPECT_EQ(adapter.driverDate, "");
    EXPECT_TRUE(adapter.renders);
    EXPECT_EQ(adapter.renderName, "renderD128");
    ASSERT_EQ(adapter.connectors.size(), 3U);
    EXPECT_EQ(adapter.connectors[0].name, "DP-1");
    EXPECT_EQ(adapter.connectors[0].connected, true);
    EXPECT_EQ(adapter.connectors[0].width, 2560U);
    EXPECT_EQ(adapter.connectors[0].height, 1440U);
    EXPECT_EQ(adapter.connectors[1].name, "DP-2");
    EXPECT_EQ(adapter.connectors[1].connected, false);
    EXPECT_EQ(adapter.connectors[1].width, 0U);
    EXPECT_EQ(adapter.connectors[1].height, 0U);
    EXPECT_EQ(adapter.connectors[2].name, "HDMI-A-1");
    EXPECT_EQ(adapter.connectors[2].width, 1920U);
}

TEST(DrmAdaptersTest, AModulesOwnVersionComesBeforeTheKernels)
{
    const AdapterTree tree("amd-discrete");
    tree.write("/sys/module/amdgpu/version", "6.7.0\n");
    EXPECT_EQ(OnlyAdapter().driverVersion, "6.7.0");
}

TEST(DrmAdaptersTest, ADriverBuiltIntoTheKernelHasItsOwnName)
{
    const AdapterTree tree("amd-discrete");
    tree.remove("/sys/bus/pci/drivers/amdgpu/module");
    EXPECT_EQ(OnlyAdapter().driver, "amdgpu");
    EXPECT_EQ(OnlyAdapter().driverVersion, "6.12.117+deb12-amd64");
}

TEST(DrmAdaptersTest, ACardWithoutADriverHasNoDriverStrings)
{
    const AdapterTree tree("amd-discrete");
    tree.remove(
        "/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/0000:02:00.0/0000:03:00.0/driver");
    EXPECT_EQ(OnlyAdapter().driver, "");
    EXPECT_EQ(OnlyAdapter().driverVersion, "");
}

TEST(DrmAdaptersTest, TheNvidiaDriverReportsVersionAndDate)
{
    const AdapterTree tree("nvidia-no-drm");
    EXPECT_EQ(OnlyAdapter().driverVersion, "550.54.15");
    EXPECT_EQ(OnlyAdapter().driverDate, "20240305221533.000000+000");
    tree.write("/sys/module/nvidia/version", "550.54.16\n");
    EXPECT_EQ(OnlyAdapter().driverVersion, "550.54.16");
}

TEST(DrmAdaptersTest, TheNvidiaDriversEntryReplacesARenderNode)
{
    const AdapterTree tree("nvidia-no-drm");
    EXPECT_TRUE(OnlyAdapter().renders);
    EXPECT_TRUE(OnlyAdapter().connectors.empty());
    tree.remove("/proc/driver/nvidia/gpus");
    EXPECT_FALSE(OnlyAdapter().renders);
}

TEST(DrmAdaptersTest, TheDriverIsThatBelowTheTransport)
{
    const AdapterTree tree("virtio-gpu");
    EXPECT_EQ(OnlyAdapter().driver, "virtio_gpu");
    tree.remove("/sys/devices/pci0000:00/0000:00:01.0/virtio0");
    EXPECT_EQ(OnlyAdapter().driver, "virtio_pci");
}

// Some drivers make the nodes for the virtio device.
TEST(DrmAdaptersTest, TheDriverIsThatBelowTheTransportIfItHasTheNodes)
{
    const AdapterTree tree("virtio-gpu");
    for (const std::string node : {"card0", "renderD128"}) {
        const std::string link = tree.root() + "/sys/class/drm/" + node;
        std::filesystem::remove(link);
        std::filesystem::create_symlink("../../devices/pci0000:00/0000:00:01.0/virtio0/drm/" + node,
                                        link);
    }
    tree.refresh();
    EXPECT_EQ(OnlyAdapter().place, "0000:00:01.0");
    EXPECT_EQ(OnlyAdapter().driver, "virtio_gpu");
}

// Other devices on the same transport don't count, and of those with nodes the one that renders.
TEST(DrmAdaptersTest, TheDriverIsThatOfTheDeviceThatRenders)
{
    namespace fs = std::filesystem;
    const AdapterTree tree("virtio-gpu");
    const std::string folder = tree.root() + "/sys/devices/pci0000:00/0000:00:01.0/virtio";
    const auto add = [&](const std::string& number, const std::string& driver) {
        fs::create_directories(folder + number);
        fs::create_symlink("/sys/bus/virtio/drivers/" + driver, folder + number + "/driver");
    };
    const auto move = [&](const std::string& node, const std::string& number) {
        const std::string link = tree.root() + "/sys/class/drm/" + node;
        fs::remove(link);
        fs::create_symlink("../../devices/pci0000:00/0000:00:01.0/virtio" + number + "/drm/" + node,
                           link);
    };
    add("1", "shows");
    add("2", "renders");
    move("card0", "1");
    move("renderD128", "2");
    tree.refresh();
    EXPECT_EQ(OnlyAdapter().driver, "renders");
    fs::remove(tree.root() + "/sys/class/drm/renderD128");
    tree.refresh();
    EXPECT_EQ(OnlyAdapter().driver, "shows");
}

TEST(DrmAdaptersTest, AFirmwareFramebuffersDriverIsIgnored)
{
    for (const char* name : {"nvidia-firmware", "nvidia-firmware-drm"}) {
        const AdapterTree tree(name);
        EXPECT_EQ(OnlyAdapter().driver, "nvidia") << name;
        EXPECT_EQ(OnlyAdapter().driverVersion, "550.54.15") << name;
        EXPECT_EQ(OnlyAdapter().connectors.at(0).name, "Unknown-1") << name;
    }
    const AdapterTree tree("firmware-only");
    EXPECT_EQ(OnlyAdapter().driver, "");
}

const char kArc[] = "/sys/bus/pci/devices/0000:03:00.0/";

TEST(DrmAdaptersTest, AnIntelCardsMemoryIsQueriedFromItsDriver)
{
    const AdapterTree tree("intel-arc-i915");
    EXPECT_EQ(OnlyAdapter().dedicatedBytes, 17062428672U);
}

TEST(DrmAdaptersTest, WithoutAnAnswerTheBarIsUsed)
{
    const AdapterTree tree("intel-arc-i915");
    tree.remove("/dev/dri/renderD128.i915");
    EXPECT_EQ(OnlyAdapter().dedicatedBytes, std::uint64_t{16} << 30);
    tree.remove(std::string(kArc) + "resource");
    EXPECT_FALSE(OnlyAdapter().dedicatedBytes);
}

TEST(DrmAdaptersTest, ASuspendedCardIsNotQueried)
{
    const AdapterTree tree("intel-arc-i915");
    tree.write(std::string(kArc) + "power/runtime_status", "suspended\n");
    EXPECT_EQ(OnlyAdapter().dedicatedBytes, std::uint64_t{16} << 30);
}

TEST(DrmAdaptersTest, AnAnswerOfZeroIsAccepted)
{
    const AdapterTree tree("intel-integrated");
    EXPECT_FALSE(OnlyAdapter().dedicatedBytes);
    tree.remove("/dev/dri/renderD128.i915");
    EXPECT_FALSE(OnlyAdapter().dedicatedBytes);
}

// In a virtual machine a discrete card may have the address of integrated graphics.
TEST(DrmAdaptersTest, SensorsIdentifyADiscreteCardAtTheIntegratedAddress)
{
    const AdapterTree tree("intel-integrated");
    tree.remove("/dev/dri/renderD128.i915");
    tree.write("/sys/devices/pci0000:00/0000:00:02.0/hwmon/hwmon1/name", "i915\n");
    EXPECT_EQ(OnlyAdapter().dedicatedBytes, std::uint64_t{256} << 20);
}

TEST(DrmAdaptersTest, IntelAdaptersElsewhereAreDiscrete)
{
    const AdapterTree tree("intel-arc-closed");
    tree.remove(std::string(kArc) + "hwmon");
    EXPECT_EQ(OnlyAdapter().dedicatedBytes, std::uint64_t{256} << 20);
}

TEST(DrmAdaptersTest, TheBarIsNotUsedForOtherVendors)
{
    const AdapterTree tree("nouveau");
    tree.remove("/dev/dri/renderD128.nouveau");
    tree.write("/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/resource",
               "0x0000000000000000 0x000000000fffffff 0x000000000014220c\n");
    EXPECT_FALSE(OnlyAdapter().dedicatedBytes);
    EXPECT_FALSE(OnlyAdapter().sharedBytes);
}

TEST(DrmAdaptersTest, AnAdapterOutsidePciHasNoIds)
{
    const AdapterTree tree("soc-panfrost");
    const std::vector<DrmAdapter> adapters = ReadDrmAdapters();
    ASSERT_EQ(adapters.size(), 2U);
    EXPECT_EQ(adapters[1].place, "platform/ff9a0000.gpu");
    EXPECT_EQ(adapters[1].name, "rockchip,rk3399-mali");
    EXPECT_EQ(adapters[1].vendor, 0U);
    EXPECT_EQ(adapters[1].driver, "panfrost");
    EXPECT_EQ(adapters[1].renderName, "renderD128");
}

TEST(DrmAdaptersTest, TheListIsCached)
{
    const AdapterTree tree("amd-discrete");
    const auto known = CachedDrmAdapters();
    EXPECT_EQ(CachedDrmAdapters(), known);
    tree.refresh();
    EXPECT_NE(CachedDrmAdapters(), known);
}

TEST(DrmAdaptersTest, AnIdOutOfItsRangeIsNone)
{
    const AdapterTree tree("amd-discrete");
    const std::string card =
        "/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/0000:02:00.0/0000:03:00.0/";
    tree.write(card + "vendor", "0xffff\n");
    tree.write(card + "device", "0x10000\n");
    tree.write(card + "revision", "0xff\n");
    EXPECT_EQ(OnlyAdapter().vendor, 0xFFFFU);
    EXPECT_EQ(OnlyAdapter().device, 0U);
    EXPECT_EQ(OnlyAdapter().revision, 0xFFU);
    tree.write(card + "vendor", "0x10000\n");
    tree.write(card + "revision", "0x100\n");
    EXPECT_EQ(OnlyAdapter().vendor, 0U);
    EXPECT_EQ(OnlyAdapter().revision, 0U);
}

TEST(DrmAdaptersTest, BrokenFilesAffectTheirFieldsOnly)
{
    const AdapterTree tree("unreadable");
    const std::vector<DrmAdapter> adapters = ReadDrmAdapters();
    ASSERT_EQ(adapters.size(), 2U);
    EXPECT_EQ(adapters[0].vendor, 0x1002U);
    EXPECT_EQ(adapters[0].device, 0U);
    EXPECT_FALSE(adapters[0].dedicatedBytes);
    EXPECT_FALSE(adapters[0].sharedBytes);
    ASSERT_EQ(adapters[0].connectors.size(), 1U);
    EXPECT_EQ(adapters[0].connectors[0].connected, true);
    EXPECT_EQ(adapters[0].connectors[0].width, 0U);
    EXPECT_EQ(adapters[1].vendor, 0U);
    EXPECT_EQ(adapters[1].subsystem, 0U);
    EXPECT_EQ(adapters[1].driver, "gone");
}

TEST(DrmAdaptersTest, ARemovedConnectorIsDroppedAndAnUnknownOneIsKept)
{
    const AdapterTree tree("unreadable");
    const std::vector<DrmConnector> connectors = ReadDrmAdapters().at(1).connectors;
    ASSERT_EQ(connectors.size(), 2U);
    EXPECT_EQ(connectors[0].name, "DP-2");
    EXPECT_FALSE(connectors[0].connected);
    EXPECT_EQ(connectors[1].name, "HDMI-A-1");
    EXPECT_EQ(connectors[1].connected, true);
    EXPECT_EQ(connectors[1].width, 1280U);
}

TEST(DrmAdaptersTest, OtherStatesThanConnectedAreUnknown)
{
    const AdapterTree tree("amd-discrete");
    tree.write("/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/0000:02:00.0/0000:03:00.0/drm/"
               "card0/card0-DP-2/status",
               "unknown\n");
    EXPECT_FALSE(OnlyAdapter().connectors.at(1).connected);
}

TEST(DrmAdaptersTest, AnEmptyMachineHasNoAdapters)
{
    const AdapterTree tree("empty");
    EXPECT_TRUE(ReadDrmAdapters().empty());
}

} // namespace
} // namespace pmutil
