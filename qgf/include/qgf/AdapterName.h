// The one place where a graphics adapter gets its name. The display devices of QGF::OGL and the
// system's adapter list both ask here, so that their names match.
//
// What is known of the adapters is read at the first question and kept until the root changes, so
// that an adapter keeps one name for the whole run. Nothing here throws but std::bad_alloc. Main
// thread only.
#pragma once

#include <string>
#include <vector>

#include "qgf/SystemFiles.h"

namespace QGF {

// The places (qgf/DrmNodes.h) of the display adapters: in ascending order the PCI addresses of
// every PCI device of the display class and every other one that has a DRM node, then in ascending
// order the adapters that aren't on PCI.
const std::vector<std::string>& DisplayAdapters();

// The name of the adapter at a place. Of a PCI adapter the first that is known of the NVIDIA
// driver's own model text (left alone while the card is suspended, for asking would wake it),
// amdgpu's product name, the PCI id database's "vendor device", and "vendor:device" in hexadecimal;
// of another adapter what the device tree says it is compatible with, else the driver's name. It is
// printable ASCII without double quotes and backslashes, since the adapter lists escape all else in
// ways that no other text matches. If another display adapter of the machine would get the same
// name, " (PCI address)" is appended to each, or, outside PCI, a number in their order. At most 127
// characters. Empty if there is no such adapter.
std::string AdapterName(const std::string& place);

// The PCI addresses of NVIDIA devices that an EGL driver lists without a DRM node, in their order
// there; empty where one can't be told. `names` are the names that the devices give themselves
// (empty for none), `taken` are addresses that other devices are known to have. Devices go to the
// cards that the NVIDIA driver lists under /proc: by name where it is a card's model text, else in
// order if there are as many of the one as of the other. Where the driver lists none, a single
// device goes to the single card of that vendor.
std::vector<std::string> NvidiaAdapters(const std::vector<std::string>& names,
                                        const std::vector<std::string>& taken);

} // namespace QGF
