// Lists the display adapters of a Linux machine for its identity.
#pragma once

#include <vector>

#include "identity/Identity.h"
#include "identity/linux/Files.h"

namespace assay_host {

// Lists the PCI functions of the display classes or with a DRM node, and the other devices that
// have a DRM node and a driver. Lists no framebuffer of the firmware. Reads only files of the
// kernel that wake no card. Throws only std::bad_alloc. Any thread may call.
std::vector<AdapterIdentity> ListAdapters(const Files& files);

} // namespace assay_host
