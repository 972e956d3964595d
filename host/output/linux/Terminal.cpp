#include "output/Terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

namespace assay_host {

namespace {

constexpr int kUsualWidth = 80;

int GetWidth(int stream)
{
    winsize size = {};
    if (::ioctl(stream, TIOCGWINSZ, &size) != 0 || size.ws_col == 0)
        return kUsualWidth;
    return size.ws_col;
}

} // namespace

bool IsInputTerminal()
{
    return ::isatty(STDIN_FILENO) != 0;
}

bool IsErrorTerminal()
{
    return ::isatty(STDERR_FILENO) != 0;
}

int GetOutputWidth()
{
    return GetWidth(STDOUT_FILENO);
}

int GetErrorWidth()
{
    return GetWidth(STDERR_FILENO);
}

} // namespace assay_host
