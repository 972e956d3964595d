// The EGL entry points that the library uses.
#pragma once

// EGL's own types are enough; the window system's headers stay out.
#define EGL_NO_PLATFORM_SPECIFIC_TYPES
#define EGL_EGLEXT_PROTOTYPES
#include <EGL/egl.h>
#include <EGL/eglext.h>

#include "qgf/Core.h"

// EGL's entry points, one a line. The two parameters are macros that take a name: CORE for those
// that each EGL library has, EXTENSION for those of extensions, null where the library lacks them.
// The latter come after eglGetProcAddress, which finds them.
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

// Fills the table with what `getProc(context, name)` gives: EGL's core functions from there, those
// of extensions by eglGetProcAddress. Throws LogicalException naming the core function that is
// missing.
void FillEGLTable(EGLTable& table, Core::Proc (*getProc)(void* context, const char* name),
                  void* context);

} // namespace OGL
} // namespace QGF
