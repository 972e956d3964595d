#include "all/gpu/OnProfilingQueue.h"

#include <optional>

#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace pmutil {

double OnProfilingQueue(const char* name, const char* resultLabel, const QGF::OCL::Device& device,
                        CLMeasurement measure)
{
    std::optional<PMLogScope> scope;
    if (GetDebugValue(gGPUAssay) >= 1)
        scope.emplace(name, __FILE__, __LINE__);

    const QGF::OCL::Platform platform = device.platform();
    const QGF::OCL::ContextProperties properties(platform);
    PM_LOG(gGPUAssay, name << ": QGF::OCL::Context context(properties, *iDev);");
    const QGF::OCL::Context context(properties, device, QGF::OCL::ContextCallback{});
    PM_LOG(gGPUAssay, name << ": QGF::OCL::CommandQueue cq(context, *iDev, false, true);");
    const QGF::OCL::CommandQueue queue(context, device, false, true);

    const double result = measure(context, queue);
    PM_LOG(gGPUAssay, resultLabel << result);
    PM_LOG(gGPUAssay, name << ": result=" << result);
    return result;
}

} // namespace pmutil
