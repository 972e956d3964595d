// The probe interface: all queries of one graphics device. No result is cached. A query throws if
// it fails. Main thread only.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "qgf/OGLInterceptor.h"

namespace pmutil {

class GLGPU;
class CLGPU;

class GPUImpl {
public:
    virtual ~GPUImpl() = default;

    using GLGPUs = std::vector<boost::shared_ptr<GLGPU>>;
    using CLGPUs = std::vector<boost::shared_ptr<CLGPU>>;

    // Factories: list the machine's devices. Each record has an implementation of its own; call
    // these on an object that is used for nothing else.
    GLGPUs GetGPUs() { return DoGetGPUs(); }
    CLGPUs GetCLGPUs() { return DoGetCLGPUs(); }

    // OpenGL.
    std::string GetGLVersion() { return DoGetGLVersion(); }
    std::uint32_t GetGLMemoryMB() { return DoGetGLMemoryMB(); }
    std::string GetGLName() { return DoGetGLName(); }
    std::string GetGLVendor() { return DoGetGLVendor(); }
    std::uint32_t GetGLVendorID() { return DoGetGLVendorID(); }
    std::string GetGLDriverVersion() { return DoGetGLDriverVersion(); }
    std::uint32_t GetGLRectTextureSize() { return DoGetGLRectTextureSize(); }
    std::string GetGLRenderer() { return DoGetGLRenderer(); }
    std::uint32_t GetGLRendererID() { return DoGetGLRendererID(); }
    bool HasGLNPOTSupport() { return DoHasGLNPOTSupport(); }
    std::string GetGLDriver() { return DoGetGLDriver(); }
    std::string GetGLDriverDate() { return DoGetGLDriverDate(); }
    std::string GetGLDriverExtra() { return DoGetGLDriverExtra(); }
    bool CompileProgramGLSL() { return DoCompileProgramGLSL(); }
    bool GLFramebufferOK() { return DoGLFramebufferOK(); }
    // Returns OpenGL's string, which OpenGL owns; may be null.
    const char* GLGetString(std::uint32_t name) { return DoGLGetString(name); }
    // `result` must have room for all integers that OpenGL returns for `name`.
    void GLGetIntegerv(std::uint32_t name, std::int32_t* result) { DoGLGetIntegerv(name, result); }
    void GLGetProgramivARB(std::uint32_t target, std::uint32_t code, std::int32_t* result)
    {
        DoGLGetProgramivARB(target, code, result);
    }
    bool GLIsExtensionSupported(QGF::OGL::OpenGLExtension extension)
    {
        return DoGLIsExtensionSupported(extension);
    }
    bool IsIntegratedGLGPU() { return DoIsIntegratedGLGPU(); }

    // OpenCL. Bandwidth is in bytes per second; compute is a score, where higher is faster.
    std::string GetCLPlatformVersion() { return DoGetCLPlatformVersion(); }
    std::uint32_t GetCLMemoryMB() { return DoGetCLMemoryMB(); }
    std::string GetCLName() { return DoGetCLName(); }
    std::string GetCLVendor() { return DoGetCLVendor(); }
    std::uint32_t GetCLVendorID() { return DoGetCLVendorID(); }
    std::string GetCLDriverVersion() { return DoGetCLDriverVersion(); }
    bool GetCUDASupported() { return DoGetCUDASupported(); }
    std::string GetCUDAVersion() { return DoGetCUDAVersion(); }
    double GetCLBandwidth() { return DoGetCLBandwidth(); }
    double GetCLCompute() { return DoGetCLCompute(); }
    std::uint64_t GetCLReserved() { return DoGetCLReserved(); }
    std::string GetCLDeviceVersion() { return DoGetCLDeviceVersion(); }
    bool IsIntegratedCLGPU() { return DoIsIntegratedCLGPU(); }

private:
    virtual GLGPUs DoGetGPUs() = 0;
    virtual std::string DoGetGLVersion() = 0;
    virtual std::uint32_t DoGetGLMemoryMB() = 0;
    virtual std::string DoGetGLName() = 0;
    virtual std::string DoGetGLVendor() = 0;
    virtual std::uint32_t DoGetGLVendorID() = 0;
    virtual std::string DoGetGLDriverVersion() = 0;
    virtual std::uint32_t DoGetGLRectTextureSize() = 0;
    virtual std::string DoGetGLRenderer() = 0;
    virtual std::uint32_t DoGetGLRendererID() = 0;
    virtual bool DoHasGLNPOTSupport() = 0;
    virtual std::string DoGetGLDriver() = 0;
    virtual std::string DoGetGLDriverDate() = 0;
    virtual std::string DoGetGLDriverExtra() = 0;
    virtual bool DoCompileProgramGLSL() = 0;
    virtual bool DoGLFramebufferOK() = 0;
    virtual const char* DoGLGetString(std::uint32_t name) = 0;
    virtual void DoGLGetIntegerv(std::uint32_t name, std::int32_t* result) = 0;
    virtual void DoGLGetProgramivARB(std::uint32_t target, std::uint32_t code,
                                     std::int32_t* result) = 0;
    virtual bool DoGLIsExtensionSupported(QGF::OGL::OpenGLExtension extension) = 0;
    virtual bool DoIsIntegratedGLGPU() = 0;
    virtual CLGPUs DoGetCLGPUs() = 0;
    virtual std::string DoGetCLPlatformVersion() = 0;
    virtual std::uint32_t DoGetCLMemoryMB() = 0;
    virtual std::string DoGetCLName() = 0;
    virtual std::string DoGetCLVendor() = 0;
    virtual std::uint32_t DoGetCLVendorID() = 0;
    virtual std::string DoGetCLDriverVersion() = 0;
    virtual bool DoGetCUDASupported() = 0;
    virtual std::string DoGetCUDAVersion() = 0;
    virtual double DoGetCLBandwidth() = 0;
    virtual double DoGetCLCompute() = 0;
    virtual std::uint64_t DoGetCLReserved() = 0;
    virtual std::string DoGetCLDeviceVersion() = 0;
    virtual bool DoIsIntegratedCLGPU() = 0;
};

} // namespace pmutil
