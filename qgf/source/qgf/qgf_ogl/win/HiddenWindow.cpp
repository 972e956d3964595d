#include "qgf/qgf_ogl/win/HiddenWindow.h"

#include "qgf/Core.h"
#include "qgf/qgf_core/win/SystemError.h"

namespace QGF {
namespace OGL {

namespace {

constexpr wchar_t kClassName[] = L"QGFHiddenWindow";
constexpr int kSize = 32; // nothing is drawn on it

[[noreturn]] void ThrowFailed(const char* call, const std::string& deviceName)
{
    const DWORD error = GetLastError();
    throw LogicalException(std::string(call) + " failed for display device " + deviceName + ": " +
                           Core::SystemErrorText(error));
}

// Registered once per process; the system drops it at the end.
void RegisterWindowClass(const std::string& deviceName)
{
    WNDCLASSEXW windowClass{};
    windowClass.cbSize = sizeof windowClass;
    windowClass.style = CS_OWNDC;
    windowClass.lpfnWndProc = DefWindowProcW;
    windowClass.hInstance = GetModuleHandleW(nullptr);
    windowClass.lpszClassName = kClassName;
    if (RegisterClassExW(&windowClass) == 0 && GetLastError() != ERROR_CLASS_ALREADY_EXISTS)
        ThrowFailed("RegisterClassExW", deviceName);
}

POINT GetDesktopPosition(const std::string& deviceName)
{
    DEVMODEA mode{};
    mode.dmSize = sizeof mode;
    if (EnumDisplaySettingsA(deviceName.c_str(), ENUM_CURRENT_SETTINGS, &mode) == 0)
        return {};
    return {mode.dmPosition.x, mode.dmPosition.y};
}

} // namespace

HiddenWindow::HiddenWindow(const std::string& deviceName)
{
    RegisterWindowClass(deviceName);
    const POINT position = GetDesktopPosition(deviceName);
    fWindow = CreateWindowExW(0, kClassName, L"", WS_POPUP | WS_CLIPCHILDREN | WS_CLIPSIBLINGS,
                              position.x, position.y, kSize, kSize, nullptr, nullptr,
                              GetModuleHandleW(nullptr), nullptr);
    if (fWindow == nullptr)
        ThrowFailed("CreateWindowExW", deviceName);
    try {
        ChooseFormat(deviceName);
    } catch (...) {
        DestroyWindow(fWindow);
        throw;
    }
}

HiddenWindow::~HiddenWindow()
{
    ReleaseDC(fWindow, fDC);
    DestroyWindow(fWindow);
}

void HiddenWindow::ChooseFormat(const std::string& deviceName)
{
    constexpr BYTE kColorBits = 32;
    constexpr BYTE kAlphaBits = 8;

    fDC = GetDC(fWindow);
    if (fDC == nullptr)
        ThrowFailed("GetDC", deviceName);

    PIXELFORMATDESCRIPTOR wanted{};
    wanted.nSize = sizeof wanted;
    wanted.nVersion = 1;
    wanted.dwFlags = PFD_DRAW_TO_WINDOW | PFD_SUPPORT_OPENGL | PFD_DOUBLEBUFFER_DONTCARE;
    wanted.iPixelType = PFD_TYPE_RGBA;
    wanted.cColorBits = kColorBits;
    wanted.cAlphaBits = kAlphaBits;
    const int format = ChoosePixelFormat(fDC, &wanted);
    if (format == 0)
        ThrowFailed("ChoosePixelFormat", deviceName);
    if (SetPixelFormat(fDC, format, &wanted) == 0)
        ThrowFailed("SetPixelFormat", deviceName);
}

} // namespace OGL
} // namespace QGF
