// Makes the kernel refuse system calls, as older kernels, emulators and containers do.
#pragma once

#include <cstddef>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <vector>

// Gives a call this result of the filter (SECCOMP_RET_...) from now on, in this thread and in what
// it starts; if `argument` isn't negative, only a call whose argument of this number has the value.
// Returns false if the kernel has no filters.
inline bool FilterCall(long call, int argument, unsigned value, unsigned result)
{
    const auto load = [](std::size_t offset) {
        return sock_filter BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<unsigned>(offset));
    };
    const auto unlessEqual = [](unsigned expected, std::size_t skipped) {
        return sock_filter BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, expected, 0,
                                    static_cast<unsigned char>(skipped));
    };
    const auto end = [](unsigned verdict) {
        return sock_filter BPF_STMT(BPF_RET | BPF_K, verdict);
    };
    std::vector<sock_filter> checks;
    if (argument >= 0)
        checks = {load(offsetof(seccomp_data, args) + 8 * static_cast<unsigned>(argument)),
                  unlessEqual(value, 1)};
    std::vector<sock_filter> filter = {load(offsetof(seccomp_data, nr)),
                                       unlessEqual(static_cast<unsigned>(call), checks.size() + 1)};
    filter.insert(filter.end(), checks.begin(), checks.end());
    filter.push_back(end(result));
    filter.push_back(end(SECCOMP_RET_ALLOW));
    const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
    return ::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
           ::prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

// The same: the call fails with an errno, or returns 0 at once for the errno 0.
inline bool RefuseCall(long call, int argument, unsigned value, int error)
{
    return FilterCall(call, argument, value, SECCOMP_RET_ERRNO | static_cast<unsigned>(error));
}
