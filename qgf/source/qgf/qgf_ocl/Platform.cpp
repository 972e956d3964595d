#include "qgf/OCL.h"
#include "qgf/qgf_ocl/Answers.h"

namespace QGF {
namespace OCL {

namespace {

// CL_PLATFORM_NOT_FOUND_KHR of CL/cl_ext.h: the installable-driver loader found no platform.
constexpr cl_int kPlatformNotFound = -1001;

} // namespace

std::vector<Device> Platform::devices(cl_device_type type) const
{
    const FunctionTable& table = ExtensionManager::instance().table();
    const std::vector<cl_device_id> ids = ReadList<cl_device_id>(
        "clGetDeviceIDs", CL_DEVICE_NOT_FOUND,
        [&](cl_uint count, cl_device_id* handles, cl_uint* actualCount) {
            return table.clGetDeviceIDs(fHandle, type, count, handles, actualCount);
        });
    return {ids.begin(), ids.end()};
}

std::string Platform::version() const
{
    const FunctionTable& table = ExtensionManager::instance().table();
    return ReadText("clGetPlatformInfo(CL_PLATFORM_VERSION)", [&](std::size_t size, void* value,
                                                                  std::size_t* actualSize) {
        return table.clGetPlatformInfo(fHandle, CL_PLATFORM_VERSION, size, value, actualSize);
    });
}

std::vector<Platform> platforms()
{
    const FunctionTable& table = ExtensionManager::instance().table();
    const std::vector<cl_platform_id> ids =
        ReadList<cl_platform_id>("clGetPlatformIDs", kPlatformNotFound,
                                 [&](cl_uint count, cl_platform_id* handles, cl_uint* actualCount) {
                                     return table.clGetPlatformIDs(count, handles, actualCount);
                                 });
    return {ids.begin(), ids.end()};
}

} // namespace OCL
} // namespace QGF
