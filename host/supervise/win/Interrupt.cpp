#include "supervise/Interrupt.h"

#include <windows.h>

#include <utility>

#include "supervise/InterruptNotes.h"

namespace assay_host {

namespace {

// In milliseconds. After a closed console, a logoff or a shutdown, Windows ends the process when
// the handler returns, or after 5 seconds.
constexpr DWORD kMaxEndTime = 4000;

BOOL WINAPI TakeEvent(DWORD event)
{
    NoteInterrupt();
    if (event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT)
        ::Sleep(kMaxEndTime);
    return TRUE;
}

} // namespace

void PrepareSignals() {}

void WatchForInterrupt(std::shared_ptr<pmutil::StopRequest> stop)
{
    SetInterruptStop(std::move(stop));
    ::SetConsoleCtrlHandler(TakeEvent, TRUE);
}

} // namespace assay_host
