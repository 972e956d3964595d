#include "output/Terminal.h"

#include <windows.h>

namespace assay_host {

namespace {

constexpr int kUsualWidth = 80;

// Returns 0 if the stream isn't a console.
int GetConsoleWidth(DWORD stream)
{
    CONSOLE_SCREEN_BUFFER_INFO info = {};
    if (::GetConsoleScreenBufferInfo(::GetStdHandle(stream), &info) == 0)
        return 0;
    return info.srWindow.Right - info.srWindow.Left + 1;
}

int GetWidth(DWORD stream)
{
    const int width = GetConsoleWidth(stream);
    return width > 0 ? width : kUsualWidth;
}

} // namespace

bool IsInputTerminal()
{
    DWORD mode = 0;
    return ::GetConsoleMode(::GetStdHandle(STD_INPUT_HANDLE), &mode) != 0;
}

bool IsErrorTerminal()
{
    return GetConsoleWidth(STD_ERROR_HANDLE) > 0;
}

int GetOutputWidth()
{
    return GetWidth(STD_OUTPUT_HANDLE);
}

int GetErrorWidth()
{
    return GetWidth(STD_ERROR_HANDLE);
}

} // namespace assay_host
