// Measures the copy bandwidth inside an OpenCL device's memory.
#include <algorithm>
#include <array>
#include <optional>

#include "all/gpu/CheckCLError.h"
#include "all/gpu/OnProfilingQueue.h"
#include "all/gpu/ProfilingDuration.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace pmutil {

namespace {

constexpr std::size_t kBufferBytes = 0x1000000;
constexpr std::int32_t kCopiesPerBatch = 10;
constexpr std::int32_t kMaxCopies = 100;
constexpr double kMaxSeconds = 1.0;
// A copy reads and writes each byte.
constexpr double kBytesPerBatch = 2.0 * kBufferBytes * kCopiesPerBatch;

using EventList = std::array<cl_event, kCopiesPerBatch>;

double timeBandwidthCL(const QGF::OCL::CommandQueue& queue, EventList& events, cl_mem source,
                       cl_mem destination)
{
    const QGF::OCL::FunctionTable& table = QGF::OCL::ExtensionManager::instance().table();
    for (cl_event& event : events)
        CheckCLError(table.clEnqueueCopyBuffer(queue.handle(), source, destination, 0, 0,
                                               kBufferBytes, 0, nullptr, &event));
    table.clFinish(queue.handle());

    double totalSeconds = 0.0;
    for (cl_event event : events)
        totalSeconds += ProfilingDuration(event);
    PM_LOG(gGPUAssay, "GPUImplHardware::timeBandwidthCL"
                          << ": totalSeconds=" << totalSeconds);
    return totalSeconds;
}

double checkBandwidthCL(const QGF::OCL::Context& context, const QGF::OCL::CommandQueue& queue)
{
    constexpr char kName[] = "GPUImplHardware::checkBandwidthCL";
    std::optional<PMLogScope> scope;
    if (GetDebugValue(gGPUAssay) >= 1)
        scope.emplace(kName, __FILE__, __LINE__);
    const QGF::OCL::FunctionTable& table = QGF::OCL::ExtensionManager::instance().table();

    // Log each call before it is made, so that the last line names the call in which a driver
    // crashes.
    cl_int ciErrNum = CL_SUCCESS;
    PM_LOG(gGPUAssay, kName << ": clCreateBuffer d_idata nbytes=" << kBufferBytes);
    const cl_mem d_idata =
        table.clCreateBuffer(context.handle(), CL_MEM_READ_ONLY, kBufferBytes, nullptr, &ciErrNum);
    CheckCLError(ciErrNum);
    PM_LOG(gGPUAssay, kName << ": clCreateBuffer d_odata nbytes=" << kBufferBytes);
    const cl_mem d_odata =
        table.clCreateBuffer(context.handle(), CL_MEM_WRITE_ONLY, kBufferBytes, nullptr, &ciErrNum);
    CheckCLError(ciErrNum);

    PM_LOG(gGPUAssay, kName << ": clFinish");
    table.clFinish(queue.handle());
    PM_LOG(gGPUAssay, kName << ": copy " << kMaxCopies << " iterations");

    EventList events{};
    double totalSeconds = 0.0;
    double maxBW = 0.0;
    std::int32_t i = 0;
    while (totalSeconds < kMaxSeconds && i < kMaxCopies) {
        PM_LOG(gGPUAssay,
               kName << ": " << i << " of " << kMaxCopies << ", totalSeconds=" << totalSeconds);
        // The events of the previous batch are overwritten without a release: a release would add
        // calls between the measured batches.
        const double seconds = timeBandwidthCL(queue, events, d_idata, d_odata);
        PM_LOG(gGPUAssay, kName << ": seconds=" << seconds);
        if (seconds > 0.0) {
            totalSeconds += seconds;
            const double BW = kBytesPerBatch / seconds;
            maxBW = std::max(BW, maxBW);
            PM_LOG(gGPUAssay, kName << ": totalSeconds=" << totalSeconds << ", BW=" << BW
                                    << ", maxBW=" << maxBW);
        }
        i += kCopiesPerBatch;
    }

    PM_LOG(gGPUAssay, kName << ": clFinish");
    table.clFinish(queue.handle());
    for (cl_event event : events)
        QGF::OCL::HandleTraits<cl_event>::Release(event);
    PM_LOG(gGPUAssay, kName << ": releasing");
    QGF::OCL::HandleTraits<cl_mem>::Release(d_idata);
    QGF::OCL::HandleTraits<cl_mem>::Release(d_odata);
    PM_LOG(gGPUAssay, kName << ": result=" << maxBW);
    return maxBW;
}

} // namespace

double GPUImplHardware::DoGetCLBandwidth()
{
    return OnProfilingQueue("GPUImplHardware::DoGetCLBandwidth", "bytesPerSecond=", device,
                            checkBandwidthCL);
}

} // namespace pmutil
