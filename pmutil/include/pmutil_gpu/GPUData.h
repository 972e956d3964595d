// An adapter of one of the operating system's lists.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

class GPUData {
public:
    virtual ~GPUData() = default;
    // The same text as GetDescription in both implementations.
    virtual std::string GetDeviceName() const = 0;
    // Bytes in WMIData, megabytes in DXGIData.
    virtual std::uint32_t GetMemoryMB() const = 0;
    virtual std::uint32_t GetVendorID() const = 0;
    virtual std::uint32_t GetDeviceID() const = 0;
    virtual std::string GetDescription() const = 0;
};

} // namespace pmutil
