// Fixtures of the application's tests: an application that records its lines, a fake device, and
// testers that enumerate fake devices.
#pragma once

#include <functional>
#include <iostream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include <boost/make_shared.hpp>

#include "GPUAssayApp.h"
#include "GPUAssayTester.h"
#include "PixmereTester.h"

namespace assay {

using Lines = std::vector<std::string>;

inline Lines operator+(Lines left, const Lines& right)
{
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

// Replaces the buffer of a standard stream for a scope.
class RedirectStream {
public:
    RedirectStream(std::ostream& stream, std::streambuf* buffer)
        : fStream(stream), fPrevious(stream.rdbuf(buffer))
    {}
    ~RedirectStream() { fStream.rdbuf(fPrevious); }
    RedirectStream(const RedirectStream&) = delete;
    RedirectStream& operator=(const RedirectStream&) = delete;

private:
    std::ostream& fStream;
    std::streambuf* fPrevious;
};

// Captures standard error: the lines of the application and those that the tester writes directly.
class CapturedStderr {
public:
    // Returns the lines since the last call.
    Lines Take()
    {
        Lines lines;
        std::istringstream text(fText.str());
        for (std::string line; std::getline(text, line);)
            lines.push_back(line);
        fText.str("");
        return lines;
    }

private:
    std::ostringstream fText;
    RedirectStream fRedirect{std::cerr, fText.rdbuf()};
};

// An application that records the lines of its report. `makeTester` makes its tester.
class TestApp : public GPUAssayApp {
public:
    std::int32_t RunWith(const Lines& options)
    {
        Arguments arguments(options.begin(), options.end());
        arguments.push_front("assay");
        return Run(arguments);
    }

    GPUAssayTester* CreateTester() override { return makeTester ? makeTester(this) : nullptr; }
    void DoStdout(const std::string& text) override { out.push_back(text); }

    std::function<GPUAssayTester*(GPUAssayApp*)> makeTester;
    Lines out;
};

// A fake device: a text query returns its own name, a number query a fixed number. As a factory it
// returns the records in `gl` and `cl`.
class FakeGPUImpl : public pmutil::GPUImpl {
public:
    // Functions that throw the failure of a query, by the query's name.
    std::map<std::string, std::function<void()>> failures;
    // The names of the queries, in order.
    Lines queries;

    std::string suffix; // appended to each text
    bool cudaSupported = true;
    bool truth = true;
    std::string cudaVersion = "4.2";
    double bandwidth = 1234567890.0;
    double compute = 32;
    const char* shadingLanguage = "4.60";
    std::int32_t integer = 16;

    GLGPUs gl;
    CLGPUs cl;

private:
    void Record(const std::string& name)
    {
        queries.push_back(name);
        const auto failure = failures.find(name);
        if (failure != failures.end())
            failure->second();
    }
    std::string Text(const char* name)
    {
        Record(name);
        return name + suffix;
    }
    std::uint32_t Number(const char* name, std::uint32_t value)
    {
        Record(name);
        return value;
    }
    bool Truth(const char* name)
    {
        Record(name);
        return truth;
    }

    GLGPUs DoGetGPUs() override
    {
        Record("GPUs");
        return gl;
    }
    CLGPUs DoGetCLGPUs() override
    {
        Record("CLGPUs");
        return cl;
    }
    std::string DoGetGLVersion() override { return Text("GLVersion"); }
    std::uint32_t DoGetGLMemoryMB() override { return Number("GLMemoryMB", 4294967295U); }
    std::string DoGetGLName() override { return Text("GLName"); }
    std::string DoGetGLVendor() override { return Text("GLVendor"); }
    std::uint32_t DoGetGLVendorID() override { return Number("GLVendorID", 0x10DE); }
    std::string DoGetGLDriverVersion() override { return Text("GLDriverVersion"); }
    std::uint32_t DoGetGLRectTextureSize() override { return Number("GLRectTextureSize", 16384); }
    std::string DoGetGLRenderer() override { return Text("GLRenderer"); }
    std::uint32_t DoGetGLRendererID() override { return Number("GLRendererID", 7); }
    bool DoHasGLNPOTSupport() override { return Truth("HasGLNPOTSupport"); }
    std::string DoGetGLDriver() override { return Text("GLDriver"); }
    std::string DoGetGLDriverDate() override { return Text("GLDriverDate"); }
    std::string DoGetGLDriverExtra() override { return Text("GLDriverExtra"); }
    bool DoCompileProgramGLSL() override { return Truth("CanCompileProgramGLSL"); }
    bool DoGLFramebufferOK() override { return Truth("GLFrameBufferOK"); }
    const char* DoGLGetString(std::uint32_t name) override
    {
        Record("GLGetString " + std::to_string(name));
        return shadingLanguage;
    }
    void DoGLGetIntegerv(std::uint32_t name, std::int32_t* result) override
    {
        Record("GLGetIntegerv " + std::to_string(name));
        if (result != nullptr)
            *result = integer;
    }
    void DoGLGetProgramivARB(std::uint32_t target, std::uint32_t code,
                             std::int32_t* result) override
    {
        Record("GLGetProgramivARB " + std::to_string(target) + " " + std::to_string(code));
        if (result != nullptr)
            *result = integer;
    }
    bool DoGLIsExtensionSupported(QGF::OGL::OpenGLExtension extension) override
    {
        Record("GLIsExtensionSupported " + std::to_string(static_cast<std::int32_t>(extension)));
        return truth;
    }
    bool DoIsIntegratedGLGPU() override { return Truth("IsIntegratedGLGPU"); }
    std::string DoGetCLPlatformVersion() override { return Text("CLPlatformVersion"); }
    std::uint32_t DoGetCLMemoryMB() override { return Number("CLMemoryMB", 2048); }
    std::string DoGetCLName() override { return Text("CLName"); }
    std::string DoGetCLVendor() override { return Text("CLVendor"); }
    std::uint32_t DoGetCLVendorID() override { return Number("CLVendorID", 0x1002); }
    std::string DoGetCLDriverVersion() override { return Text("CLDriverVersion"); }
    bool DoGetCUDASupported() override
    {
        Record("CUDASupported");
        return cudaSupported;
    }
    std::string DoGetCUDAVersion() override
    {
        Record("CUDAVersion");
        return cudaVersion;
    }
    double DoGetCLBandwidth() override
    {
        Record("CLBandwidth");
        return bandwidth;
    }
    double DoGetCLCompute() override
    {
        Record("CLCompute");
        return compute;
    }
    std::uint64_t DoGetCLReserved() override { return 0; }
    std::string DoGetCLDeviceVersion() override { return Text("CLDeviceVersion"); }
    bool DoIsIntegratedCLGPU() override { return Truth("IsIntegratedCLGPU"); }
};

using FakeGPU = boost::shared_ptr<FakeGPUImpl>;

// The fake devices of a machine.
struct FakeMachine {
    std::vector<FakeGPU> gl;
    std::vector<FakeGPU> cl;
    bool oclAvailable = false;

    FakeMachine() = default;
    FakeMachine(std::size_t glCount, std::size_t clCount, bool available = true)
        : oclAvailable(available)
    {
        for (std::size_t i = 0; i < glCount; ++i)
            gl.push_back(boost::make_shared<FakeGPUImpl>());
        for (std::size_t i = 0; i < clCount; ++i)
            cl.push_back(boost::make_shared<FakeGPUImpl>());
    }
};

// A tester of type Base on a fake machine: the library checks pass, and the enumerations return the
// machine's devices.
template <typename Base>
class FakeTester : public Base {
public:
    FakeTester(GPUAssayApp* app, const FakeMachine& machine) : Base(app), fMachine(machine) {}

    void DoRunQGFCoreInitialize() override { this->Report("QGFCoreInitialized=1"); }
    void DoRunQGFOGLInitialize() override { this->Report("QGFOGLInitialized=1"); }
    void DoRunOGLContextCreate() override { this->Report("OGLContextCreated=1"); }
    void DoRunQGFOCLInitialize() override { this->fOCLAvailable = fMachine.oclAvailable; }
    void DoRunGLEnumerate() override
    {
        FakeGPUImpl factory;
        for (const FakeGPU& gpu : fMachine.gl)
            factory.gl.push_back(boost::make_shared<pmutil::GLGPU>(gpu));
        this->EnumerateGL(factory);
    }
    void DoRunCLEnumerate() override
    {
        FakeGPUImpl factory;
        for (const FakeGPU& gpu : fMachine.cl)
            factory.cl.push_back(boost::make_shared<pmutil::CLGPU>(gpu));
        this->EnumerateCL(factory);
    }
    std::string GetTimestamp() override { return "2031-02-03_04:05:06"; }

    // Public, for the tests of these operations.
    using Base::EnumerateCL;
    using Base::EnumerateGL;

private:
    FakeMachine fMachine;
};

inline boost::shared_ptr<pmutil::GLGPU> MakeGL(const FakeGPU& gpu)
{
    return boost::make_shared<pmutil::GLGPU>(gpu);
}
inline boost::shared_ptr<pmutil::CLGPU> MakeCL(const FakeGPU& gpu)
{
    return boost::make_shared<pmutil::CLGPU>(gpu);
}

// The application with a tester of type Tester on a fake machine.
template <typename Tester>
class MachineApp : public TestApp {
public:
    explicit MachineApp(const FakeMachine& machine)
    {
        makeTester = [machine](GPUAssayApp* app) { return new FakeTester<Tester>(app, machine); };
    }
};

} // namespace assay
