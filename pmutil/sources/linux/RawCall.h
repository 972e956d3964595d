// System calls without the C library, for code that may not use its thread-local memory (errno).
#pragma once

namespace pmutil {

// Makes a system call. Returns its result, or the negative errno. Always inlined, so that a call
// that returns in two processes on one stack is safe.
[[gnu::always_inline]] inline long RawCall(long number, long first = 0, long second = 0,
                                           long third = 0, long fourth = 0, long fifth = 0)
{
#if defined(__x86_64__)
    long result = number;
    register long r10 asm("r10") = fourth;
    register long r8 asm("r8") = fifth;
    asm volatile("syscall"
                 : "+a"(result)
                 : "D"(first), "S"(second), "d"(third), "r"(r10), "r"(r8)
                 : "rcx", "r11", "memory");
    return result;
#elif defined(__aarch64__)
    register long x8 asm("x8") = number;
    register long x0 asm("x0") = first;
    register long x1 asm("x1") = second;
    register long x2 asm("x2") = third;
    register long x3 asm("x3") = fourth;
    register long x4 asm("x4") = fifth;
    asm volatile("svc #0" : "+r"(x0) : "r"(x8), "r"(x1), "r"(x2), "r"(x3), "r"(x4) : "memory");
    return x0;
#else
#error "the system call instruction of this processor is missing"
#endif
}

} // namespace pmutil
