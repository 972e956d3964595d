// The sequencer: runs the fixed sequence of tests, writes the report through the application and
// counts a step after each test. At a chosen step it fails on purpose, so that a host can see how
// it copes with a child that dies in the middle of a report. Main thread only; one Run per object.
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

    // The application isn't owned and outlives the tester.
    explicit GPUAssayTester(GPUAssayApp* app);
    ~GPUAssayTester() override;

    // The whole sequence. Throws what a test outside RunTest throws; the rest of the sequence is
    // skipped then.
    void Run();

    // The top-level operations, in the order of the sequence. Each writes its lines and takes a
    // step, but for DoRunQGFOCLInitialize, which does neither.
    virtual void DoRunStart();
    virtual void DoRunQGFCoreInitialize();
    virtual void DoRunQGFOGLInitialize();
    virtual void DoRunOGLContextCreate();
    virtual void DoRunGLEnumerate();
    virtual void DoRunGLTests();
    virtual void DoRunQGFOCLInitialize();
    virtual void DoRunCLEnumerate();
    virtual void DoRunCLTests();

    // Counts a step. Throws std::runtime_error "programmed failure" (by Crash) at every step from
    // fCrashAfter on, and "Programmed throw" at exactly fThrowAfter. Steps count from 0. Tests take
    // their steps directly: an override is asked for the last step of Run alone.
    virtual void Step();

    // What a programmed crash does: throws. An override may end the process in another way; should
    // it return, this one is performed.
    virtual void Crash();

    // Local time, "YYYY-MM-DD_HH:MM:SS". Throws std::runtime_error "could not convert calendar time
    // to local time".
    virtual std::string GetTimestamp();
    virtual void DoRunTimestamp(const std::string& key);

    // Applies the test to each entry. An entry whose test throws is told on standard error, counted
    // in fFailures and taken off the list; nothing is thrown.
    virtual void RunTest(GPUEntries& entries, const GPUTest& test);

    // One key of one OpenGL device each: one line, one step. What the probe throws passes through.
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

    // One key of one OpenCL device each, in the same manner. DoRunCUDAVersion takes its step also
    // where it has nothing to print.
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

    // Queries by number: a line with the number behind each name, then the answer. One step, but
    // none for the string: the steps of a run are counted on that footing. `count` is how many
    // integers the query answers. A string that OpenGL doesn't give (null) throws std::logic_error.
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

    // What the enumerations do with the object that they make for the purpose: ask it for its
    // devices, report their number and put them under test.
    void EnumerateGL(pmutil::GPUImpl& factory);
    void EnumerateCL(pmutil::GPUImpl& factory);
};

} // namespace assay
