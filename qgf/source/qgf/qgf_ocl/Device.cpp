#include "qgf/OCL.h"
#include "qgf/qgf_ocl/Answers.h"

namespace QGF {
namespace OCL {

namespace {

std::string GetInfoText(cl_device_id device, cl_device_info property, const char* call)
{
    const FunctionTable& table = ExtensionManager::instance().table();
    return ReadText(call, [&](std::size_t size, void* value, std::size_t* actualSize) {
        return table.clGetDeviceInfo(device, property, size, value, actualSize);
    });
}

// Reads a value of a known size.
void GetInfoValue(cl_device_id device, cl_device_info property, const char* call, std::size_t size,
                  void* value, std::size_t* actualSize)
{
    std::size_t returned = size;
    CheckStatus(call, ExtensionManager::instance().table().clGetDeviceInfo(device, property, size,
                                                                           value, &returned));
    if (actualSize != nullptr)
        *actualSize = returned;
    if (returned != size)
        ThrowBadAnswer(call, "the driver returns " + std::to_string(returned) +
                                 " bytes instead of " + std::to_string(size));
}

} // namespace

Platform Device::platform() const
{
    constexpr char kCall[] = "clGetDeviceInfo(CL_DEVICE_PLATFORM)";
    cl_platform_id platform = nullptr;
    GetInfoValue(fHandle, CL_DEVICE_PLATFORM, kCall, sizeof(cl_platform_id), &platform, nullptr);
    // To most OpenCL functions a null platform means any platform.
    if (platform == nullptr)
        ThrowBadAnswer(kCall, "the driver returns no platform");
    return Platform(platform);
}

std::string Device::name() const
{
    return GetInfoText(fHandle, CL_DEVICE_NAME, "clGetDeviceInfo(CL_DEVICE_NAME)");
}

std::string Device::vendor() const
{
    return GetInfoText(fHandle, CL_DEVICE_VENDOR, "clGetDeviceInfo(CL_DEVICE_VENDOR)");
}

void Device::getInfoImpl(DeviceProperty property, std::size_t size, void* value,
                         std::size_t* actualSize) const
{
    const char* const call =
        property == DeviceProperty::VendorID        ? "clGetDeviceInfo(CL_DEVICE_VENDOR_ID)"
        : property == DeviceProperty::GlobalMemSize ? "clGetDeviceInfo(CL_DEVICE_GLOBAL_MEM_SIZE)"
                                                    : "clGetDeviceInfo";
    GetInfoValue(fHandle, static_cast<cl_device_info>(property), call, size, value, actualSize);
}

} // namespace OCL
} // namespace QGF
