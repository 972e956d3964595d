// Display devices and offscreen contexts on WGL. A context has a hidden window.
#pragma once

#include <memory>
#include <vector>

#include <windows.h>

#include "qgf/OGLPlatform.h"

namespace QGF {
namespace OGL {

// The entry points of opengl32.dll that are used here.
struct WGLTable {
    decltype(&::wglCreateContext) wglCreateContext;
    decltype(&::wglDeleteContext) wglDeleteContext;
    decltype(&::wglMakeCurrent) wglMakeCurrent;
    decltype(&::wglGetProcAddress) wglGetProcAddress;
};

class WGLPlatform : public Platform {
public:
    // Owns the library and keeps it open. Throws LogicalException "opengl32.dll has no NAME" if it
    // lacks an entry point.
    explicit WGLPlatform(std::unique_ptr<Core::DynamicLibrary> library);

    // Lists the devices that show a part of the desktop, the primary one first.
    std::vector<DisplayDeviceKey> displayDevices() override;
    std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey& key) override;

private:
    std::unique_ptr<Core::DynamicLibrary> fLibrary;
    WGLTable fWGL{};
};

} // namespace OGL
} // namespace QGF
