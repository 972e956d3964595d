// The DRM nodes of a Linux machine and the adapters that they belong to.
//
// An adapter's place is its PCI address, such as "0000:01:00.0", or, if it isn't on PCI, the path
// of its device below /sys/devices, such as "platform/soc/fec00000.v3d".
//
// Only std::bad_alloc is thrown. Main thread only.
#pragma once

#include <string>
#include <vector>

namespace QGF {

// A DRM node of an adapter.
struct DrmNode {
    std::string name;   // "card0" or "renderD128"
    std::string place;  // of the adapter
    std::string device; // the folder of the node's device, "/sys/devices/..."
    // The node is a framebuffer that the firmware has set up; no driver of the adapter renders to
    // it.
    bool firmware = false;
};

// Lists the present DRM nodes of adapters, sorted by name. A node belongs to a PCI adapter if its
// device is a PCI function, or a virtio device or firmware framebuffer directly below one; a USB
// display, which is further below its controller, doesn't. Any other device with a driver bound to
// it is an adapter of its own, unless it is a firmware framebuffer. Nodes of devices without a
// driver (vgem, vkms, the compute partitions of amdgpu) are left out: they aren't hardware.
std::vector<DrmNode> DrmNodes();

// Returns the nodes that were present when QGF::DisplayAdapters (qgf/AdapterName.h) listed the
// adapters.
const std::vector<DrmNode>& DisplayNodes();

// Returns the place of the adapter of a DRM node file such as "/dev/dri/card0"; empty if the kernel
// has no such node or the node belongs to no adapter.
std::string AdapterOfDrmNode(const std::string& file);

// Returns whether the DRM node file is a framebuffer that the firmware has set up. Rendering there
// is done in software.
bool IsFirmwareNode(const std::string& file);

// Returns the folder in which the kernel describes the adapter at `place`, with a trailing slash.
std::string AdapterFolder(const std::string& place);

} // namespace QGF
