// Reads the machine's display adapters from the Linux kernel.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace pmutil {

// A connector of a card.
struct DrmConnector {
    std::string name; // such as "HDMI-A-1"
    // Whether a display was attached at the kernel's last detection; empty if unknown.
    std::optional<bool> connected;
    // The display's preferred mode in pixels; 0 if unknown.
    std::uint32_t width = 0;
    std::uint32_t height = 0;
};

// A display adapter. Data that can't be read is 0 or empty; an adapter that isn't on PCI has no
// ids.
struct DrmAdapter {
    std::string place; // such as "0000:01:00.0", as qgf/DrmNodes.h defines it
    std::string name;  // from QGF::AdapterName
    std::uint32_t vendor = 0;
    std::uint32_t device = 0;
    std::uint32_t subsystem = 0; // upper 16 bits: device id, lower 16 bits: vendor id
    std::uint32_t revision = 0;
    // Dedicated memory. If the driver can't be queried, the size of the largest BAR, which may show
    // only a part of it.
    std::optional<std::uint64_t> dedicatedBytes;
    std::optional<std::uint64_t> sharedBytes; // the system memory that the adapter may map
    std::string driver;                       // the kernel module; empty if none is bound
    std::string driverVersion;                // empty only without a driver
    std::string driverDate;                   // in WMI's form; empty if unknown
    std::vector<DrmConnector> connectors;
    // Whether the card can render without a display: it has a render node, or an entry under
    // /proc/driver/nvidia, which stands for the render node if the driver's DRM module isn't
    // loaded.
    bool renders = false;
    std::string renderName; // the render node, or "nvidia" for the entry
};

// Returns all adapters in the order of QGF::DisplayAdapters, under QGF::SystemRoot. Wakes no
// suspended card. Throws only std::bad_alloc.
std::vector<DrmAdapter> ReadDrmAdapters();

// Returns the same list, cached by the first call until the root changes, so that all lists of a
// run agree. Never null. Main thread only.
std::shared_ptr<const std::vector<DrmAdapter>> CachedDrmAdapters();

// Parses the name of a mode, such as "1920x1080" or "1920x1080i". Returns false, with `width` and
// `height` unchanged, for any other text and for sizes above 65536.
bool ParseModeSize(const std::string& mode, std::uint32_t& width, std::uint32_t& height);

} // namespace pmutil
