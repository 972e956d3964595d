// Only symbolic links are read, which calls no driver. The kernel (Linux 6.12) makes them in
// drm_sysfs_minor_alloc (nodes, drivers/gpu/drm/drm_sysfs.c), sysfb_create_simplefb (parents of
// framebuffers, drivers/firmware/sysfb_simplefb.c) and virtio_pci_probe (virtio devices below PCI
// functions, drivers/virtio/virtio_pci_common.c).
//
// libdrm's drmGetDevices2 isn't used: it can't read a replaced root, lists no card without a node,
// and returns a framebuffer's platform device instead of the card. A test compares the two on
// machines that have nodes.
#include "qgf/DrmNodes.h"

#include <algorithm>
#include <iterator>

#include "qgf/SystemFiles.h"
#include "qgf/qgf_core/linux/PciAddress.h"

namespace QGF {
namespace {

const char kDrmClass[] = "/sys/class/drm";
const char kDevices[] = "/sys/devices/";

// The driver names of simpledrm and ofdrm.
const char* const kFirmwareDrivers[] = {"simple-framebuffer", "of-display"};

bool IsNumbered(const std::string& name, const std::string& prefix)
{
    return name.size() > prefix.size() && name.compare(0, prefix.size(), prefix) == 0 &&
           name.find_first_not_of("0123456789", prefix.size()) == std::string::npos;
}

bool IsDrmNode(const std::string& name)
{
    return IsNumbered(name, "card") || IsNumbered(name, "renderD");
}

// The path below /sys/devices of a node's device; empty if the kernel has no such node.
std::string DeviceOfNode(const std::string& name)
{
    const std::string link = ReadSystemLink(std::string(kDrmClass) + "/" + name);
    static const std::string gDevices = "/devices/";
    const std::string tail = "/drm/" + name;
    const std::size_t begin = link.find(gDevices);
    if (begin == std::string::npos || link.size() < begin + gDevices.size() + tail.size() ||
        link.compare(link.size() - tail.size(), tail.size(), tail) != 0)
        return std::string();
    return link.substr(begin + gDevices.size(),
                       link.size() - tail.size() - begin - gDevices.size());
}

DrmNode Locate(const std::string& name)
{
    DrmNode node;
    const std::string device = DeviceOfNode(name);
    if (device.empty())
        return node;
    node.name = name;
    node.device = kDevices + device;
    const std::string last = LastOfPath(device);
    if (IsPciAddress(last)) {
        node.place = last;
        return node;
    }
    const std::string driver = LastOfPath(ReadSystemLink(node.device + "/driver"));
    node.firmware = std::find(std::begin(kFirmwareDrivers), std::end(kFirmwareDrivers), driver) !=
                    std::end(kFirmwareDrivers);
    const std::string parent =
        LastOfPath(device.substr(0, std::min(device.rfind('/'), device.size())));
    if (IsPciAddress(parent) && (node.firmware || IsNumbered(last, "virtio")))
        node.place = parent;
    else if (!node.firmware && !driver.empty())
        node.place = device;
    return node;
}

} // namespace

std::vector<DrmNode> DrmNodes()
{
    std::vector<DrmNode> nodes;
    for (const std::string& name : ListSystemFolder(kDrmClass)) {
        if (IsDrmNode(name)) {
            DrmNode node = Locate(name);
            if (!node.place.empty())
                nodes.push_back(std::move(node));
        }
    }
    return nodes;
}

std::string AdapterOfDrmNode(const std::string& file)
{
    const std::string name = LastOfPath(file);
    return IsDrmNode(name) ? Locate(name).place : std::string();
}

bool IsFirmwareNode(const std::string& file)
{
    const std::string name = LastOfPath(file);
    return IsDrmNode(name) && Locate(name).firmware;
}

std::string AdapterFolder(const std::string& place)
{
    return (IsPciAddress(place) ? "/sys/bus/pci/devices/" : kDevices) + place + "/";
}

} // namespace QGF
