#include "qgf/OCL.h"
#include "qgf/qgf_ocl/Status.h"

namespace QGF {
namespace OCL {

namespace {

cl_command_queue Create(cl_context context, cl_device_id device, bool outOfOrder, bool profiling)
{
    const cl_command_queue_properties properties =
        (outOfOrder ? CL_QUEUE_OUT_OF_ORDER_EXEC_MODE_ENABLE : cl_command_queue_properties{0}) |
        (profiling ? CL_QUEUE_PROFILING_ENABLE : cl_command_queue_properties{0});
    cl_int status = CL_SUCCESS;
    const cl_command_queue queue = ExtensionManager::instance().table().clCreateCommandQueue(
        context, device, properties, &status);
    CheckStatus("clCreateCommandQueue", status);
    if (queue == nullptr)
        ThrowBadAnswer("clCreateCommandQueue", "the driver returns no queue");
    return queue;
}

} // namespace

CommandQueue::CommandQueue(const Context& context, const Device& device, bool outOfOrder,
                           bool profiling)
    : OpenCLObjectWrapper(Create(context.handle(), device.id(), outOfOrder, profiling))
{}

CommandQueue::~CommandQueue()
{
    HandleTraits<cl_command_queue>::Release(fHandle);
}

} // namespace OCL
} // namespace QGF
