// Only links are read here, which calls no driver. Where they come from: the nodes from
// drm_sysfs_minor_alloc (drivers/gpu/drm/drm_sysfs.c), the framebuffers' parents from
// sysfb_create_simplefb (drivers/firmware/sysfb_simplefb.c), virtio devices below PCI functions
// from virtio_pci_probe (drivers/virtio/virtio_pci_common.c), all of Linux 6.12.
//
// libdrm's drmGetDevices2 lists nodes too, but it can't be pointed at a replaced root, lists no
// card without a node, and gives a framebuffer's platform device instead of the card below it. A
// test holds the two to the same answer where a machine has nodes.
#include "qgf/DrmNodes.h"

#include <algorithm>
#include <iterator>

#include "qgf/SystemFiles.h"
#include "qgf/qgf_core/linux/PciAddress.h"

namespace QGF {
namespace {

const char kDrmClass[] = "/sys/class/drm";
const char kDevices[] = "/sys/devices/";

// simpledrm and ofdrm, by the drivers' names.
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

// The path below /sys/devices of a node's device; empty if the kernel knows no such node.
std::string DeviceOfNode(const std::string& name)
{
    const std::string link = ReadSystemLink(std::string(kDrmClass) + "/" + name);
    static const std::string gDevices = "/devices/";
    const std::string tail = "/drm/" + name;
    const std::size_t begin = link.find(gDevices);
    if (begin == std::string::npos || link.size() < begin + gDevices.size() + tail.size() ||
        link.compare(link.size() - tail.size(), tail.size(), tail) != 0) {
        return std::string();
    }
    return link.substr(begin + gDevices.size(),
                       link.size() - tail.size() - begin - gDevices.size());
}

DrmNode Locate(const std::string& name)
{
    DrmNode node;
    const std::string device = DeviceOfNode(name);
    if (device.empty()) {
        return node;
    }
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
    if (IsPciAddress(parent) && (node.firmware || IsNumbered(last, "virtio"))) {
        node.place = parent;
    } else if (!node.firmware && !driver.empty()) {
        node.place = device;
    }
    return node;
}

} // namespace

std::vector<DrmNode> DrmNodes()
{
    std::vector<DrmNode> nodes;
    for (const std::string& name : ListSystemFolder(kDrmClass)) {
        if (IsDrmNode(name)) {
            DrmNode node = Locate(name);
            if (!node.place.empty()) {
                nodes.push_back(std::move(node));
            }
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
