// An OpenGL entry point as an object that is called like the function, with the caller's source
// file and line as first arguments. 64-bit platforms have one calling convention.
#pragma once

#include <cstdint>

#include "qgf/Core.h"
#include "qgf/DriverCall.h"

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

// Looks entry points up: `getProc(context, name)` returns null if the driver has none of that name.
struct EntryPointLookup {
    Core::Proc (*getProc)(void* context, const char* name);
    void* context;

    // Looks `name` up; if the driver lacks it and `extensionName` isn't null, looks that up.
    Core::Proc find(const char* name, const char* extensionName) const;
};

// Throws LogicalException "NAME is not offered by this OpenGL driver (called from FILE:LINE)"; a
// null `file` prints as "?".
[[noreturn]] void ThrowNotOffered(const char* name, const char* file, int line);

template <typename Signature>
class EntryPoint;

template <typename Result, typename... Parameters>
class EntryPoint<Result(Parameters...)> {
public:
    // `name` must outlive this object. `extensionName`, or null, is the function's name in its
    // extension, for a driver that lacks the core function.
    EntryPoint(const EntryPointLookup& lookup, const char* name,
               const char* extensionName = nullptr)
        : fName(name), fFunction(reinterpret_cast<Function>(lookup.find(name, extensionName)))
    {}

    bool isOffered() const { return fFunction != nullptr; }

    // Takes the caller's source file and line, then OpenGL's arguments. Throws as ThrowNotOffered
    // does if the driver lacks the function.
    Result operator()(const char* file, int line, Parameters... parameters) const
    {
        if (!isOffered())
            ThrowNotOffered(fName, file, line);
        const Core::DriverCall call(Core::Interface::kOpenGL);
        return fFunction(parameters...);
    }

private:
    using Function = Result (*)(Parameters...);

    const char* fName;
    Function fFunction;
};

// An entry point whose call returns null if the driver lacks the function.
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
