#include "all/gpu/ProfilingDuration.h"

#include "qgf/OCL.h"

namespace pmutil {

double ProfilingDuration(cl_event event)
{
    constexpr double kSecondsPerNanosecond = 1e-09;
    const QGF::OCL::FunctionTable& table = QGF::OCL::ExtensionManager::instance().table();
    cl_ulong end = 0;
    cl_ulong start = 0;
    table.clGetEventProfilingInfo(event, CL_PROFILING_COMMAND_END, sizeof end, &end, nullptr);
    table.clGetEventProfilingInfo(event, CL_PROFILING_COMMAND_START, sizeof start, &start, nullptr);
    return static_cast<double>(end - start) * kSecondsPerNanosecond;
}

} // namespace pmutil
