// The files that are read here don't wake a suspended card: "class", "vendor" and "device" of a PCI
// function print fields of the kernel's struct pci_dev (drivers/pci/pci-sysfs.c), and
// /sys/module/NAME/version and the links "driver" and "module" belong to the module. "config",
// "vpd" and "rom" aren't read, since they resume the device, and no node in /dev is opened.
#include "identity/linux/Adapters.h"

#include <algorithm>
#include <charconv>
#include <iterator>
#include <set>
#include <string>
#include <string_view>
#include <system_error>

namespace assay_host {

namespace {

constexpr char kPciDevices[] = "/sys/bus/pci/devices/";
constexpr char kDrmClass[] = "/sys/class/drm/";
constexpr char kDevices[] = "/sys/devices/";
constexpr unsigned kDisplayClass = 0x03;
constexpr unsigned kMaxClass = 0xFFFFFF;
constexpr unsigned kMaxId = 0xFFFF;

// The drivers of framebuffers that the firmware has set up. Such a node is no adapter.
constexpr const char* kFirmwareDrivers[] = {"simple-framebuffer", "of-display"};

std::string GetLast(const std::string& path)
{
    return path.substr(path.rfind('/') + 1);
}

std::string GetParent(const std::string& path)
{
    return path.substr(0, std::min(path.rfind('/'), path.size()));
}

// Reads an id as the kernel prints it: "0x10de". Returns 0 for any other text.
unsigned ReadId(const Files& files, const std::string& path, unsigned max)
{
    const std::string line = files.ReadLine(path);
    if (line.compare(0, 2, "0x") != 0)
        return 0;
    unsigned id = 0;
    const char* const end = line.data() + line.size();
    const auto result = std::from_chars(line.data() + 2, end, id, 16);
    return result.ec == std::errc() && result.ptr == end && id <= max ? id : 0;
}

bool StartsWith(const std::string& text, std::string_view start)
{
    return text.compare(0, start.size(), start) == 0;
}

bool IsNumbered(const std::string& name, std::string_view prefix)
{
    return name.size() > prefix.size() && StartsWith(name, prefix) &&
           name.find_first_not_of("0123456789", prefix.size()) == std::string::npos;
}

// Returns the module of a device's driver, or the driver's name if it is built into the kernel.
std::string GetDriver(const Files& files, const std::string& device)
{
    const std::string module = GetLast(files.ReadLink(device + "/driver/module"));
    return module.empty() ? GetLast(files.ReadLink(device + "/driver")) : module;
}

// Returns the graphics driver. That of a virtio card is bound to a device below the PCI function.
std::string GetGraphicsDriver(const Files& files, const std::string& device)
{
    std::string driver = GetDriver(files, device);
    if (!StartsWith(driver, "virtio_") && !StartsWith(driver, "virtio-"))
        return driver;
    for (const std::string& name : files.List(device)) {
        if (!IsNumbered(name, "virtio"))
            continue;
        std::string below = GetDriver(files, JoinPath(device, name));
        if (!below.empty())
            return below;
    }
    return driver;
}

void SetDriver(const Files& files, const std::string& device, AdapterIdentity& adapter)
{
    adapter.fDriver = GetGraphicsDriver(files, device);
    if (adapter.fDriver.empty())
        return;
    adapter.fDriverVersion = files.ReadLine("/sys/module/" + adapter.fDriver + "/version");
    if (adapter.fDriverVersion.empty() && adapter.fDriver == "nvidia")
        adapter.fDriverVersion = files.ReadLine("/proc/driver/nvidia/version");
}

// Returns the path below /sys/devices of a node's device.
std::string GetNodeDevice(const Files& files, const std::string& node)
{
    static constexpr std::string_view kStart = "/devices/";
    const std::string link = files.ReadLink(kDrmClass + node);
    const std::string tail = "/drm/" + node;
    const std::size_t begin = link.find(kStart);
    if (begin == std::string::npos || link.size() < begin + kStart.size() + tail.size() ||
        link.compare(link.size() - tail.size(), tail.size(), tail) != 0)
        return {};
    return link.substr(begin + kStart.size(), link.size() - tail.size() - begin - kStart.size());
}

std::set<std::string> ListNodeDevices(const Files& files)
{
    std::set<std::string> devices;
    for (const std::string& node : files.List(kDrmClass))
        if (IsNumbered(node, "card") || IsNumbered(node, "renderD"))
            devices.insert(GetNodeDevice(files, node));
    devices.erase("");
    return devices;
}

bool IsFirmwareDriver(const std::string& driver)
{
    return std::find(std::begin(kFirmwareDrivers), std::end(kFirmwareDrivers), driver) !=
           std::end(kFirmwareDrivers);
}

} // namespace

std::vector<AdapterIdentity> ListAdapters(const Files& files)
{
    const std::set<std::string> devices = ListNodeDevices(files);
    std::set<std::string> withNode;
    for (const std::string& device : devices)
        withNode.insert(GetLast(device));

    std::vector<AdapterIdentity> adapters;
    std::set<std::string> onPci;
    for (const std::string& slot : files.List(kPciDevices)) {
        const std::string device = kPciDevices + slot;
        if (withNode.count(slot) == 0 &&
            ReadId(files, device + "/class", kMaxClass) >> 16 != kDisplayClass)
            continue;
        AdapterIdentity adapter;
        adapter.fSlot = slot;
        adapter.fVendor = ReadId(files, device + "/vendor", kMaxId);
        adapter.fDevice = ReadId(files, device + "/device", kMaxId);
        SetDriver(files, device, adapter);
        adapters.push_back(std::move(adapter));
        onPci.insert(slot);
    }
    for (const std::string& device : devices) {
        if (onPci.count(GetLast(device)) != 0 || onPci.count(GetLast(GetParent(device))) != 0)
            continue;
        AdapterIdentity adapter;
        adapter.fSlot = device;
        SetDriver(files, kDevices + device, adapter);
        // A device without a driver, such as vgem's, isn't hardware.
        if (!adapter.fDriver.empty() && !IsFirmwareDriver(adapter.fDriver))
            adapters.push_back(std::move(adapter));
    }
    return adapters;
}

} // namespace assay_host
