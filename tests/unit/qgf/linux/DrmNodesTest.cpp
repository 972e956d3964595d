#include "qgf/DrmNodes.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/AdapterName.h"
#include "support/AdapterTree.h"

namespace QGF {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using Texts = std::vector<std::string>;

Texts Places()
{
    Texts texts;
    for (const DrmNode& node : DrmNodes())
        texts.push_back(node.name + " " + node.place + (node.firmware ? " firmware" : ""));
    return texts;
}

// Adds a node of a device. `driver` is the device's driver, "" for none.
void AddNode(const AdapterTree& tree, const std::string& name, const std::string& device,
             const std::string& driver)
{
    namespace fs = std::filesystem;
    fs::create_directories(tree.root() + "/sys/class/drm");
    fs::create_directories(tree.root() + "/sys/devices/" + device);
    fs::create_symlink("../../devices/" + device + "/drm/" + name,
                       tree.root() + "/sys/class/drm/" + name);
    if (!driver.empty()) {
        fs::create_symlink("/sys/bus/any/drivers/" + driver,
                           tree.root() + "/sys/devices/" + device + "/driver");
    }
    tree.refresh();
}

TEST(DrmNodesTest, ANodeBelongsToItsAdapter)
{
    const AdapterTree tree("server-bmc");
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/card0"), "0000:02:00.0");
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/card2"), "0000:81:00.0");
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/renderD128"), "0000:41:00.0");
}

TEST(DrmNodesTest, OtherFilesHaveNoAdapter)
{
    const AdapterTree tree("amd-discrete");
    for (const char* file : {"", "/dev/dri/", "/dev/dri/card9", "/dev/dri/card", "/dev/dri/version",
                             "/dev/dri/card0-DP-1", "/dev/dri/../../etc/passwd", "/dev/nvidia0"})
        EXPECT_EQ(AdapterOfDrmNode(file), "") << file;
}

TEST(DrmNodesTest, OnPciTheFunctionIsTheAdapter)
{
    const AdapterTree tree("empty");
    AddNode(tree, "card0", "pci0000:00/0000:00:01.0/0000:01:00.0", "");
    AddNode(tree, "card1", "pci0000:00/0000:00:02.0/virtio3", "virtio_gpu");
    AddNode(tree, "card2", "pci0000:00/0000:00:03.0/simple-framebuffer.0", "simple-framebuffer");
    EXPECT_THAT(Places(), ElementsAre("card0 0000:01:00.0", "card1 0000:00:02.0",
                                      "card2 0000:00:03.0 firmware"));
}

TEST(DrmNodesTest, AFirmwareFramebufferIsRecognised)
{
    const AdapterTree tree("nvidia-firmware-drm");
    EXPECT_TRUE(IsFirmwareNode("/dev/dri/card0"));
    EXPECT_FALSE(IsFirmwareNode("/dev/dri/card1"));
    EXPECT_FALSE(IsFirmwareNode("/dev/dri/card2"));
    EXPECT_FALSE(IsFirmwareNode(""));
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/card0"), AdapterOfDrmNode("/dev/dri/card1"));
}

TEST(DrmNodesTest, OtherDevicesBelowAFunctionAreAdapters)
{
    const AdapterTree tree("empty");
    AddNode(tree, "card0", "pci0000:00/0000:00:14.0/usb1/1-2/1-2:1.0", "udl");
    AddNode(tree, "card1", "pci0000:00/0000:00:15.0/virtionet", "other");
    EXPECT_THAT(Places(), ElementsAre("card0 pci0000:00/0000:00:14.0/usb1/1-2/1-2:1.0",
                                      "card1 pci0000:00/0000:00:15.0/virtionet"));
}

TEST(DrmNodesTest, OutsidePciTheDeviceIsTheAdapter)
{
    const AdapterTree tree("empty");
    AddNode(tree, "card0", "platform/soc/fec00000.v3d", "v3d");
    AddNode(tree, "renderD128", "platform/soc/fec00000.v3d", "");
    EXPECT_THAT(Places(), ElementsAre("card0 platform/soc/fec00000.v3d",
                                      "renderD128 platform/soc/fec00000.v3d"));
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/renderD128"), "platform/soc/fec00000.v3d");
    EXPECT_EQ(DrmNodes().at(0).device, "/sys/devices/platform/soc/fec00000.v3d");
}

TEST(DrmNodesTest, DevicesWithoutADriverAndFramebuffersWithoutACardAreLeftOut)
{
    const AdapterTree tree("empty");
    AddNode(tree, "card0", "platform/vkms", "");
    AddNode(tree, "card1", "platform/simple-framebuffer.0", "simple-framebuffer");
    AddNode(tree, "card2", "platform/of-display.0", "of-display");
    EXPECT_THAT(DrmNodes(), IsEmpty());
    EXPECT_THAT(DisplayAdapters(), IsEmpty());
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/card0"), "");
}

TEST(DrmNodesTest, ANameWithoutANumberIsNoNode)
{
    const AdapterTree tree("empty");
    for (const char* name : {"card", "renderD", "cardx", "card1x", "xcard1", "renderD128x"})
        AddNode(tree, name, std::string("platform/gpu-") + name, "v3d");
    EXPECT_THAT(DrmNodes(), IsEmpty());
    EXPECT_EQ(AdapterOfDrmNode("/dev/dri/card"), "");
    AddNode(tree, "card0", "pci0000:00/0000:00:15.0/virtio", "other");
    EXPECT_THAT(Places(), ElementsAre("card0 pci0000:00/0000:00:15.0/virtio"));
}

TEST(DrmNodesTest, LinksToOtherPathsAreIgnored)
{
    for (const char* target : {"", "card0", "../../devices/drm/card0", "../../devices//drm/card0",
                               "../../devices/platform/gpu/drm/card1", "/nowhere/at/all"}) {
        const AdapterTree tree("empty");
        std::filesystem::create_directories(tree.root() + "/sys/class/drm");
        if (*target != '\0')
            std::filesystem::create_symlink(target, tree.root() + "/sys/class/drm/card0");
        EXPECT_THAT(DrmNodes(), IsEmpty()) << target;
    }
}

TEST(DrmNodesTest, AnAdaptersFolderDependsOnItsPlace)
{
    EXPECT_EQ(AdapterFolder("0000:01:00.0"), "/sys/bus/pci/devices/0000:01:00.0/");
    EXPECT_EQ(AdapterFolder("platform/gpu"), "/sys/devices/platform/gpu/");
}

} // namespace
} // namespace QGF
