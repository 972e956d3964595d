// The EGL entry points that the library uses.
#pragma once

// Don't include the window system's headers.
#define EGL_NO_PLATFORM_SPECIFIC_TYPES
#define EGL_EGLEXT_PROTOTYPES
#include <EGL/egl.h>
#include <EGL/eglext.h>

#include "qgf/Core.h"

// The entry points. The two parameters are macros that take a name: CORE for functions that every
// EGL library has, EXTENSION for functions of extensions, null if the library lacks them. Those
// come after eglGetProcAddress, which looks them up.
#define QGF_EGL_ENTRY_POINTS(CORE, EXTENSION)                                                      \
    CORE(eglGetError)                                                                              \
    CORE(eglQueryString)                                                                           \
    CORE(eglGetDisplay)                                                                            \
    CORE(eglInitialize)                                                                            \
    CORE(eglBindAPI)                                                                               \
    CORE(eglChooseConfig)                                                                          \
    CORE(eglCreateContext)                                                                         \
    CORE(eglDestroyContext)                                                                        \
    CORE(eglCreatePbufferSurface)                                                                  \
    CORE(eglDestroySurface)                                                                        \
    CORE(eglMakeCurrent)                                                                           \
    CORE(eglGetProcAddress)                                                                        \
    EXTENSION(eglGetPlatformDisplayEXT)                                                            \
    EXTENSION(eglQueryDevicesEXT)                                                                  \
    EXTENSION(eglQueryDeviceStringEXT)

namespace QGF {
namespace OGL {

struct EGLTable {
#define QGF_EGL_MEMBER(name) decltype(&::name) name = nullptr; // NOLINT(*-macro-parentheses)
    QGF_EGL_ENTRY_POINTS(QGF_EGL_MEMBER, QGF_EGL_MEMBER)
#undef QGF_EGL_MEMBER
};

// Fills the table: core functions by `getProc(context, name)`, functions of extensions by
// eglGetProcAddress. Throws LogicalException "NAME is not offered by this EGL library" if a core
// function is missing.
void FillEGLTable(EGLTable& table, Core::Proc (*getProc)(void* context, const char* name),
                  void* context);

// Makes the calls of the table's functions observed. Only for the one table of a process.
void ObserveCalls(EGLTable& table);

} // namespace OGL
} // namespace QGF
