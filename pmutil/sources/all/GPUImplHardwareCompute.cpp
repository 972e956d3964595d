// Measures the compute speed of an OpenCL device.
#include <cstdlib>
#include <optional>
#include <vector>

#include "all/gpu/CheckCLError.h"
#include "all/gpu/OnProfilingQueue.h"
#include "all/gpu/ProfilingDuration.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace pmutil {

namespace {

constexpr std::size_t kFloats = 0x100000;
constexpr std::size_t kLocalSize = 64;
constexpr double kScoreNumerator = 8.0;

// The kernel is one line; seven tabs and two blanks separate the statements. Some drivers cache
// built programs by their text, so even a change of blanks may change the result.
#define PMUTIL_GAP "\t\t\t\t\t\t\t  "
constexpr char kKernelText[] =
    "__kernel void justIterate( __global float* v, unsigned int len ){" PMUTIL_GAP
    "int gid = get_global_id(0);" PMUTIL_GAP "if(gid>=len) return;" PMUTIL_GAP
    "float data = v[gid];" PMUTIL_GAP "float variant = (float)(gid % 3);" PMUTIL_GAP
    "for ( int i = 0 ; i < 4096; i++){" PMUTIL_GAP "data = data  *  1.2f * variant ;" PMUTIL_GAP
    "}" PMUTIL_GAP "v [ gid ] = data ;" PMUTIL_GAP "}";
#undef PMUTIL_GAP

std::vector<float> MakeData()
{
    std::vector<float> data(kFloats);
    // Don't seed rand(): all runs must process the same data.
    for (float& value : data)
        value = static_cast<float>(std::rand()); // NOLINT(concurrency-mt-unsafe): main thread only
    return data;
}

double MeasureCLCompute(const QGF::OCL::Context& context, const QGF::OCL::CommandQueue& queue)
{
    constexpr char kName[] = "GPUImplHardware::MeasureCLCompute";
    std::optional<PMLogScope> scope;
    if (GetDebugValue(gGPUAssay) >= 1)
        scope.emplace(kName, __FILE__, __LINE__);
    const QGF::OCL::FunctionTable& table = QGF::OCL::ExtensionManager::instance().table();

    std::vector<float> data = MakeData();

    cl_int ciErrNum = CL_SUCCESS;
    const char* text = kKernelText;
    const cl_program program =
        table.clCreateProgramWithSource(context.handle(), 1, &text, nullptr, &ciErrNum);
    CheckCLError(ciErrNum);
    CheckCLError(table.clBuildProgram(program, 0, nullptr, nullptr, nullptr, nullptr));
    const cl_kernel kernel = table.clCreateKernel(program, "justIterate", &ciErrNum);
    CheckCLError(ciErrNum);
    const cl_mem buffer =
        table.clCreateBuffer(context.handle(), CL_MEM_READ_WRITE | CL_MEM_COPY_HOST_PTR,
                             data.size() * sizeof(float), data.data(), &ciErrNum);
    CheckCLError(ciErrNum);
    constexpr cl_uint kLength = kFloats;
    CheckCLError(table.clSetKernelArg(kernel, 0, sizeof(cl_mem), &buffer));
    CheckCLError(table.clSetKernelArg(kernel, 1, sizeof kLength, &kLength));
    cl_event event = nullptr;
    CheckCLError(table.clEnqueueNDRangeKernel(queue.handle(), kernel, 1, nullptr, &kFloats,
                                              &kLocalSize, 0, nullptr, &event));
    CheckCLError(table.clWaitForEvents(1, &event));

    const double seconds = ProfilingDuration(event);
    PM_LOG(gGPUAssay, kName << ": clFinish");
    table.clFinish(queue.handle());
    // Program, kernel and event are never released.
    QGF::OCL::HandleTraits<cl_mem>::Release(buffer);
    PM_LOG(gGPUAssay, kName << ": result=" << seconds);
    return seconds > 0.0 ? kScoreNumerator / seconds : 0.0;
}

} // namespace

double GPUImplHardware::DoGetCLCompute()
{
    // The label says "time", but the value is the score. Keep it: readers of logs expect it.
    return OnProfilingQueue("GPUImplHardware::DoGetCLCompute", "timeForKernelExecution=", device,
                            MeasureCLCompute);
}

} // namespace pmutil
