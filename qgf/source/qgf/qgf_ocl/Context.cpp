#include "qgf/OCL.h"
#include "qgf/qgf_ocl/Status.h"

namespace QGF {
namespace OCL {

namespace {

cl_context Create(const ContextProperties& properties, cl_device_id device,
                  const ContextCallback& callback)
{
    cl_int status = CL_SUCCESS;
    const cl_context context = ExtensionManager::instance().table().clCreateContext(
        properties.data(), 1, &device, callback.function, callback.user, &status);
    CheckStatus("clCreateContext", status);
    if (context == nullptr)
        ThrowBadAnswer("clCreateContext", "the driver returns no context");
    return context;
}

} // namespace

ContextProperties::ContextProperties(const Platform& platform)
    : fProperties{CL_CONTEXT_PLATFORM, reinterpret_cast<cl_context_properties>(platform.id()), 0}
{}

Context::Context(const ContextProperties& properties, const Device& device,
                 const ContextCallback& callback)
    : OpenCLObjectWrapper(Create(properties, device.id(), callback))
{}

Context::~Context()
{
    HandleTraits<cl_context>::Release(fHandle);
}

} // namespace OCL
} // namespace QGF
