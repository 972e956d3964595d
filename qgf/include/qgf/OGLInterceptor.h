// The OpenGL calls of the library, each with the place of the caller in front, and the extensions
// that a context offers.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "qgf/Core.h"

namespace QGF {
namespace OGL {

// The entry points that the library uses, as a loader filled them; null where the driver has none.
// The types are OpenGL's own, spelled out, so that no OpenGL header is needed here.
struct OpenGLTable;

// The call table of one context. Each call takes the caller's source file and line, then OpenGL's
// arguments. A call whose entry point the driver lacks throws LogicalException "NAME is not offered
// by this OpenGL driver (called from FILE:LINE)".
class OpenGLInterceptor {
public:
    // Looks the entry points up with `getProc`; `getProc(context, name)` may return null.
    using GetProc = Core::Proc (*)(void* context, const char* name);
    OpenGLInterceptor(GetProc getProc, void* context);
    ~OpenGLInterceptor();
    OpenGLInterceptor(const OpenGLInterceptor&) = delete;
    OpenGLInterceptor& operator=(const OpenGLInterceptor&) = delete;

    // The table of the context that is current on this thread. Throws if there is none.
    static const OpenGLInterceptor& Instance();

    const std::uint8_t* glGetString(const char* file, int line, std::uint32_t name) const;
    // Null instead of an exception where the driver doesn't know indexed strings.
    const std::uint8_t* glGetStringi(const char* file, int line, std::uint32_t name,
                                     std::uint32_t index) const;
    std::uint32_t glGetError(const char* file, int line) const;
    void glGetIntegerv(const char* file, int line, std::uint32_t name, std::int32_t* result) const;
    void glGetProgramivARB(const char* file, int line, std::uint32_t target, std::uint32_t code,
                           std::int32_t* result) const;
    void glClearColor(const char* file, int line, float red, float green, float blue,
                      float alpha) const;
    void glClear(const char* file, int line, std::uint32_t mask) const;

    std::uint32_t glCreateShader(const char* file, int line, std::uint32_t kind) const;
    void glShaderSource(const char* file, int line, std::uint32_t shader, std::int32_t count,
                        const char* const* strings, const std::int32_t* lengths) const;
    void glCompileShader(const char* file, int line, std::uint32_t shader) const;
    void glGetShaderiv(const char* file, int line, std::uint32_t shader, std::uint32_t name,
                       std::int32_t* result) const;
    void glGetShaderInfoLog(const char* file, int line, std::uint32_t shader, std::int32_t size,
                            std::int32_t* length, char* text) const;
    void glDeleteShader(const char* file, int line, std::uint32_t shader) const;
    std::uint32_t glCreateProgram(const char* file, int line) const;
    void glAttachShader(const char* file, int line, std::uint32_t program,
                        std::uint32_t shader) const;
    void glLinkProgram(const char* file, int line, std::uint32_t program) const;
    void glGetProgramiv(const char* file, int line, std::uint32_t program, std::uint32_t name,
                        std::int32_t* result) const;
    void glGetProgramInfoLog(const char* file, int line, std::uint32_t program, std::int32_t size,
                             std::int32_t* length, char* text) const;
    void glDeleteProgram(const char* file, int line, std::uint32_t program) const;

    void glGenTextures(const char* file, int line, std::int32_t count, std::uint32_t* ids) const;
    void glBindTexture(const char* file, int line, std::uint32_t target, std::uint32_t id) const;
    void glTexParameteri(const char* file, int line, std::uint32_t target, std::uint32_t name,
                         std::int32_t value) const;
    void glTexImage2D(const char* file, int line, std::uint32_t target, std::int32_t level,
                      std::int32_t internalFormat, std::int32_t width, std::int32_t height,
                      std::int32_t border, std::uint32_t format, std::uint32_t type,
                      const void* data) const;
    void glGenerateMipmap(const char* file, int line, std::uint32_t target) const;
    void glDeleteTextures(const char* file, int line, std::int32_t count,
                          const std::uint32_t* ids) const;

    void glGenFramebuffers(const char* file, int line, std::int32_t count,
                           std::uint32_t* ids) const;
    void glBindFramebuffer(const char* file, int line, std::uint32_t target,
                           std::uint32_t id) const;
    void glFramebufferTexture2D(const char* file, int line, std::uint32_t target,
                                std::uint32_t attachment, std::uint32_t textureTarget,
                                std::uint32_t texture, std::int32_t level) const;
    std::uint32_t glCheckFramebufferStatus(const char* file, int line, std::uint32_t target) const;
    void glDeleteFramebuffers(const char* file, int line, std::int32_t count,
                              const std::uint32_t* ids) const;

private:
    std::unique_ptr<OpenGLTable> fTable;
};

// Core versions and extensions, by the library's own numbers.
enum OpenGLExtension : std::int32_t {
    GL_VERSION_1_2 = 0,
    GL_IMAGING_1_2 = 1, // the optional imaging subset
    GL_VERSION_1_3 = 2,
    GL_VERSION_1_4 = 3,
    GL_VERSION_1_5 = 4,
    GL_VERSION_2_0 = 5,
    GL_VERSION_2_1 = 6,
    GL_VERSION_3_0 = 7,
    GL_VERSION_3_1 = 8,
    GL_VERSION_3_2 = 9,
    GL_VERSION_3_3 = 10,
    GL_VERSION_4_0 = 11,
    GL_VERSION_4_1 = 12,
    GL_ARB_FRAGMENT_PROGRAM = 27,
    GL_ARB_FRAGMENT_SHADER = 28,
    GL_ARB_OCCLUSION_QUERY = 37,
    GL_ARB_SHADER_TEXTURE_LOD = 47,
    GL_ARB_TEXTURE_FLOAT = 53,
    GL_ARB_TEXTURE_NON_POWER_OF_TWO = 56,
    GL_ARB_TEXTURE_RECTANGLE = 58,
    GL_ARB_VERTEX_BUFFER_OBJECT = 68,
    GL_ARB_VERTEX_PROGRAM = 69,
    GL_ARB_VERTEX_SHADER = 70,
    GL_EXT_FRAMEBUFFER_OBJECT = 81,
};

// What one context offers.
class ExtensionManager {
public:
    // The manager of the context that is current on this thread; null if there is none.
    static ExtensionManager* Instance();

    // Reads version and extension names through the interceptor of a context that is current.
    explicit ExtensionManager(const OpenGLInterceptor& gl);

    // True if the context offers this core version (or a later one) or this extension. An id that
    // the library doesn't know is not supported.
    bool isSupported(OpenGLExtension extension) const;

private:
    int fMajor = 0;
    int fMinor = 0;
    std::vector<std::string> fNames; // sorted
};

} // namespace OGL
} // namespace QGF
