#include "qgf/qgf_ogl/win/HiddenWindow.h"

#include <future>

#include "qgf/Core.h"
#include "qgf/DriverCall.h"
#include "qgf/qgf_core/win/SystemError.h"

namespace QGF {
namespace OGL {

namespace {

constexpr wchar_t kClassName[] = L"QGFHiddenWindow";
constexpr int kSize = 32; // pixels; nothing is drawn on the window

[[noreturn]] void ThrowFailed(const char* call, const std::string& deviceName)
{
    const DWORD error = GetLastError();
    throw LogicalException(std::string(call) + " failed for display device " + deviceName + ": " +
                           Core::SystemErrorText(error));
}

// Calls a function in which Windows loads or calls the driver.
template <typename Function, typename... Parameters>
auto CallDriver(Function function, Parameters... parameters)
{
    const Core::DriverCall call(Core::Interface::kOpenGL);
    return function(parameters...);
}

// Ignores WM_CLOSE: a request to close all windows must not end a running measurement.
LRESULT CALLBACK HandleMessage(HWND window, UINT message, WPARAM wide, LPARAM extra)
{
    return message == WM_CLOSE ? 0 : DefWindowProcW(window, message, wide, extra);
}

// The class is registered once per process; the system unregisters it when the process ends.
void RegisterWindowClass(const std::string& deviceName)
{
    WNDCLASSEXW windowClass{};
    windowClass.cbSize = sizeof windowClass;
    windowClass.style = CS_OWNDC;
    windowClass.lpfnWndProc = HandleMessage;
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

HWND MakeWindow(const std::string& deviceName)
{
    RegisterWindowClass(deviceName);
    const POINT position = GetDesktopPosition(deviceName);
    const HWND window = CreateWindowExW(
        0, kClassName, L"", WS_POPUP | WS_CLIPCHILDREN | WS_CLIPSIBLINGS, position.x, position.y,
        kSize, kSize, nullptr, nullptr, GetModuleHandleW(nullptr), nullptr);
    if (window == nullptr)
        ThrowFailed("CreateWindowExW", deviceName);
    return window;
}

// Makes the window, passes it to `made` and dispatches its messages until WM_QUIT.
void RunWindow(const std::string& deviceName, std::promise<HWND> made)
{
    HWND window = nullptr;
    try {
        window = MakeWindow(deviceName);
    } catch (...) {
        made.set_exception(std::current_exception());
        return;
    }
    made.set_value(window);
    MSG message{};
    while (GetMessageW(&message, nullptr, 0, 0) > 0)
        DispatchMessageW(&message);
    DestroyWindow(window);
}

} // namespace

// Only the window belongs to the other thread. Drivers are called on the constructor's thread.
HiddenWindow::HiddenWindow(const std::string& deviceName)
{
    std::promise<HWND> promise;
    std::future<HWND> made = promise.get_future();
    fThread = std::thread(RunWindow, deviceName, std::move(promise));
    try {
        fWindow = made.get();
    } catch (...) {
        fThread.join();
        throw;
    }
    fThreadID = GetWindowThreadProcessId(fWindow, nullptr);
    try {
        ChooseFormat(deviceName);
    } catch (...) {
        Close();
        throw;
    }
}

HiddenWindow::~HiddenWindow()
{
    Close();
}

void HiddenWindow::Close()
{
    if (fDC != nullptr)
        ReleaseDC(fWindow, fDC);
    PostThreadMessageW(fThreadID, WM_QUIT, 0, 0);
    fThread.join();
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
    const int format = CallDriver(ChoosePixelFormat, fDC, &wanted);
    if (format == 0)
        ThrowFailed("ChoosePixelFormat", deviceName);
    if (CallDriver(SetPixelFormat, fDC, format, &wanted) == 0)
        ThrowFailed("SetPixelFormat", deviceName);
}

} // namespace OGL
} // namespace QGF
