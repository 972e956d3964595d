// Says that it was loaded. No driver: whoever loads it took a file from a place that anyone may
// write to.
#include <windows.h>

extern "C" BOOL WINAPI DllMain(HINSTANCE /*module*/, DWORD reason, void* /*reserved*/)
{
    if (reason == DLL_PROCESS_ATTACH) {
        constexpr char kText[] = "planted library loaded\n";
        DWORD count = 0;
        ::WriteFile(::GetStdHandle(STD_ERROR_HANDLE), kText, sizeof kText - 1, &count, nullptr);
    }
    return TRUE;
}
