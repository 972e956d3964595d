#include "win/Misbehave.h"

#include <windows.h>

#include <cassert>
#include <cstdlib>
#include <exception>

namespace {

// FAST_FAIL_FATAL_APP_EXIT, as the interrupt that Windows ends a process at without a last word.
void FastFail()
{
    constexpr int kFatalAppExit = 7;
    asm volatile("int $0x29" : : "c"(kFatalAppExit));
}

// Fills the stack. Each call looks at the array of the one above, so that none can stand for all.
// The array is large, so that the overflow is met with room left for what handles it: Wine needs
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
