// The files that are read here don't wake a suspended card:
// - "vendor", "device", "subsystem_vendor", "subsystem_device" and "revision" of a PCI device print
//   fields of the kernel's struct pci_dev (drivers/pci/pci-sysfs.c;
//   Documentation/ABI/testing/sysfs-bus-pci). "config", "vpd", "rom" and the link speeds resume the
//   device and aren't read.
// - "status" and "modes" of a connector print the result of the last detection; only a write to
//   "status" starts a new one (drivers/gpu/drm/drm_sysfs.c). "modes" takes the lock of the list of
//   modes, which a running detection may hold, so it is read only if a display is attached.
// - amdgpu's "mem_info_vram_total" and "mem_info_gtt_total" print sizes that are set when the
//   driver starts (drivers/gpu/drm/amd/amdgpu/amdgpu_vram_mgr.c, amdgpu_gtt_mgr.c;
//   Documentation/gpu/amdgpu/driver-misc.rst), unlike its clocks and sensors.
// - "resource" prints the kernel's table of the function's BARs (drivers/pci/pci-sysfs.c,
//   resource_show). i915 and xe register the "hwmon" folder for discrete cards only
//   (i915_hwmon_register, xe_hwmon_register); only its presence is checked, since its files wake
//   the card.
// - A render node is opened only while "power/runtime_status" is "active"; the state is a variable
//   of the kernel (drivers/base/power/sysfs.c). DrmQuery.cpp describes the effect of opening one.
// - /sys/module/NAME/version and the links "driver" and "module" belong to the module, not to a
//   device (Documentation/ABI/stable/sysfs-module).
// - /proc/driver/nvidia/version also belongs to the module, and listing the folder of its cards
//   accesses no card. NvidiaProc.cpp describes the one file there that does.
#include "linux/gpu/DrmAdapters.h"

#include <algorithm>
#include <charconv>
#include <map>

#include "linux/gpu/DrmMemory.h"
#include "linux/gpu/DrmQuery.h"
#include "linux/gpu/NvidiaVersion.h"
#include "linux/gpu/SystemNumbers.h"
#include "pmutil_gpu/DXGIData.h"
#include "qgf/AdapterName.h"
#include "qgf/DrmNodes.h"
#include "qgf/SystemFiles.h"

