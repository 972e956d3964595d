// The policy: what the attempts so far say about an interface, and when it is tried again. A pure
// function of the attempts and the time. docs/advise.md describes it.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "memory/Attempt.h"

namespace assay_host {

// All times are seconds.
struct Policy {
    static constexpr std::int64_t kMinute = 60;
    static constexpr std::int64_t kHour = 60 * kMinute;
    static constexpr std::int64_t kDay = 24 * kHour;

    std::int64_t fMaxAge = 30 * kDay;         // hardware and software are tried again after this
    std::int64_t fAbsentKept = 10 * kMinute;  // absent is
    std::int64_t fUnknownKept = 1 * kMinute;  // unknown is, if a child ended by itself
    std::int64_t fFirstPause = 1 * kMinute;   // before the second attempt after a failure
    std::int64_t fPauseGrowth = 60;           // each further pause is longer by this factor
    std::size_t fRetries = 2;                 // attempts after the first failure
    std::int64_t fForgiven = 7 * kDay;        // failures that are older don't count
    std::int64_t fFreezeForgiven = 30 * kDay; // system ends that are older don't count
    std::size_t fMaxUnclear = 3; // attempts in a row whose host ended, before there is a pause
    std::int64_t fUnclearPause = 10 * kMinute;
};

// A time that is in the future by more than this is a sign of a clock that was set. Such a result
// counts as old, and so does a failure; the end of a system counts as fresh.
constexpr std::int64_t kClockTolerance = 5 * Policy::kMinute;

// Why an interface is to be tried.
enum class Due {
    kNot,
    kFirst,     // nothing is known of this identity
    kOld,       // the result is too old, absent, or from the future
    kRequested, // the caller wants a fresh one
    kAfterFailure,
    kForgiven,    // the last failures are too old
    kAfterFreeze, // the system ended during the last attempt
    kUnclear      // the last attempt showed nothing
};

// Returns "not-due", "first", "old", "requested", "after-failure", "forgiven", "after-system-end"
// or "unclear".
const char* GetDueName(Due due);

struct Outlook {
    Finding fFinding;                  // the answer for as long as there is no new attempt
    std::optional<std::int64_t> fTime; // of the attempt that the finding is of
    const Attempt* fBasis = nullptr;   // that attempt; null if the finding is of none
    Due fDue = Due::kNot;
    std::optional<std::int64_t> fNextTime; // when it is due; empty if it is
    std::size_t fFailures = 0;             // that count, since the last success
    std::string fWarning;                  // one sentence; may be empty
};

// Judges one interface. `attempts` are closed, oldest first; the outlook points into them. With
// `fresh` each result is due; the pauses after failures stay. Any thread may call.
Outlook Judge(DeviceKind kind, const std::vector<Attempt>& attempts, std::int64_t now,
              const Policy& policy, bool fresh = false);

} // namespace assay_host
