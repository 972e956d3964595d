// A record of one OpenGL or OpenCL device. A record shares ownership of a GPUImpl and forwards each
// query to it; it stores no results. With a null GPUImpl, a query fails the shared pointer's
// assertion.
#pragma once

#include <cstdint>
#include <string>

#include <boost/shared_ptr.hpp>

#include "pmutil_gpu/GPUImpl.h"

namespace pmutil {

class GPU {
public:
    explicit GPU(boost::shared_ptr<GPUImpl> implementation);
    virtual ~GPU() = default;

    virtual std::string GetVersion() const = 0;
    virtual std::uint32_t GetMemoryMB() const = 0;
    virtual std::string GetName() const = 0;
    virtual std::string GetVendor() const = 0;
    virtual std::uint32_t GetVendorID() const = 0;
    virtual std::string GetDriverVersion() const = 0;
    virtual bool IsIntegrated() const = 0;

    const boost::shared_ptr<GPUImpl> impl;
};

class GLGPU : public GPU {
public:
    using GPU::GPU;

    std::string GetVersion() const override;
    std::uint32_t GetMemoryMB() const override;
    std::string GetName() const override;
    std::string GetVendor() const override;
    std::uint32_t GetVendorID() const override;
    std::string GetDriverVersion() const override;
    bool IsIntegrated() const override;
};

class CLGPU : public GPU {
public:
    using GPU::GPU;

    std::string GetVersion() const override;
    std::uint32_t GetMemoryMB() const override;
    std::string GetName() const override;
    std::string GetVendor() const override;
    std::uint32_t GetVendorID() const override;
    std::string GetDriverVersion() const override;
    bool IsIntegrated() const override;

    virtual bool GetCUDASupported() const;
    virtual std::string GetCUDAVersion() const;
    virtual double GetCLBandwidth() const;
    virtual std::uint64_t GetCLReserved() const;
    virtual std::string GetCLDeviceVersion() const;

    // Reserved: always -1.
    const std::int32_t fReserved = -1;
};

} // namespace pmutil
