// The probes that OpenGL and OpenCL can answer alone. Every OpenGL question makes the device's own
// context current for its duration, restores what was current before, and checks for an OpenGL
// error at once.
//
// Failures: "Failed requirement: glStatus == GL_NO_ERROR", "QGF::OGL::ExtensionManager::Instance()
// returned NULL", "Cannot determine OGL version", "clGetDeviceInfo failed", "Failed requirement:
// status == CL_SUCCESS" and "Failed requirement: ciErrNum == CL_SUCCESS", all std::runtime_error;
// the graphics library's own exceptions pass through.
#pragma once

#include "pmutil/DebugValues.h"
#include "pmutil_gpu/GPUImpl.h"
#include "qgf/OCL.h"
#include "qgf/OGL.h"

namespace pmutil {

// Governs the log statements of the program's own modules; set from the command line.
extern DebugValue gGPUAssay;

class GPUImplHardware : public GPUImpl {
public:
    GPUImplHardware();
    ~GPUImplHardware() override;

    // The device's OpenGL context; null where the object serves OpenCL only. An OpenGL question
    // then trips the shared pointer's own assertion.
    boost::shared_ptr<QGF::OGL::ContextOffscreen> context;

    // The OpenCL device; a null id where the object serves OpenGL only.
    QGF::OCL::Device device;

private:
    std::string DoGetGLVersion() override;
    std::string DoGetGLName() override;
    std::string DoGetGLVendor() override;
    std::uint32_t DoGetGLRectTextureSize() override;
    std::string DoGetGLRenderer() override;
    bool DoHasGLNPOTSupport() override;
    std::string DoGetGLDriver() override;
    std::string DoGetGLDriverDate() override;
    std::string DoGetGLDriverExtra() override;
    bool DoCompileProgramGLSL() override;
    bool DoGLFramebufferOK() override;
    const char* DoGLGetString(std::uint32_t name) override;
    void DoGLGetIntegerv(std::uint32_t name, std::int32_t* result) override;
    void DoGLGetProgramivARB(std::uint32_t target, std::uint32_t code,
                             std::int32_t* result) override;
    bool DoGLIsExtensionSupported(QGF::OGL::OpenGLExtension extension) override;
    bool DoIsIntegratedGLGPU() override;
    CLGPUs DoGetCLGPUs() override;
    std::string DoGetCLPlatformVersion() override;
    std::uint32_t DoGetCLMemoryMB() override;
    std::string DoGetCLName() override;
    std::string DoGetCLVendor() override;
    std::uint32_t DoGetCLVendorID() override;
    std::string DoGetCLDriverVersion() override;
    bool DoGetCUDASupported() override;
    std::string DoGetCUDAVersion() override;
    double DoGetCLBandwidth() override;
    double DoGetCLCompute() override;
    std::uint64_t DoGetCLReserved() override;
    std::string DoGetCLDeviceVersion() override;
    bool DoIsIntegratedCLGPU() override;
};

} // namespace pmutil
