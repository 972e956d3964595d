// Compares DrmNodes with libdrm's list of this machine's DRM devices. Skipped without libdrm or
// without a DRM node on PCI.
#include <map>
#include <memory>
#include <set>

#include <gtest/gtest.h>
#include <xf86drm.h>

#include "qgf/Core.h"
#include "qgf/DrmNodes.h"
#include "qgf/SystemFiles.h"

namespace QGF {
namespace {

// libdrm's address as the text "0000:01:00.0".
std::string AddressOf(const drmPciBusInfo& bus)
{
    char text[32];
    std::snprintf(text, sizeof text, "%04x:%02x:%02x.%x", unsigned{bus.domain}, unsigned{bus.bus},
                  unsigned{bus.dev}, unsigned{bus.func});
    return text;
}

using Nodes = std::map<std::string, std::string>;

Nodes PciNodesOf(const drmDevice& device)
{
    Nodes nodes;
    for (const int kind : {DRM_NODE_PRIMARY, DRM_NODE_RENDER})
        if (device.bustype == DRM_BUS_PCI && (device.available_nodes & (1 << kind)) != 0)
            nodes[LastOfPath(device.nodes[kind])] = AddressOf(*device.businfo.pci);
    return nodes;
}

TEST(DrmNodesPeerTest, LibdrmHasTheSameNodesOnPci)
{
    std::unique_ptr<Core::DynamicLibrary> library;
    try {
        static const char* const kNames[] = {"libdrm.so.2", nullptr};
        library = Core::OpenLibrary(kNames);
    } catch (const LogicalException&) {
        GTEST_SKIP() << "this machine has no libdrm.so.2";
    }
    const auto getDevices =
        reinterpret_cast<decltype(&drmGetDevices2)>(library->getProc("drmGetDevices2"));
    const auto freeDevices =
        reinterpret_cast<decltype(&drmFreeDevices)>(library->getProc("drmFreeDevices"));
    ASSERT_TRUE(getDevices && freeDevices);
    drmDevicePtr devices[64];
    const int count = getDevices(0, devices, 64);
    Nodes theirs;
    for (int i = 0; i < count; ++i)
        theirs.merge(PciNodesOf(*devices[i]));
    if (count > 0)
        freeDevices(devices, count);
    if (theirs.empty())
        GTEST_SKIP() << "this machine has no DRM node on PCI";
    Nodes ours;
    for (const DrmNode& node : DrmNodes())
        if (!node.firmware && AdapterFolder(node.place).compare(0, 9, "/sys/bus/") == 0)
            ours[node.name] = node.place;
    EXPECT_EQ(ours, theirs);
}

} // namespace
} // namespace QGF
