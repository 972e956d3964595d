// Which files are read, and why none of them wakes a card:
// - "vendor", "device", "subsystem_vendor", "subsystem_device" and "revision" of a PCI device print
//   the kernel's struct pci_dev (drivers/pci/pci-sysfs.c; Documentation/ABI/testing/sysfs-bus-pci).
//   "config", "vpd", "rom" and the link speeds would resume the device and are left alone.
// - "status" and "modes" of a connector print what the last detection found; only writing to
//   "status" detects anew (drivers/gpu/drm/drm_sysfs.c). "modes" takes the lock of its list, which
//   a detection under way may hold for a moment, so it is read where a display is attached only.
// - amdgpu's "mem_info_vram_total" and "mem_info_gtt_total" print sizes kept since the driver
//   started (drivers/gpu/drm/amd/amdgpu/amdgpu_vram_mgr.c, amdgpu_gtt_mgr.c;
//   Documentation/gpu/amdgpu/driver-misc.rst), unlike its clocks and sensors.
// - i915's "lmem_total_bytes" and xe's "physical_vram_size_bytes" print sizes probed at start (xe:
//   drivers/gpu/drm/xe/xe_tile_sysfs.c).
// - /sys/module/NAME/version and the links "driver" and "module" belong to the module, not to a
//   device (Documentation/ABI/stable/sysfs-module).
// - /proc/driver/nvidia/version belongs to the module as well, and listing the folder of its cards
//   asks no card. NvidiaProc.cpp tells of the one file there that does.
#include "linux/DrmAdapters.h"

#include <algorithm>
#include <charconv>
#include <limits>
#include <map>

#include "linux/NvidiaVersion.h"
#include "linux/SystemNumbers.h"
#include "qgf/AdapterName.h"
#include "qgf/SystemFiles.h"

