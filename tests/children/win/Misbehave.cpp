#include "win/Misbehave.h"

#include <windows.h>

#include <cassert>
#include <cstdlib>
#include <exception>

namespace {

// Raises the interrupt of __fastfail with FAST_FAIL_FATAL_APP_EXIT: Windows ends the process
// without calling any handler.
void FastFail()
{
    constexpr int kFatalAppExit = 7;
    asm volatile("int $0x29" : : "c"(kFatalAppExit));
}

// Overflows the stack. Each call reads the array of its caller, so that the compiler can't merge
// the frames. The array is large, so that stack is left for the handler of the overflow: Wine needs
// some.
int Descend(const volatile char* above) // NOLINT(misc-no-recursion): on purpose
{
    volatile char space[1 << 18];
    space[0] = *above;
    if (*above != 0)
        return 0;
    return Descend(space) + space[0];
}

} // namespace

void Misbehave(const std::string& how)
{
    if (how == "access-violation") {
        volatile int* volatile nowhere = nullptr;
        *nowhere = 1;
    } else if (how == "abort") {
        std::abort();
    } else if (how == "assert") {
        assert(how.empty());
    } else if (how == "terminate") {
        std::terminate();
    } else if (how == "fast-fail") {
        FastFail();
    } else if (how == "stack-overflow") {
        const volatile char first = 0;
        Descend(&first);
    } else if (how == "exit") {
        std::exit(0);
    } else if (how == "hang") {
        ::Sleep(INFINITE);
    }
}
