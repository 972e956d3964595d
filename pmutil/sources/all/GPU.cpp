#include "pmutil_gpu/GPU.h"

#include <utility>

namespace pmutil {

GPU::GPU(boost::shared_ptr<GPUImpl> implementation) : impl(std::move(implementation)) {}

std::string GLGPU::GetVersion() const
{
    return impl->GetGLVersion();
}
std::uint32_t GLGPU::GetMemoryMB() const
{
    return impl->GetGLMemoryMB();
}
std::string GLGPU::GetName() const
{
    return impl->GetGLName();
}
std::string GLGPU::GetVendor() const
{
    return impl->GetGLVendor();
}
std::uint32_t GLGPU::GetVendorID() const
{
    return impl->GetGLVendorID();
}
std::string GLGPU::GetDriverVersion() const
{
    return impl->GetGLDriverVersion();
}
bool GLGPU::IsIntegrated() const
{
    return impl->IsIntegratedGLGPU();
}

std::string CLGPU::GetVersion() const
{
    return impl->GetCLPlatformVersion();
}
std::uint32_t CLGPU::GetMemoryMB() const
{
    return impl->GetCLMemoryMB();
}
std::string CLGPU::GetName() const
{
    return impl->GetCLName();
}
std::string CLGPU::GetVendor() const
{
    return impl->GetCLVendor();
}
std::uint32_t CLGPU::GetVendorID() const
{
    return impl->GetCLVendorID();
}
std::string CLGPU::GetDriverVersion() const
{
    return impl->GetCLDriverVersion();
}
bool CLGPU::IsIntegrated() const
{
    return impl->IsIntegratedCLGPU();
}
bool CLGPU::GetCUDASupported() const
{
    return impl->GetCUDASupported();
}
std::string CLGPU::GetCUDAVersion() const
{
    return impl->GetCUDAVersion();
}
double CLGPU::GetCLBandwidth() const
{
    return impl->GetCLBandwidth();
}
std::uint64_t CLGPU::GetCLReserved() const
{
    return impl->GetCLReserved();
}
std::string CLGPU::GetCLDeviceVersion() const
{
    return impl->GetCLDeviceVersion();
}

} // namespace pmutil
