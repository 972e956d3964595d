// Prints a line when it is loaded. A program that loads it has loaded a library from a folder that
// anyone may write to.
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
