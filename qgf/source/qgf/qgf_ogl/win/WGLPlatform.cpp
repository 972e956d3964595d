#include "qgf/qgf_ogl/win/WGLPlatform.h"

#include <algorithm>
#include <cstdint>
#include <string>

#include "qgf/DriverCall.h"
#include "qgf/qgf_core/ObservedCalls.h"
#include "qgf/qgf_core/Quietly.h"
#include "qgf/qgf_core/win/SystemError.h"
#include "qgf/qgf_ogl/win/HiddenWindow.h"

namespace QGF {
namespace OGL {

namespace {

class WGLOffscreen : public PlatformContext {
public:
    WGLOffscreen(const WGLTable& wgl, const Core::DynamicLibrary& library,
                 const DisplayDeviceKey& key)
        : fWGL(wgl),
          fLibrary(library),
          fWindow(key.deviceName()),
          fContext(wgl.wglCreateContext(fWindow.dc()))
    {
        const DWORD error = GetLastError();
        if (fContext == nullptr)
            throw LogicalException("wglCreateContext failed for display device " +
                                   key.deviceName() + ": " + Core::SystemErrorText(error));
    }

    ~WGLOffscreen() override
    {
        Core::Quietly([this] { fWGL.wglDeleteContext(fContext); });
    }

    WGLOffscreen(const WGLOffscreen&) = delete;
    WGLOffscreen& operator=(const WGLOffscreen&) = delete;

    void makeCurrent() override
    {
        if (fWGL.wglMakeCurrent(fWindow.dc(), fContext) == 0)
            throw LogicalException("wglMakeCurrent failed: " +
                                   Core::SystemErrorText(GetLastError()));
    }

    void release() noexcept override
    {
        Core::Quietly([this] { fWGL.wglMakeCurrent(nullptr, nullptr); });
    }

    Core::Proc getProc(const char* name) override
    {
        // Some drivers return -1, 1, 2 or 3 instead of null. The functions of OpenGL 1.1 are
        // exported by the library, and wglGetProcAddress returns null for them.
        constexpr std::intptr_t kMaxErrorValue = 3;
        const auto proc = reinterpret_cast<Core::Proc>(fWGL.wglGetProcAddress(name));
        const auto value = reinterpret_cast<std::intptr_t>(proc);
        return value > kMaxErrorValue || value < -1 ? proc : fLibrary.getProc(name);
    }

private:
    const WGLTable& fWGL;
    const Core::DynamicLibrary& fLibrary;
    HiddenWindow fWindow;
    HGLRC fContext;
};

template <typename Function>
void FillEntry(Function& entry, const Core::DynamicLibrary& library, const char* name)
{
    entry = reinterpret_cast<Function>(library.getProc(name));
    if (entry == nullptr)
        throw LogicalException(std::string("opengl32.dll has no ") + name);
}

void ObserveCalls(WGLTable& table)
{
    constexpr Core::Interface kOpenGL = Core::Interface::kOpenGL;
    Core::ObserveMember<kOpenGL, &WGLTable::wglCreateContext>(table);
    Core::ObserveMember<kOpenGL, &WGLTable::wglDeleteContext>(table);
    Core::ObserveMember<kOpenGL, &WGLTable::wglMakeCurrent>(table);
    Core::ObserveMember<kOpenGL, &WGLTable::wglGetProcAddress>(table);
}

} // namespace

WGLPlatform::WGLPlatform(std::unique_ptr<Core::DynamicLibrary> library)
    : fLibrary(std::move(library))
{
    FillEntry(fWGL.wglCreateContext, *fLibrary, "wglCreateContext");
    FillEntry(fWGL.wglDeleteContext, *fLibrary, "wglDeleteContext");
    FillEntry(fWGL.wglMakeCurrent, *fLibrary, "wglMakeCurrent");
    FillEntry(fWGL.wglGetProcAddress, *fLibrary, "wglGetProcAddress");
    if (Core::IsObserved())
        ObserveCalls(fWGL);
}

std::vector<DisplayDeviceKey> WGLPlatform::displayDevices()
{
    std::vector<DisplayDeviceKey> keys;
    std::size_t numPrimary = 0;
    DISPLAY_DEVICEW device{};
    device.cb = sizeof device;
    for (DWORD index = 0; EnumDisplayDevicesW(nullptr, index, &device, 0) != 0; ++index) {
        // A context needs a window, and a window needs a desktop. A mirroring driver isn't a
        // display device.
        if ((device.StateFlags & DISPLAY_DEVICE_ATTACHED_TO_DESKTOP) == 0 ||
            (device.StateFlags & DISPLAY_DEVICE_MIRRORING_DRIVER) != 0)
            continue;
        const DisplayDeviceKey key(Core::ToUTF8(device.DeviceName),
                                   Core::ToUTF8(device.DeviceString),
                                   Core::ToUTF8(device.DeviceID));
        if ((device.StateFlags & DISPLAY_DEVICE_PRIMARY_DEVICE) != 0)
            keys.insert(keys.begin() + static_cast<std::ptrdiff_t>(numPrimary++), key);
        else
            keys.push_back(key);
    }
    return keys;
}

std::unique_ptr<PlatformContext> WGLPlatform::createOffscreen(const DisplayDeviceKey& key)
{
    return std::make_unique<WGLOffscreen>(fWGL, *fLibrary, key);
}

std::unique_ptr<Platform> MakeNativePlatform()
{
    static const char* const names[] = {"opengl32.dll", nullptr};
    const Core::DriverCall call(Core::Interface::kOpenGL);
    return std::make_unique<WGLPlatform>(Core::OpenLibrary(names));
}

} // namespace OGL
} // namespace QGF
