// What is remembered of the attempts to use the graphics drivers of one identity. Value types.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "identity/Identity.h"
#include "report/KnownKeys.h"
#include "report/Usable.h"

namespace assay_host {

// How an attempt ended. Only kEnded, kCrashed and kHung say something about a driver.
enum class AttemptEnd {
    kOpen,       // it is in progress, or its host could not write its end
    kEnded,      // the child ended by itself
    kCrashed,    // a signal or an exception ended it
    kHung,       // it was killed at the timeout
    kKilled,     // another process killed it
    kNotStarted, // the child could not be started
    kStopped,    // the host was asked to stop, and killed the child
    kHostEnded,  // the host ended without writing the end, and the system went on
    kSystemEnded // the system ended: a freeze, a power loss or a reset
};

// Returns "open", "ended", "crashed", "hung", "killed", "not-started", "host-stopped", "host-ended"
// or "system-ended".
const char* GetAttemptEndName(AttemptEnd end);

// Returns nothing for any other name.
std::optional<AttemptEnd> ReadAttemptEnd(const std::string& name);

// Identifies a process of any boot of any machine.
struct HostMark {
    std::uint64_t fProcess = 0; // its id
    std::uint64_t fStart = 0;   // its start, in a unit of the system, to tell reused ids apart
    std::string fBoot;          // of the system's start; empty if unknown
    std::string fMachine;       // of the installation; empty if unknown
};

bool operator==(const HostMark& left, const HostMark& right);

// What an attempt found of one interface.
struct Finding {
    Usability fUsability = Usability::kUnknown;
    std::string fReason; // as Usable::fReason
    std::string fText;   // one sentence, safe to write to a terminal
    std::string fTag;    // of the device; the others are raw bytes, empty if unknown
    std::string fDevice;
    std::string fDriver;
};

struct Attempt {
    std::int64_t fStarted = 0; // seconds since 1970 in UTC
    std::int64_t fEnded = 0;   // of one that isn't closed: fStarted
    HostMark fHost;
    AttemptEnd fEnd = AttemptEnd::kOpen;
    std::optional<int> fExitStatus; // of a child that ended by itself
    std::string fTermination;       // "signal 11 (Segmentation fault)"
    std::string fReason;            // one sentence; empty if it is open
    std::string fLastLine;          // the last line of the child's log or report; raw bytes
    Finding fOpenGL;
    Finding fOpenCL;

    const Finding& Get(DeviceKind kind) const
    {
        return kind == DeviceKind::kOpenGL ? fOpenGL : fOpenCL;
    }
};

struct Knowledge {
    Identity fIdentity;
    std::uint64_t fCount = 0;       // of all attempts, also of those that are forgotten
    std::vector<Attempt> fAttempts; // the last ones, oldest first
};

// Attempts that are kept. The policy needs fewer.
constexpr std::size_t kMaxAttempts = 16;

// Appends an attempt. Drops the oldest one if there are too many, and an earlier one that showed
// nothing.
void AddAttempt(Knowledge& knowledge, Attempt attempt);

} // namespace assay_host
