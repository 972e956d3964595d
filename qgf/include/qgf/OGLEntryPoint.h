// An OpenGL entry point as an object that is called like the function, with the place of the caller
// in front. On the 64-bit platforms there is one calling convention.
#pragma once

#include <cstdint>

#include "qgf/Core.h"

namespace QGF {
namespace OGL {

// OpenGL's own types, so that no OpenGL header is needed here.
using GLenum = std::uint32_t;
using GLbitfield = std::uint32_t;
using GLuint = std::uint32_t;
using GLint = std::int32_t;
using GLsizei = std::int32_t;
using GLfloat = float;
using GLubyte = std::uint8_t;
using GLchar = char;

// How entry points are looked up: `getProc(context, name)` gives null where the driver lacks one.
struct EntryPointLookup {
    Core::Proc (*getProc)(void* context, const char* name);
    void* context;

    // Where the driver lacks `name`, `extensionName` is looked up, unless it is null.
    Core::Proc find(const char* name, const char* extensionName) const;
};

// Throws LogicalException "NAME is not offered by this OpenGL driver (called from FILE:LINE)", with
// "?" in the place of a null `file`.
[[noreturn]] void ThrowNotOffered(const char* name, const char* file, int line);

template <typename Signature>
class EntryPoint;

template <typename Result, typename... Parameters>
class EntryPoint<Result(Parameters...)> {
public:
    // `name` is kept. `extensionName` is the name in the extension that the function came from, for
    // a driver that lacks the core one.
    EntryPoint(const EntryPointLookup& lookup, const char* name,
               const char* extensionName = nullptr)
        : fName(name), fFunction(reinterpret_cast<Function>(lookup.find(name, extensionName)))
    {}

    bool isOffered() const { return fFunction != nullptr; }

    // Takes the caller's source file and line, then OpenGL's arguments. Throws as ThrowNotOffered
    // does where the driver lacks the function.
    Result operator()(const char* file, int line, Parameters... parameters) const
    {
        if (!isOffered())
            ThrowNotOffered(fName, file, line);
        return fFunction(parameters...);
    }

private:
    using Function = Result (*)(Parameters...);

    const char* fName;
    Function fFunction;
};

// An entry point whose call gives null, and doesn't throw, where the driver lacks the function.
template <typename Signature>
class OptionalEntryPoint;

template <typename Result, typename... Parameters>
class OptionalEntryPoint<Result(Parameters...)> {
public:
    OptionalEntryPoint(const EntryPointLookup& lookup, const char* name) : fEntryPoint(lookup, name)
    {}

    Result operator()(const char* file, int line, Parameters... parameters) const
    {
        return fEntryPoint.isOffered() ? fEntryPoint(file, line, parameters...) : nullptr;
    }

private:
    EntryPoint<Result(Parameters...)> fEntryPoint;
};

} // namespace OGL
} // namespace QGF
