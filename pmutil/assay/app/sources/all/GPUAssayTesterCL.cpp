// The OpenCL half of the sequence.
#include <optional>
#include <utility>

#include <boost/make_shared.hpp>

#include "GPUAssayApp.h"
#include "GPUTest.h"
#include "ListDevices.h"
#include "ReportLine.h"
#include "StartOpenCL.h"
#include "pmutil/PMLogging.h"
#include "pmutil/System.h"
#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/OCL.h"

namespace assay {

namespace {

// Seconds to keep the processor busy before a bandwidth measurement.
pmutil::DebugValue gGPUAssayOCLDelay{"GPUAssayOCLDelay", 0};

void SpinSeconds(double seconds)
{
    // Don't sleep: the processor must not be idle when the measurement begins.
    const double deadline = pmutil::GetClockSeconds() + seconds;
    while (pmutil::GetClockSeconds() < deadline) {
    }
}

} // namespace

void GPUAssayTester::DoRunQGFOCLInitialize()
{
    StartOpenCL(
        fOCLAvailable, [] { return QGF::OCL::Library::IsOpenCLAvailable(""); },
        [] { QGF::OCL::Library::Initialize(); });
}

void GPUAssayTester::DoRunCLEnumerate()
{
    const boost::shared_ptr<pmutil::GPUImpl> factory = boost::make_shared<pmutil::GPUImplWin>();
    EnumerateCL(*factory);
}

void GPUAssayTester::EnumerateCL(pmutil::GPUImpl& factory)
{
    const pmutil::GPUImpl::CLGPUs gpus = factory.GetCLGPUs();
    Print(ValueLine("NumCLGPUs", std::uint64_t{gpus.size()}));
    ListDevices("clgpu", gpus).swap(fCLGPUs);
    GPUAssayTester::Step();
}

void GPUAssayTester::DoRunCLTests()
{
    using Test = TestFunc<GPUAssayTester, CLGPU>;
    static constexpr Test::Operation kTests[] = {
        &GPUAssayTester::DoRunCLPlatformVersion,
        &GPUAssayTester::DoRunCLDeviceVersion,
        &GPUAssayTester::DoRunIsIntegratedCLGPU,
        &GPUAssayTester::DoRunCLMemoryMB,
        &GPUAssayTester::DoRunCLName,
        &GPUAssayTester::DoRunCLVendor,
        &GPUAssayTester::DoRunCLVendorID,
        &GPUAssayTester::DoRunCLDriverVersion,
        &GPUAssayTester::DoRunCUDASupported,
        &GPUAssayTester::DoRunCUDAVersion,
        &GPUAssayTester::DoRunCLBandwidth,
    };

    for (const Test::Operation operation : kTests)
        RunTest(fCLGPUs, Test(operation));
}

void GPUAssayTester::DoRunCLPlatformVersion(std::string tag, CLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "CLPlatformVersion"), gpu.GetVersion()));
}

void GPUAssayTester::DoRunCLName(std::string tag, CLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "CLName"), gpu.GetName()));
}

void GPUAssayTester::DoRunIsIntegratedCLGPU(std::string tag, CLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "IsIntegratedCLGPU"), gpu.IsIntegrated()));
}

void GPUAssayTester::DoRunCLMemoryMB(std::string tag, CLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "CLMemoryMB"), gpu.GetMemoryMB()));
}

void GPUAssayTester::DoRunCLVendor(std::string tag, CLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "CLVendor"), gpu.GetVendor()));
}

void GPUAssayTester::DoRunCLVendorID(std::string tag, CLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "CLVendorID"), gpu.GetVendorID()));
}

void GPUAssayTester::DoRunCLDriverVersion(std::string tag, CLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "CLDriverVersion"), gpu.GetDriverVersion()));
}

void GPUAssayTester::DoRunCUDASupported(std::string tag, CLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "CUDASupported"), gpu.impl->GetCUDASupported()));
}

void GPUAssayTester::DoRunCUDAVersion(std::string tag, CLGPU& gpu)
{
    if (gpu.impl->GetCUDASupported()) {
        const std::string version = gpu.impl->GetCUDAVersion();
        if (!version.empty())
            Print(TextLine(TaggedKey(std::move(tag), "CUDAVersion"), version));
    }
    GPUAssayTester::Step();
}

void GPUAssayTester::DoRunCLBandwidth(std::string tag, CLGPU& gpu)
{
    std::optional<pmutil::PMLogScope> scope;
    if (pmutil::GetDebugValue(pmutil::gGPUAssay) >= 1)
        scope.emplace("GPUAssayTester::DoRunCLBandwidth", __FILE__, __LINE__);
    const std::int32_t delay = pmutil::GetDebugValue(gGPUAssayOCLDelay);
    if (delay > 0)
        SpinSeconds(delay);
    Report(ValueLine(TaggedKey(std::move(tag), "CLBandwidth"), gpu.impl->GetCLBandwidth()));
}

void GPUAssayTester::DoRunCLDeviceVersion(std::string tag, CLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "CLDeviceVersion"), gpu.impl->GetCLDeviceVersion()));
}

} // namespace assay
