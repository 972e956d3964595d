// QGF::OGL on WGL: the display devices of the desktop, and contexts on hidden windows.
#pragma once

#include <memory>
#include <vector>

#include <windows.h>

#include "qgf/OGLPlatform.h"

namespace QGF {
namespace OGL {

// The entry points of opengl32.dll that the binding uses.
struct WGLTable {
    decltype(&::wglCreateContext) wglCreateContext;
    decltype(&::wglDeleteContext) wglDeleteContext;
    decltype(&::wglMakeCurrent) wglMakeCurrent;
    decltype(&::wglGetProcAddress) wglGetProcAddress;
};

class WGLPlatform : public Platform {
public:
    // Throws LogicalException if the library lacks an entry point. Keeps the library open.
    explicit WGLPlatform(std::unique_ptr<Core::DynamicLibrary> library);

    // The devices that show a part of the desktop, the primary one first. A key's device string is
    // the adapter's description, its display id the device's own id.
    std::vector<DisplayDeviceKey> displayDevices() override;
    std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey& key) override;

private:
    std::unique_ptr<Core::DynamicLibrary> fLibrary;
    WGLTable fWGL{};
};

} // namespace OGL
} // namespace QGF
