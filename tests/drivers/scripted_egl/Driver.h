// The common parts of the driver's EGL and OpenGL halves.
#pragma once

#include <deque>
#include <map>
#include <string>
#include <vector>

#include "Model.h"

// NOLINTNEXTLINE(modernize-deprecated-headers): the header's own name
#include <EGL/egl.h>
#include <EGL/eglext.h>

namespace scripted {

// The objects of an OpenGL context.
struct GLState {
    struct Shader {
        std::uint32_t kind = 0;
        bool compiled = false;
        std::string log;
    };
    struct Program {
        std::vector<std::uint32_t> shaders;
        bool linked = false;
        std::string log;
    };

    std::deque<std::uint32_t> errors;
    std::uint32_t nextID = 1;
    std::map<std::uint32_t, Shader> shaders;
    std::map<std::uint32_t, Program> programs;
    std::map<std::uint32_t, bool> textures;              // true once it has an image
    std::map<std::uint32_t, std::uint32_t> framebuffers; // to the attached texture
    std::uint32_t boundTexture = 0;
    std::uint32_t boundFramebuffer = 0;
};

struct DisplayObject {
    int device = 0;
    bool initialized = false;
};

struct ContextObject {
    int device = 0;
    int number = 0;
    GLState gl;
};

struct SurfaceObject {
    int device = 0;
    int number = 0;
};

// Returns the calling thread's context; null if there is none.
ContextObject* CurrentContext();

// Returns the OpenGL entry point of that name; null if there is none.
using Entry = __eglMustCastToProperFunctionPointerType;
Entry FindGL(const std::string& name);

// Arguments for the record.
inline Argument Enum(std::uint32_t value)
{
    static const char kDigits[] = "0123456789ABCDEF";
    std::string digits;
    for (std::uint32_t rest = value; digits.size() < 4 || rest != 0; rest >>= 4U)
        digits.insert(digits.begin(), kDigits[rest & 0xFU]);
    return {"0x" + digits, value};
}
inline Argument Number(std::int64_t value)
{
    return {std::to_string(value), value};
}
inline Argument Text(const char* value)
{
    return {Quoted(value), {}};
}

} // namespace scripted