namespace pmutil {
namespace {

const char kDrmClass[] = "/sys/class/drm/";
constexpr std::uint32_t kMaxModeSize = 1U << 16;

// The DRM nodes of one adapter.
struct Nodes {
    std::vector<std::string> cards;
    std::string render;
};

std::map<std::string, Nodes> NodesByAddress()
{
    std::map<std::string, Nodes> nodes;
    for (const auto& [name, address] : QGF::DrmNodes()) {
        if (name.compare(0, 4, "card") == 0) {
            nodes[address].cards.push_back(name);
        } else if (nodes[address].render.empty()) {
            nodes[address].render = name;
        }
    }
    return nodes;
}

std::uint32_t ReadId(const std::string& path, std::uint32_t limit)
{
    std::uint64_t id = 0;
    return ReadSystemNumber(path, id) && id <= limit ? static_cast<std::uint32_t>(id) : 0;
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

// xe's figure: one per tile of the card.
std::optional<std::uint64_t> ReadTiles(const std::string& folder)
{
    std::optional<std::uint64_t> total;
    for (const std::string& name : QGF::ListSystemFolder(folder)) {
        if (name.compare(0, 4, "tile") != 0) {
            continue;
        }
        const std::optional<std::uint64_t> tile =
            ReadSize(folder + name + "/physical_vram_size_bytes");
        if (tile && *tile <= std::numeric_limits<std::uint64_t>::max() - total.value_or(0)) {
            total = total.value_or(0) + *tile;
        }
    }
    return total;
}

void ReadMemory(const std::string& folder, const Nodes& nodes, DrmAdapter& adapter)
{
    adapter.dedicatedBytes = ReadSize(folder + "mem_info_vram_total");
    if (!adapter.dedicatedBytes) {
        adapter.dedicatedBytes = ReadSize(folder + "lmem_total_bytes");
    }
    for (const std::string& card : nodes.cards) {
        if (!adapter.dedicatedBytes) {
            adapter.dedicatedBytes = ReadSize(kDrmClass + card + "/lmem_total_bytes");
        }
    }
    if (!adapter.dedicatedBytes) {
        adapter.dedicatedBytes = ReadTiles(folder);
    }
    adapter.sharedBytes = ReadSize(folder + "mem_info_gtt_total");
}

// The module behind a device's driver, or the driver itself where it is built into the kernel.
std::string ModuleOf(const std::string& device)
{
    std::string module = QGF::LastOfPath(QGF::ReadSystemLink(device + "driver/module"));
    if (!module.empty()) {
        return module;
    }
    return QGF::LastOfPath(QGF::ReadSystemLink(device + "driver"));
}

void ReadDriver(const std::string& folder, const Nodes& nodes, DrmAdapter& adapter)
{
    // The node's own device comes first: of a virtual card, the PCI function is only the transport.
    for (const std::string& card : nodes.cards) {
        if (adapter.driver.empty()) {
            adapter.driver = ModuleOf(kDrmClass + card + "/device/");
        }
    }
    if (adapter.driver.empty()) {
        adapter.driver = ModuleOf(folder);
    }
    if (adapter.driver.empty()) {
        return;
    }
    adapter.driverVersion = QGF::ReadSystemLine("/sys/module/" + adapter.driver + "/version");
    if (adapter.driver == "nvidia") {
        std::string text;
        QGF::ReadSystemFile("/proc/driver/nvidia/version", text);
        const NvidiaVersion nvidia = ParseNvidiaVersion(text);
        if (adapter.driverVersion.empty()) {
            adapter.driverVersion = nvidia.version;
        }
        adapter.driverDate = nvidia.date;
    }
    if (adapter.driverVersion.empty()) {
        adapter.driverVersion = QGF::ReadSystemLine("/proc/sys/kernel/osrelease");
    }
}

// False if the connector has gone since it was listed.
bool ReadConnector(const std::string& folder, DrmConnector& connector)
{
    const std::string status = QGF::ReadSystemLine(folder + "/status");
    if (status == "connected") {
        connector.connected = true;
    } else if (status == "disconnected") {
        connector.connected = false;
    }
    if (connector.connected.value_or(false)) {
        ParseModeSize(QGF::ReadSystemLine(folder + "/modes"), connector.width, connector.height);
    }
    return connector.connected || !QGF::ListSystemFolder(folder).empty();
}

void ReadConnectors(const std::vector<std::string>& classNames, const Nodes& nodes,
                    DrmAdapter& adapter)
{
    for (const std::string& card : nodes.cards) {
        const std::string prefix = card + "-";
        for (const std::string& name : classNames) {
            if (name.compare(0, prefix.size(), prefix) != 0) {
                continue;
            }
            DrmConnector connector;
            connector.name = name.substr(prefix.size());
            if (ReadConnector(kDrmClass + name, connector)) {
                adapter.connectors.push_back(std::move(connector));
            }
        }
    }
}

void ReadRenderer(const Nodes& nodes, const std::vector<std::string>& nvidiaCards,
                  DrmAdapter& adapter)
{
    adapter.renderName = nodes.render;
    if (adapter.renderName.empty() &&
        std::find(nvidiaCards.begin(), nvidiaCards.end(), adapter.address) != nvidiaCards.end()) {
        adapter.renderName = "nvidia";
    }
    adapter.renders = !adapter.renderName.empty();
}

} // namespace

std::vector<DrmAdapter> ReadDrmAdapters()
{
    std::vector<DrmAdapter> adapters;
    const std::map<std::string, Nodes> nodesByAddress = NodesByAddress();
    const std::vector<std::string> classNames = QGF::ListSystemFolder(kDrmClass);
    const std::vector<std::string> nvidiaCards = QGF::ListSystemFolder("/proc/driver/nvidia/gpus");
    for (const std::string& address : QGF::DisplayAdapters()) {
        const std::string folder = "/sys/bus/pci/devices/" + address + "/";
        const auto found = nodesByAddress.find(address);
        const Nodes nodes = found == nodesByAddress.end() ? Nodes() : found->second;
        DrmAdapter adapter;
        adapter.address = address;
        adapter.name = QGF::AdapterName(address);
        ReadIds(folder, adapter);
        ReadMemory(folder, nodes, adapter);
        ReadDriver(folder, nodes, adapter);
        ReadConnectors(classNames, nodes, adapter);
        ReadRenderer(nodes, nvidiaCards, adapter);
        adapters.push_back(std::move(adapter));
    }
    return adapters;
}

bool ParseModeSize(const std::string& mode, std::uint32_t& width, std::uint32_t& height)
{
    const char* const end = mode.data() + mode.size();
    std::uint32_t parsedWidth = 0;
    std::uint32_t parsedHeight = 0;
    const auto first = std::from_chars(mode.data(), end, parsedWidth);
    if (first.ec != std::errc() || first.ptr == end || *first.ptr != 'x') {
        return false;
    }
    const auto second = std::from_chars(first.ptr + 1, end, parsedHeight);
    const std::string rest(second.ptr, end);
    if (second.ec != std::errc() || (!rest.empty() && rest != "i") || parsedWidth == 0 ||
        parsedHeight == 0 || parsedWidth > kMaxModeSize || parsedHeight > kMaxModeSize) {
        return false;
    }
    width = parsedWidth;
    height = parsedHeight;
    return true;
}

} // namespace pmutil
