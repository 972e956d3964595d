#include "qgf/OGL.h"
#include "qgf/qgf_ogl/OpenGLTable.h"

namespace QGF {
namespace OGL {

namespace {

[[noreturn]] void ThrowMissing(const char* name, const char* file, int line)
{
    throw LogicalException(std::string(name) +
                           " is not offered by this OpenGL driver (called from " +
                           (file != nullptr ? file : "?") + ":" + std::to_string(line) + ")");
}

template <typename Result, typename... Parameters, typename... Arguments>
Result Call(Result (*function)(Parameters...), const char* name, const char* file, int line,
            Arguments... arguments)
{
    if (function == nullptr)
        ThrowMissing(name, file, line);
    return function(arguments...);
}

} // namespace

OpenGLInterceptor::OpenGLInterceptor(GetProc getProc, void* context)
    : fTable(std::make_unique<OpenGLTable>())
{
    FillOpenGLTable(*fTable, getProc, context);
}

OpenGLInterceptor::~OpenGLInterceptor() = default;

const OpenGLInterceptor& OpenGLInterceptor::Instance()
{
    const Context* const context = Context::Current();
    if (context == nullptr)
        throw LogicalException("No OpenGL context is current on this thread");
    return context->interceptor();
}

const std::uint8_t* OpenGLInterceptor::glGetString(const char* file, int line,
                                                   std::uint32_t name) const
{
    return Call(fTable->glGetString, "glGetString", file, line, name);
}

const std::uint8_t* OpenGLInterceptor::glGetStringi(const char*, int, std::uint32_t name,
                                                    std::uint32_t index) const
{
    return fTable->glGetStringi != nullptr ? fTable->glGetStringi(name, index) : nullptr;
}

std::uint32_t OpenGLInterceptor::glGetError(const char* file, int line) const
{
    return Call(fTable->glGetError, "glGetError", file, line);
}

void OpenGLInterceptor::glGetIntegerv(const char* file, int line, std::uint32_t name,
                                      std::int32_t* result) const
{
    Call(fTable->glGetIntegerv, "glGetIntegerv", file, line, name, result);
}

void OpenGLInterceptor::glGetProgramivARB(const char* file, int line, std::uint32_t target,
                                          std::uint32_t code, std::int32_t* result) const
{
    Call(fTable->glGetProgramivARB, "glGetProgramivARB", file, line, target, code, result);
}

void OpenGLInterceptor::glClearColor(const char* file, int line, float red, float green, float blue,
                                     float alpha) const
{
    Call(fTable->glClearColor, "glClearColor", file, line, red, green, blue, alpha);
}

void OpenGLInterceptor::glClear(const char* file, int line, std::uint32_t mask) const
{
    Call(fTable->glClear, "glClear", file, line, mask);
}

std::uint32_t OpenGLInterceptor::glCreateShader(const char* file, int line,
                                                std::uint32_t kind) const
{
    return Call(fTable->glCreateShader, "glCreateShader", file, line, kind);
}

void OpenGLInterceptor::glShaderSource(const char* file, int line, std::uint32_t shader,
                                       std::int32_t count, const char* const* strings,
                                       const std::int32_t* lengths) const
{
    Call(fTable->glShaderSource, "glShaderSource", file, line, shader, count, strings, lengths);
}

void OpenGLInterceptor::glCompileShader(const char* file, int line, std::uint32_t shader) const
{
    Call(fTable->glCompileShader, "glCompileShader", file, line, shader);
}

void OpenGLInterceptor::glGetShaderiv(const char* file, int line, std::uint32_t shader,
                                      std::uint32_t name, std::int32_t* result) const
{
    Call(fTable->glGetShaderiv, "glGetShaderiv", file, line, shader, name, result);
}

void OpenGLInterceptor::glGetShaderInfoLog(const char* file, int line, std::uint32_t shader,
                                           std::int32_t size, std::int32_t* length,
                                           char* text) const
{
    Call(fTable->glGetShaderInfoLog, "glGetShaderInfoLog", file, line, shader, size, length, text);
}

void OpenGLInterceptor::glDeleteShader(const char* file, int line, std::uint32_t shader) const
{
    Call(fTable->glDeleteShader, "glDeleteShader", file, line, shader);
}

std::uint32_t OpenGLInterceptor::glCreateProgram(const char* file, int line) const
{
    return Call(fTable->glCreateProgram, "glCreateProgram", file, line);
}

void OpenGLInterceptor::glAttachShader(const char* file, int line, std::uint32_t program,
                                       std::uint32_t shader) const
{
    Call(fTable->glAttachShader, "glAttachShader", file, line, program, shader);
}

void OpenGLInterceptor::glLinkProgram(const char* file, int line, std::uint32_t program) const
{
    Call(fTable->glLinkProgram, "glLinkProgram", file, line, program);
}

void OpenGLInterceptor::glGetProgramiv(const char* file, int line, std::uint32_t program,
                                       std::uint32_t name, std::int32_t* result) const
{
    Call(fTable->glGetProgramiv, "glGetProgramiv", file, line, program, name, result);
}

void OpenGLInterceptor::glGetProgramInfoLog(const char* file, int line, std::uint32_t program,
                                            std::int32_t size, std::int32_t* length,
                                            char* text) const
{
    Call(fTable->glGetProgramInfoLog, "glGetProgramInfoLog", file, line, program, size, length,
         text);
}

void OpenGLInterceptor::glDeleteProgram(const char* file, int line, std::uint32_t program) const
{
    Call(fTable->glDeleteProgram, "glDeleteProgram", file, line, program);
}

void OpenGLInterceptor::glGenTextures(const char* file, int line, std::int32_t count,
                                      std::uint32_t* ids) const
{
    Call(fTable->glGenTextures, "glGenTextures", file, line, count, ids);
}

void OpenGLInterceptor::glBindTexture(const char* file, int line, std::uint32_t target,
                                      std::uint32_t id) const
{
    Call(fTable->glBindTexture, "glBindTexture", file, line, target, id);
}

void OpenGLInterceptor::glTexParameteri(const char* file, int line, std::uint32_t target,
                                        std::uint32_t name, std::int32_t value) const
{
    Call(fTable->glTexParameteri, "glTexParameteri", file, line, target, name, value);
}

void OpenGLInterceptor::glTexImage2D(const char* file, int line, std::uint32_t target,
                                     std::int32_t level, std::int32_t internalFormat,
                                     std::int32_t width, std::int32_t height, std::int32_t border,
                                     std::uint32_t format, std::uint32_t type,
                                     const void* data) const
{
    Call(fTable->glTexImage2D, "glTexImage2D", file, line, target, level, internalFormat, width,
         height, border, format, type, data);
}

void OpenGLInterceptor::glGenerateMipmap(const char* file, int line, std::uint32_t target) const
{
    Call(fTable->glGenerateMipmap, "glGenerateMipmap", file, line, target);
}

void OpenGLInterceptor::glDeleteTextures(const char* file, int line, std::int32_t count,
                                         const std::uint32_t* ids) const
{
    Call(fTable->glDeleteTextures, "glDeleteTextures", file, line, count, ids);
}

void OpenGLInterceptor::glGenFramebuffers(const char* file, int line, std::int32_t count,
                                          std::uint32_t* ids) const
{
    Call(fTable->glGenFramebuffers, "glGenFramebuffers", file, line, count, ids);
}

void OpenGLInterceptor::glBindFramebuffer(const char* file, int line, std::uint32_t target,
                                          std::uint32_t id) const
{
    Call(fTable->glBindFramebuffer, "glBindFramebuffer", file, line, target, id);
}

void OpenGLInterceptor::glFramebufferTexture2D(const char* file, int line, std::uint32_t target,
                                               std::uint32_t attachment,
                                               std::uint32_t textureTarget, std::uint32_t texture,
                                               std::int32_t level) const
{
    Call(fTable->glFramebufferTexture2D, "glFramebufferTexture2D", file, line, target, attachment,
         textureTarget, texture, level);
}

std::uint32_t OpenGLInterceptor::glCheckFramebufferStatus(const char* file, int line,
                                                          std::uint32_t target) const
{
    return Call(fTable->glCheckFramebufferStatus, "glCheckFramebufferStatus", file, line, target);
}

void OpenGLInterceptor::glDeleteFramebuffers(const char* file, int line, std::int32_t count,
                                             const std::uint32_t* ids) const
{
    Call(fTable->glDeleteFramebuffers, "glDeleteFramebuffers", file, line, count, ids);
}

} // namespace OGL
} // namespace QGF
