// The OpenGL half of the sequence.
#include <utility>

#include <boost/make_shared.hpp>

#include "GPUAssayApp.h"
#include "GPUTest.h"
#include "ListDevices.h"
#include "Output.h"
#include "ReportLine.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/OGL.h"

namespace assay {

namespace {

// Returns 1 if the check passes and 0 if it throws. A failure is only logged.
template <typename Check>
int Passes(const char* failure, Check check)
{
    try {
        check();
        return 1;
    } catch (const QGF::LogicalException& exception) {
        PM_LOG(pmutil::gGPUAssay, failure << ": " << TextOrNull(exception.message()));
    } catch (...) {
        PM_LOG(pmutil::gGPUAssay, failure);
    }
    return 0;
}

} // namespace

void GPUAssayTester::DoRunQGFCoreInitialize()
{
    const int passes =
        Passes("QGF::Core::Library::initialize() failed", [] { QGF::Core::Library::Initialize(); });
    Report(ValueLine("QGFCoreInitialized", passes));
}

void GPUAssayTester::DoRunQGFOGLInitialize()
{
    const int passes = Passes("QGF::OGL::Library::initialize() failed", [] {
        const QGF::OGL::Library::InitOptions options;
        QGF::OGL::Library::Initialize(options);
    });
    Report(ValueLine("QGFOGLInitialized", passes));
}

void GPUAssayTester::DoRunOGLContextCreate()
{
    const int passes = Passes("Cannot create default ContextOffscreen", [] {
        const QGF::OGL::ContextOffscreen context(QGF::OGL::Context::PrimaryDisplayDevice());
    });
    Report(ValueLine("OGLContextCreated", passes));
}

void GPUAssayTester::DoRunGLEnumerate()
{
    const boost::shared_ptr<pmutil::GPUImpl> factory = boost::make_shared<pmutil::GPUImplWin>();
    EnumerateGL(*factory);
}

void GPUAssayTester::EnumerateGL(pmutil::GPUImpl& factory)
{
    const pmutil::GPUImpl::GLGPUs gpus = factory.GetGPUs();
    Print(ValueLine("NumGLGPUs", std::uint64_t{gpus.size()}));
    ListDevices("glgpu", gpus).swap(fGLGPUs);
    GPUAssayTester::Step();
}

void GPUAssayTester::DoRunGLTests()
{
    using Test = TestFunc<GPUAssayTester, GLGPU>;
    static constexpr Test::Operation kTests[] = {
        &GPUAssayTester::DoRunGLVersion,        &GPUAssayTester::DoRunIsIntegratedGLGPU,
        &GPUAssayTester::DoRunGLMemoryMB,       &GPUAssayTester::DoRunGLName,
        &GPUAssayTester::DoRunGLVendor,         &GPUAssayTester::DoRunGLVendorID,
        &GPUAssayTester::DoRunGLDriverVersion,  &GPUAssayTester::DoRunGLRectTextureSize,
        &GPUAssayTester::DoRunGLRenderer,       &GPUAssayTester::DoRunGLRendererID,
        &GPUAssayTester::DoRunHasGLNPOTSupport, &GPUAssayTester::DoRunGLDriver,
        &GPUAssayTester::DoRunGLDriverDate,     &GPUAssayTester::DoRunCanCompileProgramGLSL,
        &GPUAssayTester::DoRunGLFrameBufferOK,
    };

    for (const Test::Operation operation : kTests)
        RunTest(fGLGPUs, Test(operation));
}

void GPUAssayTester::DoRunGLVersion(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLVersion"), gpu.GetVersion()));
}

void GPUAssayTester::DoRunGLName(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLName"), gpu.GetName()));
}

void GPUAssayTester::DoRunIsIntegratedGLGPU(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "IsIntegratedGLGPU"), gpu.IsIntegrated()));
}

void GPUAssayTester::DoRunGLMemoryMB(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "GLMemoryMB"), gpu.GetMemoryMB()));
}

void GPUAssayTester::DoRunGLVendor(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLVendor"), gpu.GetVendor()));
}

void GPUAssayTester::DoRunGLVendorID(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "GLVendorID"), gpu.GetVendorID()));
}

void GPUAssayTester::DoRunGLDriverVersion(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLDriverVersion"), gpu.GetDriverVersion()));
}

void GPUAssayTester::DoRunGLRectTextureSize(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "GLRectTextureSize"),
                     gpu.impl->GetGLRectTextureSize()));
}

void GPUAssayTester::DoRunGLRenderer(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLRenderer"), gpu.impl->GetGLRenderer()));
}

void GPUAssayTester::DoRunGLRendererID(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "GLRendererID"), gpu.impl->GetGLRendererID()));
}

void GPUAssayTester::DoRunHasGLNPOTSupport(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "HasGLNPOTSupport"), gpu.impl->HasGLNPOTSupport()));
}

void GPUAssayTester::DoRunGLDriver(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLDriver"), gpu.impl->GetGLDriver()));
}

void GPUAssayTester::DoRunGLDriverDate(std::string tag, GLGPU& gpu)
{
    Report(TextLine(TaggedKey(std::move(tag), "GLDriverDate"), gpu.impl->GetGLDriverDate()));
}

void GPUAssayTester::DoRunCanCompileProgramGLSL(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "CanCompileProgramGLSL"),
                     gpu.impl->CompileProgramGLSL()));
}

void GPUAssayTester::DoRunGLFrameBufferOK(std::string tag, GLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "GLFrameBufferOK"), gpu.impl->GLFramebufferOK()));
}

} // namespace assay
