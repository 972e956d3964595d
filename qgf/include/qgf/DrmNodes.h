// The DRM nodes of a Linux machine and the adapters that they belong to.
//
// An adapter's place is its PCI address, such as "0000:01:00.0", or, of an adapter that isn't on
// PCI, the path of its device below /sys/devices, such as "platform/soc/fec00000.v3d".
//
// Nothing here throws but std::bad_alloc. Main thread only.
#pragma once

#include <string>
#include <vector>

namespace QGF {

// A DRM node of an adapter.
struct DrmNode {
    std::string name;   // "card0" or "renderD128"
    std::string place;  // the adapter's
    std::string device; // the folder of the device that the node belongs to, "/sys/devices/..."
    // A framebuffer that the firmware has set up: it shows a picture, but no driver draws there.
    bool firmware = false;
};

// The nodes of adapters as the kernel lists them now, in the order of their names. A node belongs
// to a PCI adapter if its device is a PCI function, or a virtio device or firmware framebuffer
// right below one; a USB display has the controller above it, but isn't that. Any other device that
// a driver is bound to is an adapter by itself, unless it is a firmware framebuffer. Devices that
// no driver is bound to (vgem, vkms, the compute partitions of amdgpu) are no hardware.
std::vector<DrmNode> DrmNodes();

// The place of the adapter behind a DRM node file such as "/dev/dri/card0"; empty if the kernel
// knows no such node or it belongs to no adapter.
std::string AdapterOfDrmNode(const std::string& file);

// Whether such a file is that of a framebuffer that the firmware has set up. What renders there is
// software, on the card's picture.
bool IsFirmwareNode(const std::string& file);

// The folder in which the kernel describes the adapter at that place, with a slash at the end.
std::string AdapterFolder(const std::string& place);

} // namespace QGF
