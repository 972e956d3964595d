// A display adapter of the operating system's DXGI list. On Linux the adapter source fills the same
// structure.
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

    // Lists the adapters of the current source that drive at least one desktop display. A failure
    // is logged and ends the list; no exception is thrown.
    static std::vector<DXGIData> GetAllDevices();

    // Returns the description, escaped.
    std::string GetDeviceName() const override;
    // Returns megabytes: dedicated memory, and for an integrated adapter with less than 1 GiB also
    // shared memory. Throws std::runtime_error "GlobalMemoryStatusEx failed" if the size of the
    // physical memory is needed and unknown.
    std::uint32_t GetMemoryMB() const override;
    std::uint32_t GetVendorID() const override;
    std::uint32_t GetDeviceID() const override;
    // Returns the same text as GetDeviceName.
    std::string GetDescription() const override;

    // Returns true for an adapter of AMD or Intel with less than 128 MB of dedicated video memory.
    bool IsIntegrated() const;

    AdapterDescriptor fAdapterDesc;
};

// Print the texts of the log lines.
std::ostream& operator<<(std::ostream& out, const AdapterDescriptor& descriptor);
std::ostream& operator<<(std::ostream& out, const OutputDescriptor& descriptor);
std::ostream& operator<<(std::ostream& out, const OutputDescriptor::Rect& rect);

} // namespace pmutil

namespace QGF {
namespace OGL {
std::ostream& operator<<(std::ostream& out, const DisplayDeviceKey& key);
} // namespace OGL
} // namespace QGF
