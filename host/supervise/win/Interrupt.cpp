#include "supervise/Interrupt.h"

#include <windows.h>

#include <utility>

#include "supervise/InterruptNotes.h"

namespace assay_host {

namespace {

// Windows ends the process when this returns after a closed console, a logoff or a shutdown; it
// allows some seconds before.
constexpr DWORD kTimeForTheEnd = 4000;

BOOL WINAPI TakeEvent(DWORD event)
{
    NoteInterrupt();
    if (event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT)
        ::Sleep(kTimeForTheEnd);
    return TRUE;
}

} // namespace

void PrepareSignals() {}

void WatchForInterrupt(std::shared_ptr<StopRequest> stop)
{
    SetInterruptStop(std::move(stop));
    ::SetConsoleCtrlHandler(TakeEvent, TRUE);
}

} // namespace assay_host
