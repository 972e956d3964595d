// The sequencer: runs the fixed sequence of tests, writes the report through the application and
// counts a step after each test. It can be set to fail at a step, so that a host can be tested with
// a child that dies in the middle of a report. Main thread only; one Run per object.
#pragma once

#include <cstdint>
#include <string>

#include "GPUAssayAppAndHost.h"
#include "GPUEntry.h"

namespace assay {

class GPUAssayApp;
class GPUTest;

class GPUAssayTester : public GPUAssayAppAndHost {
public:
    using GLGPU = pmutil::GLGPU;
    using CLGPU = pmutil::CLGPU;

    // The application isn't owned and must outlive the tester.
    explicit GPUAssayTester(GPUAssayApp* app);
    ~GPUAssayTester() override;

    // Runs the sequence. Throws what a test outside RunTest throws; the rest of the sequence is
    // then skipped.
    void Run();

    // The top-level operations, in the order of the sequence. Each writes its lines and takes a
    // step; DoRunQGFOCLInitialize does neither.
    virtual void DoRunStart();
    virtual void DoRunQGFCoreInitialize();
    virtual void DoRunQGFOGLInitialize();
    virtual void DoRunOGLContextCreate();
    virtual void DoRunGLEnumerate();
    virtual void DoRunGLTests();
    virtual void DoRunQGFOCLInitialize();
    virtual void DoRunCLEnumerate();
    virtual void DoRunCLTests();

    // Counts a step, from 0. At step fCrashAfter and every later one, calls Crash, which throws
    // std::runtime_error "programmed failure"; at step fThrowAfter, throws "Programmed throw". Only
    // the last step of Run calls an override; tests call GPUAssayTester::Step.
    virtual void Step();

    // Performs a programmed crash: throws. An override may end the process in another way; if it
    // returns, this implementation is called.
    virtual void Crash();

    // Returns the local time "YYYY-MM-DD_HH:MM:SS". Throws std::runtime_error "could not convert
    // calendar time to local time".
    virtual std::string GetTimestamp();
    virtual void DoRunTimestamp(const std::string& key);

    // Runs the test for each entry. If the test throws, reports the failure on standard error,
    // counts it in fFailures and removes the entry from the list. Throws nothing.
    virtual void RunTest(GPUEntries& entries, const GPUTest& test);

    // Each reports one key of an OpenGL device: one line, one step. Exceptions of the probe pass
    // through.
    virtual void DoRunGLVersion(std::string tag, GLGPU& gpu);
    virtual void DoRunGLName(std::string tag, GLGPU& gpu);
    virtual void DoRunIsIntegratedGLGPU(std::string tag, GLGPU& gpu);
    virtual void DoRunGLMemoryMB(std::string tag, GLGPU& gpu);
    virtual void DoRunGLVendor(std::string tag, GLGPU& gpu);
    virtual void DoRunGLVendorID(std::string tag, GLGPU& gpu);
    virtual void DoRunGLDriverVersion(std::string tag, GLGPU& gpu);
    virtual void DoRunGLRectTextureSize(std::string tag, GLGPU& gpu);
    virtual void DoRunGLRenderer(std::string tag, GLGPU& gpu);
    virtual void DoRunGLRendererID(std::string tag, GLGPU& gpu);
    virtual void DoRunHasGLNPOTSupport(std::string tag, GLGPU& gpu);
    virtual void DoRunGLDriver(std::string tag, GLGPU& gpu);
    virtual void DoRunGLDriverDate(std::string tag, GLGPU& gpu);
    virtual void DoRunCanCompileProgramGLSL(std::string tag, GLGPU& gpu);
    virtual void DoRunGLFrameBufferOK(std::string tag, GLGPU& gpu);

    // Each reports one key of an OpenCL device in the same way. DoRunCUDAVersion prints no line if
    // there is no CUDA version, but takes its step.
    virtual void DoRunCLPlatformVersion(std::string tag, CLGPU& gpu);
    virtual void DoRunCLName(std::string tag, CLGPU& gpu);
    virtual void DoRunIsIntegratedCLGPU(std::string tag, CLGPU& gpu);
    virtual void DoRunCLMemoryMB(std::string tag, CLGPU& gpu);
    virtual void DoRunCLVendor(std::string tag, CLGPU& gpu);
    virtual void DoRunCLVendorID(std::string tag, CLGPU& gpu);
    virtual void DoRunCLDriverVersion(std::string tag, CLGPU& gpu);
    virtual void DoRunCUDASupported(std::string tag, CLGPU& gpu);
    virtual void DoRunCUDAVersion(std::string tag, CLGPU& gpu);
    virtual void DoRunCLBandwidth(std::string tag, CLGPU& gpu);
    virtual void DoRunCLDeviceVersion(std::string tag, CLGPU& gpu);

    // Each queries a named constant: prints a "gputag" line with the number of each name, then the
    // result. Each takes one step except DoRunGLGetString, which takes none. `count` is the number
    // of integers that the query returns. If glGetString returns null, throws std::logic_error
    // "glGetString returns no text for NAME".
    virtual void DoRunGLGetString(std::string tag, GLGPU& gpu, const char* name, std::int32_t code);
    virtual void DoRunGLGetIntegerv(std::string tag, GLGPU& gpu, const char* name,
                                    std::int32_t code, std::uint64_t count);
    virtual void DoRunGLGetProgramivARB(std::string tag, GLGPU& gpu, const char* name,
                                        std::int32_t code, std::uint64_t count);
    virtual void DoRunExtension(std::string tag, GLGPU& gpu, const char* name, std::int32_t id);

    bool fOCLAvailable = false; // whether the OpenCL half of the sequence runs
    std::uint32_t fCrashAfter = 0xFFFFFFFF;
    std::uint32_t fStep = 0; // steps taken so far
    std::int32_t fThrowAfter = -1;
    std::int32_t fFailures = 0; // devices whose testing an exception ended
    GPUEntries fGLGPUs;         // the devices still under test
    GPUEntries fCLGPUs;
    GPUAssayApp* const fApp;

protected:
    // Writes a line of the report.
    void Print(const std::string& line);

    // Writes a line of the report and takes a step.
    void Report(const std::string& line);

    // Enumerate the devices of `factory`, report their number and set the list of entries.
    void EnumerateGL(pmutil::GPUImpl& factory);
    void EnumerateCL(pmutil::GPUImpl& factory);
};

} // namespace assay
