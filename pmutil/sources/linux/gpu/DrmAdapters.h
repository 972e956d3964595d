// The machine's display adapters as the Linux kernel describes them.
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
    // Whether a display is attached, as the kernel last saw it; nothing if it doesn't tell.
    std::optional<bool> connected;
    // The display's preferred mode in pixels; 0 if none is known.
    std::uint32_t width = 0;
    std::uint32_t height = 0;
};

// A display adapter. What couldn't be read is 0, empty or absent; one that isn't on PCI has no ids.
struct DrmAdapter {
    std::string place; // "0000:01:00.0"; qgf/DrmNodes.h tells of the others
    std::string name;  // QGF::AdapterName's
    std::uint32_t vendor = 0;
    std::uint32_t device = 0;
    std::uint32_t subsystem = 0; // the subsystem's device in the upper 16 bits, its vendor below
    std::uint32_t revision = 0;
    // The card's own memory, or the part of it that the processor can see where the driver can't
    // be asked.
    std::optional<std::uint64_t> dedicatedBytes;
    std::optional<std::uint64_t> sharedBytes; // the system memory that it may map
    std::string driver;                       // the kernel module; empty if none is bound
    std::string driverVersion;                // empty only without a driver
    std::string driverDate;                   // in WMI's form; empty if it isn't known
    std::vector<DrmConnector> connectors;
    // Something of the card that renders without a display: a render node, or, as the NVIDIA
    // driver does without its DRM part, the driver's own entry.
    bool renders = false;
    std::string renderName; // that node or entry
};

// All adapters in the order of QGF::DisplayAdapters, under QGF::SystemRoot. Reads only, wakes no
// card, throws nothing but std::bad_alloc.
std::vector<DrmAdapter> ReadDrmAdapters();

// The same, read at the first question and kept until the root changes, so that all lists of a run
// agree. Never null. Main thread only.
std::shared_ptr<const std::vector<DrmAdapter>> KnownDrmAdapters();

// The size in a mode's name, such as "1920x1080" or "1920x1080i".
bool ParseModeSize(const std::string& mode, std::uint32_t& width, std::uint32_t& height);

} // namespace pmutil
