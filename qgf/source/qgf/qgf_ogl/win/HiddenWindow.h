// A window that is never shown, for an OpenGL context.
#pragma once

#include <string>
#include <thread>

#include <windows.h>

namespace QGF {
namespace OGL {

// The window has a pixel format that OpenGL can use. A thread of its own dispatches the window's
// messages, so that another program's broadcast doesn't wait while the constructor's thread is
// busy. Destroy it on the thread that made it.
class HiddenWindow {
public:
    // Makes the window on the part of the desktop that `deviceName` shows, so that a driver that
    // supports only one device accepts it. Throws LogicalException with the failed call and the
    // system's reason.
    explicit HiddenWindow(const std::string& deviceName);
    ~HiddenWindow();
    HiddenWindow(const HiddenWindow&) = delete;
    HiddenWindow& operator=(const HiddenWindow&) = delete;

    HDC dc() const { return fDC; }

private:
    void ChooseFormat(const std::string& deviceName);
    void Close();

    std::thread fThread;
    DWORD fThreadID = 0;
    HWND fWindow = nullptr;
    HDC fDC = nullptr;
};

} // namespace OGL
} // namespace QGF
