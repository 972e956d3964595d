#include "qgf/OCL.h"
#include "qgf/qgf_core/Quietly.h"

namespace QGF {
namespace OCL {

namespace {

template <typename Handle>
using ReleaseCall = cl_int(CL_API_CALL*)(Handle handle);

template <typename Handle>
void ReleaseQuietly(ReleaseCall<Handle> FunctionTable::*call, Handle handle) noexcept
{
    Core::Quietly([&] { (ExtensionManager::instance().table().*call)(handle); });
}

} // namespace

void HandleTraits<cl_context>::Release(cl_context context) noexcept
{
    ReleaseQuietly(&FunctionTable::clReleaseContext, context);
}

void HandleTraits<cl_command_queue>::Release(cl_command_queue queue) noexcept
{
    ReleaseQuietly(&FunctionTable::clReleaseCommandQueue, queue);
}

void HandleTraits<cl_mem>::Release(cl_mem buffer) noexcept
{
    ReleaseQuietly(&FunctionTable::clReleaseMemObject, buffer);
}

void HandleTraits<cl_event>::Release(cl_event event) noexcept
{
    ReleaseQuietly(&FunctionTable::clReleaseEvent, event);
}

} // namespace OCL
} // namespace QGF
