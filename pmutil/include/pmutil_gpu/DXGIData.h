// One display adapter as the display interface of the operating system sees it.
#pragma once

#include <ostream>
#include <vector>

#include "pmutil_gpu/AdapterSource.h"
#include "pmutil_gpu/GPUData.h"

namespace QGF {
namespace OGL {
class DisplayDeviceKey;
}
} // namespace QGF

namespace pmutil {

// PCI vendor ids.
inline constexpr std::uint32_t kVendorAMD = 0x1002;
inline constexpr std::uint32_t kVendorNVIDIA = 0x10DE;
inline constexpr std::uint32_t kVendorIntel = 0x8086;

class DXGIData : public GPUData {
public:
    DXGIData() = default;
    explicit DXGIData(const AdapterDescriptor& descriptor) : fAdapterDesc(descriptor) {}

    // The adapters of the current source that drive at least one desktop display, in their order. A
    // failure is logged and ends the list; no exception comes out.
    static std::vector<DXGIData> GetAllDevices();

    // The description, escaped.
    std::string GetDeviceName() const override;
    // Megabytes; shared memory counts for small integrated adapters. Throws std::runtime_error
    // "GlobalMemoryStatusEx failed" if physical memory is needed and the system doesn't say.
    std::uint32_t GetMemoryMB() const override;
    std::uint32_t GetVendorID() const override;
    std::uint32_t GetDeviceID() const override;
    std::string GetDescription() const override;

    // Whether the adapter shares the processor's memory: AMD's and Intel's with less than 128 MB of
    // their own. Any other vendor's counts as discrete.
    bool IsIntegrated() const;

    AdapterDescriptor fAdapterDesc;
};

// The texts of the log lines.
std::ostream& operator<<(std::ostream& out, const AdapterDescriptor& descriptor);
std::ostream& operator<<(std::ostream& out, const OutputDescriptor& descriptor);
std::ostream& operator<<(std::ostream& out, const OutputDescriptor::Rect& rect);

} // namespace pmutil

namespace QGF {
namespace OGL {
std::ostream& operator<<(std::ostream& out, const DisplayDeviceKey& key);
} // namespace OGL
} // namespace QGF
