// The EGL entry points that the library uses.
#pragma once

// EGL's own types are enough; the window system's headers stay out.
#define EGL_NO_PLATFORM_SPECIFIC_TYPES
#include <EGL/egl.h>
#include <EGL/eglext.h>

#include "qgf/Core.h"

namespace QGF {
namespace OGL {

struct EGLTable {
    EGLint (*eglGetError)() = nullptr;
    const char* (*eglQueryString)(EGLDisplay, EGLint) = nullptr;
    EGLDisplay (*eglGetDisplay)(EGLNativeDisplayType) = nullptr;
    EGLBoolean (*eglInitialize)(EGLDisplay, EGLint*, EGLint*) = nullptr;
    EGLBoolean (*eglBindAPI)(EGLenum) = nullptr;
    EGLBoolean (*eglChooseConfig)(EGLDisplay, const EGLint*, EGLConfig*, EGLint, EGLint*) = nullptr;
    EGLContext (*eglCreateContext)(EGLDisplay, EGLConfig, EGLContext, const EGLint*) = nullptr;
    EGLBoolean (*eglDestroyContext)(EGLDisplay, EGLContext) = nullptr;
    EGLSurface (*eglCreatePbufferSurface)(EGLDisplay, EGLConfig, const EGLint*) = nullptr;
    EGLBoolean (*eglDestroySurface)(EGLDisplay, EGLSurface) = nullptr;
    EGLBoolean (*eglMakeCurrent)(EGLDisplay, EGLSurface, EGLSurface, EGLContext) = nullptr;
    Core::Proc (*eglGetProcAddress)(const char*) = nullptr;

    // Null where the EGL library doesn't offer the extension.
    EGLDisplay (*eglGetPlatformDisplayEXT)(EGLenum, void*, const EGLint*) = nullptr;
    EGLBoolean (*eglQueryDevicesEXT)(EGLint, EGLDeviceEXT*, EGLint*) = nullptr;
    const char* (*eglQueryDeviceStringEXT)(EGLDeviceEXT, EGLint) = nullptr;
};

// Fills the table with what `getProc(context, name)` gives: EGL's core functions from there, those
// of extensions by eglGetProcAddress. Throws LogicalException naming the core function that is
// missing.
void FillEGLTable(EGLTable& table, Core::Proc (*getProc)(void* context, const char* name),
                  void* context);

} // namespace OGL
} // namespace QGF
