#include "supervise/Interrupt.h"

#include <windows.h>

#include <atomic>

namespace assay_host {

namespace {

std::atomic<bool> gInterrupted{false};

// Windows ends the process when this returns after a closed console, a logoff or a shutdown; it
// allows some seconds before.
constexpr DWORD kTimeForTheEnd = 4000;

BOOL WINAPI NoteInterrupt(DWORD event)
{
    const bool second = gInterrupted.exchange(true);
    if (event == CTRL_C_EVENT || event == CTRL_BREAK_EVENT)
        return second ? FALSE : TRUE;
    ::Sleep(kTimeForTheEnd);
    return TRUE;
}

} // namespace

void WatchForInterrupt()
{
    ::SetConsoleCtrlHandler(NoteInterrupt, TRUE);
}

bool WasInterrupted()
{
    return gInterrupted;
}

} // namespace assay_host