namespace pmutil {
namespace {

const char kDrmClass[] = "/sys/class/drm/";
constexpr std::uint32_t kMaxModeSize = 1U << 16; // pixels

// The DRM nodes of one adapter, sorted by name.
using Nodes = std::vector<QGF::DrmNode>;

std::map<std::string, Nodes> NodesByPlace()
{
    std::map<std::string, Nodes> nodes;
    for (const QGF::DrmNode& node : QGF::DisplayNodes())
        nodes[node.place].push_back(node);
    return nodes;
}

bool IsRenderNode(const QGF::DrmNode& node)
{
    return node.name.compare(0, 6, "render") == 0;
}

std::string RenderNodeOf(const Nodes& nodes)
{
    const auto node = std::find_if(nodes.begin(), nodes.end(), IsRenderNode);
    return node == nodes.end() ? std::string() : node->name;
}

std::uint32_t ReadId(const std::string& path, std::uint32_t max)
{
    std::uint64_t id = 0;
    return ReadSystemNumber(path, id) && id <= max ? static_cast<std::uint32_t>(id) : 0;
}

void ReadIds(const std::string& folder, DrmAdapter& adapter)
{
    adapter.vendor = ReadId(folder + "vendor", 0xFFFF);
    adapter.device = ReadId(folder + "device", 0xFFFF);
    adapter.subsystem = ReadId(folder + "subsystem_device", 0xFFFF) << 16 |
                        ReadId(folder + "subsystem_vendor", 0xFFFF);
    adapter.revision = ReadId(folder + "revision", 0xFF);
}

std::optional<std::uint64_t> ReadSize(const std::string& path)
{
    std::uint64_t bytes = 0;
    return ReadSystemNumber(path, bytes) ? std::optional<std::uint64_t>(bytes) : std::nullopt;
}

// The driver's figure in bytes; 0 if the card has no dedicated memory.
std::optional<std::uint64_t> QueryMemory(const std::string& folder, const Nodes& nodes,
                                         const std::string& driver)
{
    const std::string node = RenderNodeOf(nodes);
    if (node.empty() || !HasDrmQuery(driver) ||
        QGF::ReadSystemLine(folder + "power/runtime_status") != "active")
        return std::nullopt;
    return ParseDedicatedMemory(driver, QueryDrmNode(node, driver));
}

// Guesses for a card whose driver reports no figure. Intel's integrated graphics are at 00:02.x; a
// discrete card at that address, as in virtual machines, is recognised by its sensors.
bool HasDedicatedMemory(const std::string& folder, const DrmAdapter& adapter)
{
    if (adapter.vendor == kVendorIntel) {
        return adapter.place.compare(0, 11, "0000:00:02.") != 0 ||
               !QGF::ListSystemFolder(folder + "hwmon").empty();
    }
    return adapter.vendor == kVendorAMD;
}

void ReadMemory(const std::string& folder, const Nodes& nodes, DrmAdapter& adapter)
{
    adapter.dedicatedBytes = ReadSize(folder + "mem_info_vram_total");
    adapter.sharedBytes = ReadSize(folder + "mem_info_gtt_total");
    if (adapter.dedicatedBytes)
        return;
    adapter.dedicatedBytes = QueryMemory(folder, nodes, adapter.driver);
    if (!adapter.dedicatedBytes && HasDedicatedMemory(folder, adapter)) {
        std::string resource;
        QGF::ReadSystemFile(folder + "resource", resource);
        adapter.dedicatedBytes = LargestPrefetchableBar(resource);
    }
    if (adapter.dedicatedBytes == 0U)
        adapter.dedicatedBytes.reset();
}

// The module of a device's driver, or the driver's name if it is built into the kernel.
std::string ModuleOf(const std::string& device)
{
    std::string module = QGF::LastOfPath(QGF::ReadSystemLink(device + "driver/module"));
    if (!module.empty())
        return module;
    return QGF::LastOfPath(QGF::ReadSystemLink(device + "driver"));
}

// The folder of the device that the adapter's nodes belong to: the adapter's own folder if a node
// belongs to the adapter itself or there is no node, else the device below it that has the render
// node. Firmware framebuffers don't count, since they don't belong to the adapter's driver.
std::string DeviceOfNodes(const std::string& folder, const std::string& place, const Nodes& nodes)
{
    const QGF::DrmNode* best = nullptr;
    for (const QGF::DrmNode& node : nodes) {
        if (node.firmware)
            continue;
        if (QGF::LastOfPath(node.device) == QGF::LastOfPath(place))
            return folder;
        if (best == nullptr || IsRenderNode(node))
            best = &node;
    }
    return best == nullptr ? folder : best->device + "/";
}

// The graphics driver. A virtio transport device has the DRM nodes, but the graphics driver is
// bound to the virtio device below it (virtio_gpu_probe in drivers/gpu/drm/virtio/virtgpu_drv.c).
std::string GraphicsDriver(const std::string& device)
{
    std::string driver = ModuleOf(device);
    if (driver.compare(0, 7, "virtio_") == 0 || driver.compare(0, 7, "virtio-") == 0) {
        for (const std::string& name : QGF::ListSystemFolder(device)) {
            std::string child =
                name.compare(0, 6, "virtio") == 0 ? ModuleOf(device + name + "/") : std::string();
            if (!child.empty())
                return child;
        }
    }
    return driver;
}

struct DriverRelease {
    std::string version;
    std::string date;
};

DriverRelease ReadRelease(const std::string& driver)
{
    DriverRelease release;
    release.version = QGF::ReadSystemLine("/sys/module/" + driver + "/version");
    if (driver == "nvidia") {
        std::string text;
        QGF::ReadSystemFile("/proc/driver/nvidia/version", text);
        const NvidiaVersion nvidia = ParseNvidiaVersion(text);
        if (release.version.empty())
            release.version = nvidia.version;
        release.date = nvidia.date;
    }
    if (release.version.empty())
        release.version = QGF::ReadSystemLine("/proc/sys/kernel/osrelease");
    return release;
}

// The releases by driver, each read once for all cards of the driver.
using DriverReleases = std::map<std::string, DriverRelease>;

void ReadDriver(const std::string& folder, const Nodes& nodes, DriverReleases& releases,
                DrmAdapter& adapter)
{
    adapter.driver = GraphicsDriver(DeviceOfNodes(folder, adapter.place, nodes));
    if (adapter.driver.empty())
        return;
    const auto [release, isNew] = releases.try_emplace(adapter.driver);
    if (isNew)
        release->second = ReadRelease(adapter.driver);
    adapter.driverVersion = release->second.version;
    adapter.driverDate = release->second.date;
}

// Returns false if the connector was removed after it was listed.
bool ReadConnector(const std::string& folder, DrmConnector& connector)
{
    const std::string status = QGF::ReadSystemLine(folder + "/status");
    if (status == "connected")
        connector.connected = true;
    else if (status == "disconnected")
        connector.connected = false;
    if (connector.connected.value_or(false))
        ParseModeSize(QGF::ReadSystemLine(folder + "/modes"), connector.width, connector.height);
    return connector.connected || !QGF::ListSystemFolder(folder).empty();
}

void ReadConnectors(const std::vector<std::string>& classNames, const Nodes& nodes,
                    DrmAdapter& adapter)
{
    for (const QGF::DrmNode& node : nodes) {
        const std::string prefix = node.name + "-";
        for (const std::string& name : classNames) {
            if (name.compare(0, prefix.size(), prefix) != 0)
                continue;
            DrmConnector connector;
            connector.name = name.substr(prefix.size());
            if (ReadConnector(kDrmClass + name, connector))
                adapter.connectors.push_back(std::move(connector));
        }
    }
}

void ReadRenderer(const Nodes& nodes, const std::vector<std::string>& nvidiaCards,
                  DrmAdapter& adapter)
{
    adapter.renderName = RenderNodeOf(nodes);
    if (adapter.renderName.empty() &&
        std::find(nvidiaCards.begin(), nvidiaCards.end(), adapter.place) != nvidiaCards.end())
        adapter.renderName = "nvidia";
    adapter.renders = !adapter.renderName.empty();
}

} // namespace

std::vector<DrmAdapter> ReadDrmAdapters()
{
    std::vector<DrmAdapter> adapters;
    const std::map<std::string, Nodes> nodesByPlace = NodesByPlace();
    const std::vector<std::string> classNames = QGF::ListSystemFolder(kDrmClass);
    const std::vector<std::string> nvidiaCards = QGF::ListSystemFolder("/proc/driver/nvidia/gpus");
    DriverReleases releases;
    for (const std::string& place : QGF::DisplayAdapters()) {
        const std::string folder = QGF::AdapterFolder(place);
        const auto found = nodesByPlace.find(place);
        const Nodes nodes = found == nodesByPlace.end() ? Nodes() : found->second;
        DrmAdapter adapter;
        adapter.place = place;
        adapter.name = QGF::AdapterName(place);
        ReadIds(folder, adapter);
        ReadDriver(folder, nodes, releases, adapter);
        ReadMemory(folder, nodes, adapter);
        ReadConnectors(classNames, nodes, adapter);
        ReadRenderer(nodes, nvidiaCards, adapter);
        adapters.push_back(std::move(adapter));
    }
    return adapters;
}

std::shared_ptr<const std::vector<DrmAdapter>> CachedDrmAdapters()
{
    static std::shared_ptr<const std::vector<DrmAdapter>> gCached;
    static unsigned gRootCount = 0;
    if (!gCached || gRootCount != QGF::SystemRootCount()) {
        gRootCount = QGF::SystemRootCount();
        gCached = std::make_shared<const std::vector<DrmAdapter>>(ReadDrmAdapters());
    }
    return gCached;
}

bool ParseModeSize(const std::string& mode, std::uint32_t& width, std::uint32_t& height)
{
    const char* const end = mode.data() + mode.size();
    std::uint32_t parsedWidth = 0;
    std::uint32_t parsedHeight = 0;
    const auto first = std::from_chars(mode.data(), end, parsedWidth);
    if (*first.ptr != 'x')
        return false;
    const auto second = std::from_chars(first.ptr + 1, end, parsedHeight);
    const std::string rest(second.ptr, end);
    // What can't be parsed stays 0.
    if ((!rest.empty() && rest != "i") || parsedWidth == 0 || parsedHeight == 0 ||
        parsedWidth > kMaxModeSize || parsedHeight > kMaxModeSize)
        return false;
    width = parsedWidth;
    height = parsedHeight;
    return true;
}

} // namespace pmutil
