// The queries of an OpenCL device.
#include <string_view>
#include <utility>

#include <boost/make_shared.hpp>

#include "pmutil/Requirement.h"
#include "pmutil_gpu/GPU.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/TextBuffer.h"

namespace pmutil {

namespace {

constexpr std::string_view kVersionPrefix = "OpenCL ";

const QGF::OCL::FunctionTable& Table()
{
    return QGF::OCL::ExtensionManager::instance().table();
}

std::string WithoutVersionPrefix(const std::string& text)
{
    return text.compare(0, kVersionPrefix.size(), kVersionPrefix) == 0
               ? text.substr(kVersionPrefix.size())
               : text;
}

// The adapter lists aren't read for OpenCL devices, so their texts are empty. The default "?" means
// that an adapter wasn't found.
void ClearAdapterData(WMIData& data)
{
    for (std::string* text : {&data.fName, &data.fCaption, &data.fInstalledDisplayDrivers,
                              &data.fVideoModeDescription, &data.fDriverVersion, &data.fDriverDate})
        text->clear();
}

// Reads the platform's version and splits off the CUDA version that some platforms append.
void SplitVersion(const QGF::OCL::Device& device, std::string& platformVersion,
                  std::string& cudaVersion)
{
    constexpr std::string_view kCUDA = " CUDA ";
    platformVersion.clear();
    cudaVersion.clear();
    std::string text = WithoutVersionPrefix(device.platform().version());
    const std::size_t match = text.find(kCUDA);
    if (match != std::string::npos) {
        cudaVersion = text.substr(match + kCUDA.size());
        text.resize(match);
    }
    platformVersion = std::move(text);
}

} // namespace

GPUImpl::CLGPUs GPUImplHardware::DoGetCLGPUs()
{
    CLGPUs gpus;
    for (const QGF::OCL::Platform& platform : QGF::OCL::platforms()) {
        for (const QGF::OCL::Device& found : platform.devices(CL_DEVICE_TYPE_GPU)) {
            const boost::shared_ptr<GPUImplWin> impl = boost::make_shared<GPUImplWin>();
            ClearAdapterData(impl->fWMI);
            impl->device = found;
            gpus.push_back(boost::make_shared<CLGPU>(boost::shared_ptr<GPUImpl>(impl)));
        }
    }
    return gpus;
}

std::string GPUImplHardware::DoGetCLPlatformVersion()
{
    std::string platformVersion;
    std::string cudaVersion;
    SplitVersion(device, platformVersion, cudaVersion);
    return platformVersion;
}

std::uint32_t GPUImplHardware::DoGetCLMemoryMB()
{
    const cl_ulong bytes = device.getInfo<cl_ulong>(QGF::OCL::DeviceProperty::GlobalMemSize);
    return static_cast<std::uint32_t>(bytes >> 20U);
}

std::string GPUImplHardware::DoGetCLName()
{
    return device.name();
}

std::string GPUImplHardware::DoGetCLVendor()
{
    return device.vendor();
}

std::uint32_t GPUImplHardware::DoGetCLVendorID()
{
    return device.getInfo<cl_uint>(QGF::OCL::DeviceProperty::VendorID);
}

std::string GPUImplHardware::DoGetCLDriverVersion()
{
    const auto require = [](bool condition) {
        if (!condition)
            RequirementFailed(kNoFile, 0, "clGetDeviceInfo failed", true);
    };
    const auto clGetDeviceInfo = Table().clGetDeviceInfo;
    std::size_t size = 0;
    require(clGetDeviceInfo(device.id(), CL_DRIVER_VERSION, 0, nullptr, &size) == CL_SUCCESS);
    if (size == 0)
        return {};
    QGF::Core::TextBuffer text(size);
    require(clGetDeviceInfo(device.id(), CL_DRIVER_VERSION, size, text.data(), nullptr) ==
            CL_SUCCESS);
    return text.beforeFirstZero();
}

bool GPUImplHardware::DoGetCUDASupported()
{
    std::string platformVersion;
    std::string cudaVersion;
    SplitVersion(device, platformVersion, cudaVersion);
    return !cudaVersion.empty();
}

std::string GPUImplHardware::DoGetCUDAVersion()
{
    std::string platformVersion;
    std::string cudaVersion;
    SplitVersion(device, platformVersion, cudaVersion);
    return cudaVersion;
}

std::uint64_t GPUImplHardware::DoGetCLReserved()
{
    return 0;
}

std::string GPUImplHardware::DoGetCLDeviceVersion()
{
    const auto require = [](bool condition) {
        if (!condition)
            RequirementFailed(kNoFile, 0, "Failed requirement: status == CL_SUCCESS", true);
    };
    const auto clGetDeviceInfo = Table().clGetDeviceInfo;
    std::size_t size = 0;
    require(clGetDeviceInfo(device.id(), CL_DEVICE_VERSION, 0, nullptr, &size) == CL_SUCCESS);
    // `size` includes the terminating zero. A size of 0 wraps around, and the allocation throws
    // std::bad_alloc.
    QGF::Core::TextBuffer text(size - 1);
    require(clGetDeviceInfo(device.id(), CL_DEVICE_VERSION, size, text.data(), nullptr) ==
            CL_SUCCESS);
    return WithoutVersionPrefix(text.beforeFirstZero());
}

bool GPUImplHardware::DoIsIntegratedCLGPU()
{
    cl_bool unified = CL_FALSE;
    const cl_int status = Table().clGetDeviceInfo(device.id(), CL_DEVICE_HOST_UNIFIED_MEMORY,
                                                  sizeof unified, &unified, nullptr);
    return status == CL_SUCCESS && unified != CL_FALSE;
}

} // namespace pmutil
