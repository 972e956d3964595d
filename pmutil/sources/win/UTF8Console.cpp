#include "pmutil/UTF8Console.h"

#include <windows.h>

#include <atomic>
#include <cstdio>

namespace pmutil {

namespace {

std::atomic<UINT> gCodePageBefore{0}; // 0: none to put back

bool IsConsole(DWORD stream)
{
    DWORD mode = 0;
    return GetConsoleMode(GetStdHandle(stream), &mode) != 0;
}

// Called after the handlers that were added later, and only if none of them handled the event.
BOOL WINAPI PutBackBeforeTheEnd(DWORD /*event*/)
{
    UTF8Console::PutBack();
    return FALSE;
}

} // namespace

UTF8Console::UTF8Console()
{
    // The console shows what comes in one write; a character that comes byte by byte is none to it.
    if (IsConsole(STD_OUTPUT_HANDLE))
        std::setvbuf(stdout, nullptr, _IOFBF, BUFSIZ);
    if (!IsConsole(STD_OUTPUT_HANDLE) && !IsConsole(STD_ERROR_HANDLE))
        return;
    const UINT before = GetConsoleOutputCP();
    if (before == CP_UTF8 || SetConsoleOutputCP(CP_UTF8) == 0)
        return;
    gCodePageBefore = before;
    SetConsoleCtrlHandler(PutBackBeforeTheEnd, TRUE);
}

UTF8Console::~UTF8Console()
{
    SetConsoleCtrlHandler(PutBackBeforeTheEnd, FALSE);
    PutBack();
}

void UTF8Console::PutBack()
{
    if (const UINT codePage = gCodePageBefore.exchange(0))
        SetConsoleOutputCP(codePage);
}

} // namespace pmutil
