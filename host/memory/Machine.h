// What the policy has to know of the machine at this moment: the time, and which processes exist.
#pragma once

#include <cstdint>
#include <memory>

#include "memory/Attempt.h"

namespace assay_host {

// The end of the year 9999, in seconds since 1970.
constexpr std::int64_t kLastTime = 253402300799;

// Any thread may call. Never throws for a fact that the system doesn't provide.
class Machine {
public:
    Machine() = default;
    virtual ~Machine() = default;
    Machine(const Machine&) = delete;
    Machine& operator=(const Machine&) = delete;

    // Returns the seconds since 1970 in UTC, as the system's clock is set; at least 0 and at most
    // kLastTime.
    virtual std::int64_t GetTime() = 0;

    // Returns the mark of this process.
    virtual HostMark GetSelf() = 0;

    // Whether the process exists, is the same one and not another of the same id.
    virtual bool IsAlive(const HostMark& host) = 0;

    // Whether the texts are of one start of the system. Both are known.
    virtual bool IsSameBoot(const std::string& one, const std::string& other)
    {
        return one == other;
    }
};

std::unique_ptr<Machine> MakeSystemMachine();

} // namespace assay_host
