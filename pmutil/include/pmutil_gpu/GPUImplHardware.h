// The queries that need OpenGL or OpenCL only. An OpenGL query makes the device's context current,
// checks glGetError after its call, and restores the previous context.
//
// Failures throw std::runtime_error "Failed requirement: glStatus == GL_NO_ERROR",
// "QGF::OGL::ExtensionManager::Instance() returned NULL", "Cannot determine OGL version",
// "clGetDeviceInfo failed", "Failed requirement: status == CL_SUCCESS" or "Failed requirement:
// ciErrNum == CL_SUCCESS". Exceptions of the graphics library pass through.
#pragma once

#include "pmutil/DebugValues.h"
#include "pmutil_gpu/GPUImpl.h"
#include "qgf/OCL.h"
#include "qgf/OGL.h"

namespace pmutil {

// Enables the log statements of the program's own modules; set from the command line.
extern DebugValue gGPUAssay;

class GPUImplHardware : public GPUImpl {
public:
    GPUImplHardware();
    ~GPUImplHardware() override;

    // The device's OpenGL context; null if the object is for OpenCL. An OpenGL query then fails the
    // shared pointer's assertion.
    boost::shared_ptr<QGF::OGL::ContextOffscreen> context;

    // The OpenCL device; its id is null if the object is for OpenGL.
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
