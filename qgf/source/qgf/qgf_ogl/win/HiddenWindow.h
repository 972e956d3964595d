// A window that is never shown, as a place for an OpenGL context.
#pragma once

#include <string>
#include <thread>

#include <windows.h>

namespace QGF {
namespace OGL {

// Has a pixel format that OpenGL can use. A thread of its own takes the window's messages, so that
// another program's broadcast is answered at once, whatever the maker's thread is busy with. Not
// copyable; destroyed on the thread that made it.
class HiddenWindow {
public:
    // Lies on the part of the desktop that `deviceName` shows, so that a driver that serves one
    // device alone takes it. Throws LogicalException with the call that failed and the system's
    // reason.
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
