// Names of graphics adapters. The display devices of QGF::OGL and the system's adapter list both
// use these functions, so that their names match.
//
// Adapter data is read by the first call and cached until the system root changes, so that an
// adapter keeps one name for the whole run. Only std::bad_alloc is thrown. Main thread only.
#pragma once

#include <string>
#include <vector>

#include "qgf/SystemFiles.h"

namespace QGF {

// Returns the places (qgf/DrmNodes.h) of the display adapters: first the PCI addresses of all PCI
// devices that are of the display class or have a DRM node, then the adapters that aren't on PCI,
// each group in ascending order.
const std::vector<std::string>& DisplayAdapters();

// Returns the name of the adapter at `place`, empty if there is no such adapter. A PCI adapter is
// named by the first of these sources that has a name: the NVIDIA driver's model text (not read
// while the card is suspended, since reading it would wake the card), amdgpu's product name, the
// PCI id database's "vendor device", "vendor:device" in hexadecimal. Another adapter is named by
// the device tree's "compatible" text, else by its driver.
//
// The name is printable ASCII without double quotes and backslashes, since the adapter lists escape
// those and all other characters, and an escaped name matches no other text. It has at most 127
// characters. If several display adapters have the same name, " (PCI address)" is appended to each,
// or a sequence number to those that aren't on PCI.
std::string AdapterName(const std::string& place);

// Returns the PCI addresses of the NVIDIA devices that an EGL driver lists without a DRM node, in
// the order of `names`; an unknown address is empty. `names` are the device names that the driver
// reports, empty for none; `taken` are the addresses already assigned to other devices. A device is
// assigned to a card that the NVIDIA driver lists under /proc: by name if it equals the card's
// model text, else in order if as many devices as cards remain. If the driver lists no card, a
// single device is assigned to the single card of that vendor.
std::vector<std::string> NvidiaAdapters(const std::vector<std::string>& names,
                                        const std::vector<std::string>& taken);

} // namespace QGF
