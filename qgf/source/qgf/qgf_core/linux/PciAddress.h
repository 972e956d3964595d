// PCI addresses as the kernel writes them: "0000:01:00.0", with a longer domain where it needs one.
#pragma once

#include <string>

namespace QGF {

bool IsPciAddress(const std::string& text);

// The last part of a device path, such as
// "../../devices/pci0000:00/0000:00:02.0/virtio0/drm/card0", that is a PCI address; empty if there
// is none.
std::string LastPciAddress(const std::string& path);

} // namespace QGF
