#include "pmutil_gpu/GPUImplHardware.h"

#include <exception>
#include <stdexcept>

#include "all/gpu/NewestGLVersion.h"
#include "all/gpu/ScopedGLCurrent.h"
#include "all/gpu/TestShaders.h"
#include "pmutil/PMLogging.h"
#include "pmutil/Requirement.h"

namespace pmutil {

DebugValue gGPUAssay{"GPUAssay", 0};

namespace {

using QGF::OGL::OpenGLExtension;
using QGF::OGL::OpenGLInterceptor;

// The source file that is passed to the interceptor with each call.
constexpr char kModule[] = "pmutil/sources/all/GPUImplHardware";

constexpr std::uint32_t kGLNoError = 0;
constexpr std::uint32_t kGLVendor = 0x1F00;
constexpr std::uint32_t kGLRenderer = 0x1F01;
constexpr std::uint32_t kGLMaxRectangleTextureSize = 0x84F8;
constexpr std::uint32_t kGLColorBufferBit = 0x4000;

void RequireNoGLError(std::uint32_t status)
{
    if (status != kGLNoError)
        RequirementFailed(kNoFile, 0, "Failed requirement: glStatus == GL_NO_ERROR", true);
}

} // namespace

GPUImplHardware::GPUImplHardware() : device(nullptr) {}

GPUImplHardware::~GPUImplHardware() = default;

std::string GPUImplHardware::DoGetGLVersion()
{
    const ScopedGLCurrentExtensions current(*context);
    const QGF::OGL::ExtensionManager& extensions = RequireExtensions(current.Extensions());
    const char* const version = NewestGLVersion(
        [&extensions](OpenGLExtension candidate) { return extensions.isSupported(candidate); });
    if (version == nullptr)
        throw std::runtime_error("Cannot determine OGL version");
    return version;
}

std::string GPUImplHardware::DoGetGLName()
{
    return DoGLGetString(kGLRenderer);
}

std::string GPUImplHardware::DoGetGLVendor()
{
    return DoGLGetString(kGLVendor);
}

std::uint32_t GPUImplHardware::DoGetGLRectTextureSize()
{
    std::int32_t size = 0;
    DoGLGetIntegerv(kGLMaxRectangleTextureSize, &size);
    return static_cast<std::uint32_t>(size);
}

std::string GPUImplHardware::DoGetGLRenderer()
{
    return DoGLGetString(kGLRenderer);
}

bool GPUImplHardware::DoHasGLNPOTSupport()
{
    return DoGLIsExtensionSupported(QGF::OGL::GL_ARB_TEXTURE_NON_POWER_OF_TWO);
}

std::string GPUImplHardware::DoGetGLDriver()
{
    return std::string();
}

std::string GPUImplHardware::DoGetGLDriverDate()
{
    return std::string();
}

std::string GPUImplHardware::DoGetGLDriverExtra()
{
    return std::string();
}

bool GPUImplHardware::DoCompileProgramGLSL()
{
    bool result = false;
    try {
        const ScopedGLCurrent current(*context);
        QGF::OGL::Program program;
        program.loadVertexShader(kTestVertexShaderCount, kTestVertexShader, nullptr);
        program.loadFragmentShader(kTestFragmentShaderCount, kTestFragmentShader, nullptr);
        program.link(true);
        result = true;
    } catch (const std::exception& error) {
        PM_LOG(gGPUAssay, "DoCompileProgramGLSL: " << error.what());
        result = false;
    }
    return result;
}

bool GPUImplHardware::DoGLFramebufferOK()
{
    constexpr std::int32_t kSize = 32;
    // Deliberately out of range: OpenGL must clamp it to opaque white.
    constexpr float kClearValue = 255.0F;

    bool result = false;
    try {
        const ScopedGLCurrent current(*context);
        const QGF::OGL::Texture2D texture(QGF::OGL::InternalFormat::RGBA8, kSize, kSize, false,
                                          nullptr, QGF::OGL::Type::Default);
        QGF::OGL::Framebuffer framebuffer;
        framebuffer.bind();
        framebuffer.attach(texture, 0, 0);
        OpenGLInterceptor::Instance().glClearColor(kModule, __LINE__, kClearValue, kClearValue,
                                                   kClearValue, kClearValue);
        OpenGLInterceptor::Instance().glClear(kModule, __LINE__, kGLColorBufferBit);
        framebuffer.unbind();
        const std::uint32_t status = OpenGLInterceptor::Instance().glGetError(kModule, __LINE__);
        if (status == kGLNoError) {
            result = true;
        } else {
            PM_LOG(gGPUAssay, "DoGLFramebufferOK"
                                  << ": glGetError() returns "
                                  << static_cast<std::int32_t>(status));
        }
    } catch (const std::exception& error) {
        PM_LOG(gGPUAssay, "DoGLFramebufferOK"
                              << ": " << error.what());
        result = false;
    }
    return result;
}

const char* GPUImplHardware::DoGLGetString(std::uint32_t name)
{
    const ScopedGLCurrent current(*context);
    const std::uint8_t* const text =
        OpenGLInterceptor::Instance().glGetString(kModule, __LINE__, name);
    const std::uint32_t status = OpenGLInterceptor::Instance().glGetError(kModule, __LINE__);
    if (status != kGLNoError) {
        PM_LOG(gGPUAssay, "GPUImplHardware::DoGLGetString"
                              << "(" << static_cast<std::int32_t>(name)
                              << "): glGetError() returns " << status);
    }
    RequireNoGLError(status);
    return reinterpret_cast<const char*>(text);
}

void GPUImplHardware::DoGLGetIntegerv(std::uint32_t name, std::int32_t* result)
{
    const ScopedGLCurrent current(*context);
    OpenGLInterceptor::Instance().glGetIntegerv(kModule, __LINE__, name, result);
    const std::uint32_t status = OpenGLInterceptor::Instance().glGetError(kModule, __LINE__);
    if (status != kGLNoError) {
        PM_LOG(gGPUAssay, "GPUImplHardware::DoGLGetIntegerv"
                              << "(" << static_cast<std::int32_t>(name)
                              << "): glGetError() returns " << status);
    }
    RequireNoGLError(status);
}

void GPUImplHardware::DoGLGetProgramivARB(std::uint32_t target, std::uint32_t code,
                                          std::int32_t* result)
{
    const ScopedGLCurrent current(*context);
    OpenGLInterceptor::Instance().glGetProgramivARB(kModule, __LINE__, target, code, result);
    const std::uint32_t status = OpenGLInterceptor::Instance().glGetError(kModule, __LINE__);
    if (status != kGLNoError) {
        PM_LOG(gGPUAssay, "GPUImplHardware::DoGLGetProgramivARB"
                              << "(target=" << static_cast<std::int32_t>(target)
                              << ", code=" << static_cast<std::int32_t>(code)
                              << "): glGetError() returns " << status);
    }
    RequireNoGLError(status);
}

bool GPUImplHardware::DoGLIsExtensionSupported(OpenGLExtension extension)
{
    const ScopedGLCurrentExtensions current(*context);
    return RequireExtensions(current.Extensions()).isSupported(extension);
}

bool GPUImplHardware::DoIsIntegratedGLGPU()
{
    return false;
}

} // namespace pmutil
