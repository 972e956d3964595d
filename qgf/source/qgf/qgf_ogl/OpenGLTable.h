// The OpenGL entry points of one context. Types are OpenGL's, spelled out; on the 64-bit platforms
// there is one calling convention.
#pragma once

#include <cstdint>

#include "qgf/OGLInterceptor.h"

namespace QGF {
namespace OGL {

struct OpenGLTable {
    const std::uint8_t* (*glGetString)(std::uint32_t) = nullptr;
    const std::uint8_t* (*glGetStringi)(std::uint32_t, std::uint32_t) = nullptr;
    std::uint32_t (*glGetError)() = nullptr;
    void (*glGetIntegerv)(std::uint32_t, std::int32_t*) = nullptr;
    void (*glGetProgramivARB)(std::uint32_t, std::uint32_t, std::int32_t*) = nullptr;
    void (*glClearColor)(float, float, float, float) = nullptr;
    void (*glClear)(std::uint32_t) = nullptr;

    std::uint32_t (*glCreateShader)(std::uint32_t) = nullptr;
    void (*glShaderSource)(std::uint32_t, std::int32_t, const char* const*,
                           const std::int32_t*) = nullptr;
    void (*glCompileShader)(std::uint32_t) = nullptr;
    void (*glGetShaderiv)(std::uint32_t, std::uint32_t, std::int32_t*) = nullptr;
    void (*glGetShaderInfoLog)(std::uint32_t, std::int32_t, std::int32_t*, char*) = nullptr;
    void (*glDeleteShader)(std::uint32_t) = nullptr;
    std::uint32_t (*glCreateProgram)() = nullptr;
    void (*glAttachShader)(std::uint32_t, std::uint32_t) = nullptr;
    void (*glLinkProgram)(std::uint32_t) = nullptr;
    void (*glGetProgramiv)(std::uint32_t, std::uint32_t, std::int32_t*) = nullptr;
    void (*glGetProgramInfoLog)(std::uint32_t, std::int32_t, std::int32_t*, char*) = nullptr;
    void (*glDeleteProgram)(std::uint32_t) = nullptr;

    void (*glGenTextures)(std::int32_t, std::uint32_t*) = nullptr;
    void (*glBindTexture)(std::uint32_t, std::uint32_t) = nullptr;
    void (*glTexParameteri)(std::uint32_t, std::uint32_t, std::int32_t) = nullptr;
    void (*glTexImage2D)(std::uint32_t, std::int32_t, std::int32_t, std::int32_t, std::int32_t,
                         std::int32_t, std::uint32_t, std::uint32_t, const void*) = nullptr;
    void (*glGenerateMipmap)(std::uint32_t) = nullptr;
    void (*glDeleteTextures)(std::int32_t, const std::uint32_t*) = nullptr;

    void (*glGenFramebuffers)(std::int32_t, std::uint32_t*) = nullptr;
    void (*glBindFramebuffer)(std::uint32_t, std::uint32_t) = nullptr;
    void (*glFramebufferTexture2D)(std::uint32_t, std::uint32_t, std::uint32_t, std::uint32_t,
                                   std::int32_t) = nullptr;
    std::uint32_t (*glCheckFramebufferStatus)(std::uint32_t) = nullptr;
    void (*glDeleteFramebuffers)(std::int32_t, const std::uint32_t*) = nullptr;
};

// Fills the table with what `getProc(context, name)` gives. Where a driver lacks the core name of a
// function, the name of the extension that the function came from is asked for.
void FillOpenGLTable(OpenGLTable& table, OpenGLInterceptor::GetProc getProc, void* context);

} // namespace OGL
} // namespace QGF
