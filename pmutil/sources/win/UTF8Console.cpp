#include "pmutil/UTF8Console.h"

#include <windows.h>

#include <atomic>
#include <cstdio>

namespace pmutil {

namespace {

std::atomic<UINT> gPreviousCodePage{0}; // 0: none to restore

bool IsConsole(DWORD stream)
{
    DWORD mode = 0;
    return GetConsoleMode(GetStdHandle(stream), &mode) != 0;
}

// The system calls this after handlers that were added later, and only if none of them handled the
// event.
BOOL WINAPI RestoreBeforeTheEnd(DWORD /*event*/)
{
    UTF8Console::Restore();
    return FALSE;
}

} // namespace

UTF8Console::UTF8Console()
{
    // The console decodes each write separately, so the bytes of a character must be written in one
    // call.
    if (IsConsole(STD_OUTPUT_HANDLE))
        std::setvbuf(stdout, nullptr, _IOFBF, BUFSIZ);
    if (!IsConsole(STD_OUTPUT_HANDLE) && !IsConsole(STD_ERROR_HANDLE))
        return;
    const UINT previous = GetConsoleOutputCP();
    if (previous == CP_UTF8 || SetConsoleOutputCP(CP_UTF8) == 0)
        return;
    gPreviousCodePage = previous;
    SetConsoleCtrlHandler(RestoreBeforeTheEnd, TRUE);
}

UTF8Console::~UTF8Console()
{
    SetConsoleCtrlHandler(RestoreBeforeTheEnd, FALSE);
    Restore();
}

void UTF8Console::Restore()
{
    if (const UINT codePage = gPreviousCodePage.exchange(0))
        SetConsoleOutputCP(codePage);
}

} // namespace pmutil
