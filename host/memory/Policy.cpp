#include "memory/Policy.h"

#include <algorithm>
#include <iterator>

#include <fmt/format.h>

namespace assay_host {

namespace {

constexpr const char* kDueNames[] = {"not-due",          "first",         "old",
                                     "requested",        "after-failure", "forgiven",
                                     "after-system-end", "unclear"};

// What an attempt says about one interface.
enum class Said {
    kWorks,
    kAbsent,
    kFails,   // also a failure before this interface was tried
    kFroze,   // the system ended
    kUnclear, // its host ended, or another process killed the child
    kUnknown, // the child ended without an answer
    kNothing  // there was no child, or the host killed it
};

Said Classify(const Attempt& attempt, DeviceKind kind)
{
    const Finding& finding = attempt.Get(kind);
    switch (finding.fUsability) {
    case Usability::kHardware:
    case Usability::kSoftware:
        return Said::kWorks;
    case Usability::kAbsent:
        return Said::kAbsent;
    case Usability::kBroken:
        return Said::kFails;
    case Usability::kUnknown:
        break;
    }
    switch (attempt.fEnd) {
    case AttemptEnd::kCrashed:
    case AttemptEnd::kHung:
        return Said::kFails;
    case AttemptEnd::kEnded:
        return finding.fReason == "ended-before" ? Said::kFails : Said::kUnknown;
    case AttemptEnd::kSystemEnded:
        return Said::kFroze;
    case AttemptEnd::kNotStarted:
    case AttemptEnd::kStopped:
        return Said::kNothing;
    case AttemptEnd::kOpen:
    case AttemptEnd::kKilled:
    case AttemptEnd::kHostEnded:
        break;
    }
    return Said::kUnclear;
}

// Returns nothing for a time in the future.
std::optional<std::int64_t> GetAge(std::int64_t time, std::int64_t now)
{
    if (time > now + kClockTolerance)
        return std::nullopt;
    return std::max<std::int64_t>(now - time, 0);
}

bool IsWithin(std::int64_t time, std::int64_t now, std::int64_t limit)
{
    const auto age = GetAge(time, now);
    return age && *age <= limit;
}

class Judgement {
public:
    Judgement(DeviceKind kind, const std::vector<Attempt>& attempts, std::int64_t now,
              const Policy& policy, bool fresh)
        : fKind(kind), fAttempts(attempts), fNow(now), fPolicy(policy), fFresh(fresh)
    {
        for (auto each = attempts.rbegin(); each != attempts.rend() && !fIsAtEnd; ++each)
            Take(*each);
    }

    Outlook Make() const
    {
        Outlook outlook;
        outlook.fFailures = GetBad();
        SetDue(outlook);
        SetFinding(outlook);
        SetWarning(outlook);
        return outlook;
    }

private:
    // Takes the attempts from the newest on, up to a success or to what is too old to count.
    void Take(const Attempt& attempt)
    {
        switch (Classify(attempt, fKind)) {
        case Said::kWorks:
        case Said::kAbsent:
            fBasis = &attempt;
            fIsAtEnd = true;
            return;
        case Said::kFails:
            if (!IsWithin(attempt.fEnded, fNow, fPolicy.fForgiven)) {
                fIsForgiven = fIsAtEnd = true;
                return;
            }
            ++fFailures;
            SetFirst(fLastFailure, attempt);
            SetFirst(fLastBad, attempt);
            return;
        case Said::kFroze:
            // A clock that starts from zero at each boot must not make a freeze a matter of the
            // future, and so of no concern.
            if (GetAge(attempt.fEnded, fNow).value_or(0) > fPolicy.fFreezeForgiven) {
                fIsForgiven = fIsAtEnd = true;
                return;
            }
            ++fFreezes;
            SetFirst(fLastFreeze, attempt);
            SetFirst(fLastBad, attempt);
            return;
        case Said::kUnclear:
            if (fLastBad == nullptr && IsWithin(attempt.fEnded, fNow, fPolicy.fForgiven)) {
                ++fUnclear;
                SetFirst(fLastUnclear, attempt);
            }
            return;
        case Said::kUnknown:
            SetFirst(fLastUnknown, attempt);
            return;
        case Said::kNothing:
            SetFirst(fLastNothing, attempt);
            return;
        }
    }

    static void SetFirst(const Attempt*& place, const Attempt& attempt)
    {
        if (place == nullptr)
            place = &attempt;
    }

    std::size_t GetBad() const { return fFailures + fFreezes; }

    DeviceKind GetOther() const
    {
        return fKind == DeviceKind::kOpenGL ? DeviceKind::kOpenCL : DeviceKind::kOpenGL;
    }

    bool IsBasisAbsent() const { return Classify(*fBasis, fKind) == Said::kAbsent; }

    std::int64_t GetKept() const { return IsBasisAbsent() ? fPolicy.fAbsentKept : fPolicy.fMaxAge; }

    bool IsBasisValid() const
    {
        return fBasis != nullptr && IsWithin(fBasis->fEnded, fNow, GetKept());
    }

    // Returns the pause before the next attempt after this number of failures.
    std::int64_t GetPause(std::size_t failures) const
    {
        std::int64_t pause = fPolicy.fFirstPause;
        for (std::size_t count = 1; count < failures && pause < fPolicy.fForgiven; ++count)
            pause *= fPolicy.fPauseGrowth;
        return std::min(pause, fPolicy.fForgiven);
    }

    // Returns when the interface is due after what went wrong; nothing if it is at once.
    std::optional<std::int64_t> GetTimeAfterBad() const
    {
        if (fFreezes >= 2)
            return fLastFreeze->fEnded + fPolicy.fFreezeForgiven + 1;
        if (GetBad() > fPolicy.fRetries)
            return fLastBad->fEnded + fPolicy.fForgiven + 1;
        if (fLastBad == fLastFreeze)
            return std::nullopt;
        return fLastFailure->fEnded + GetPause(GetBad());
    }

    void SetDue(Outlook& outlook) const
    {
        if (fLastBad != nullptr || fUnclear > 0) {
            std::optional<std::int64_t> next;
            if (fLastBad != nullptr)
                next = GetTimeAfterBad();
            if (fUnclear >= fPolicy.fMaxUnclear)
                next = std::max(next.value_or(0), fLastUnclear->fEnded + fPolicy.fUnclearPause);
            Set(outlook, next,
                fUnclear > 0              ? Due::kUnclear
                : fLastBad == fLastFreeze ? Due::kAfterFreeze
                                          : Due::kAfterFailure);
        } else if (fBasis != nullptr) {
            if (!IsBasisValid())
                outlook.fDue = Due::kOld;
            else if (fFresh)
                outlook.fDue = Due::kRequested;
            else
                Set(outlook, fBasis->fEnded + GetKept() + 1, Due::kOld);
        } else if (fLastUnknown != nullptr &&
                   IsWithin(fLastUnknown->fEnded, fNow, fPolicy.fUnknownKept)) {
            Set(outlook, fLastUnknown->fEnded + fPolicy.fUnknownKept + 1, Due::kUnclear);
        } else {
            outlook.fDue = fIsForgiven                                          ? Due::kForgiven
                           : fLastUnknown != nullptr || fLastNothing != nullptr ? Due::kUnclear
                                                                                : Due::kFirst;
        }
    }

    void Set(Outlook& outlook, std::optional<std::int64_t> next, Due due) const
    {
        if (!next || *next <= fNow)
            outlook.fDue = due;
        else
            outlook.fNextTime = next;
    }

    void SetFinding(Outlook& outlook) const
    {
        const std::string name = GetKindName(fKind);
        if (fFreezes >= 2) {
            SetBasis(outlook, *fLastFreeze);
            outlook.fFinding = {
                Usability::kBroken,
                "system-ended",
                fmt::format("The system ended {} times while {} was tried.", fFreezes, name),
                {},
                {},
                {}};
        } else if (fLastBad != nullptr && fLastBad == fLastFreeze) {
            SetBasis(outlook, *fLastFreeze);
            outlook.fFinding = MakeUnknown(
                "system-ended", fmt::format("The system ended while {} was tried.", name));
        } else if (fLastFailure != nullptr) {
            // A failure of the other interface says nothing about this one.
            const bool isOther = fLastFailure->Get(fKind).fUsability == Usability::kUnknown &&
                                 fLastFailure->Get(GetOther()).fUsability == Usability::kBroken;
            const Attempt& basis = isOther && IsBasisValid() ? *fBasis : *fLastFailure;
            SetBasis(outlook, basis);
            outlook.fFinding = basis.Get(fKind);
        } else if (fUnclear > 0) {
            SetBasis(outlook, *fLastUnclear);
            const bool isKilled = fLastUnclear->fEnd == AttemptEnd::kKilled;
            outlook.fFinding = MakeUnknown(
                isKilled ? "killed" : "host-ended",
                fmt::format(isKilled ? "Another process killed the child while {} was tried."
                                     : "The host ended while {} was tried.",
                            name));
        } else if (IsBasisValid()) {
            SetBasis(outlook, *fBasis);
            outlook.fFinding = fBasis->Get(fKind);
        } else if (const Attempt* const last = GetLastWithoutAnswer()) {
            SetBasis(outlook, *last);
            outlook.fFinding = last->Get(fKind);
        } else if (fBasis != nullptr) {
            SetBasis(outlook, *fBasis);
            outlook.fFinding =
                MakeUnknown("too-old", fmt::format("What is known of {} is too old.", name));
        } else {
            outlook.fFinding =
                MakeUnknown("not-tried", fmt::format("{} has not been tried.", name));
        }
    }

    static void SetBasis(Outlook& outlook, const Attempt& attempt)
    {
        outlook.fBasis = &attempt;
        outlook.fTime = attempt.fEnded;
    }

    static Finding MakeUnknown(const char* reason, std::string text)
    {
        return {Usability::kUnknown, reason, std::move(text), {}, {}, {}};
    }

    // Returns the newest attempt that gave no answer for a reason of its own.
    const Attempt* GetLastWithoutAnswer() const
    {
        if (fLastUnknown == nullptr || fLastNothing == nullptr)
            return fLastUnknown != nullptr ? fLastUnknown : fLastNothing;
        return std::max(fLastUnknown, fLastNothing); // of one vector
    }

    void SetWarning(Outlook& outlook) const
    {
        const bool works = outlook.fFinding.fUsability == Usability::kHardware ||
                           outlook.fFinding.fUsability == Usability::kSoftware;
        if (!works)
            return;
        const std::string name = GetKindName(fKind);
        std::size_t earlier = 0;
        for (const Attempt* each = fAttempts.data(); each < outlook.fBasis; ++each) {
            const Said said = Classify(*each, fKind);
            if ((said == Said::kFails && IsWithin(each->fEnded, fNow, fPolicy.fForgiven)) ||
                (said == Said::kFroze && IsWithin(each->fEnded, fNow, fPolicy.fFreezeForgiven)))
                ++earlier;
        }
        if (earlier > 0)
            outlook.fWarning =
                earlier == 1 ? fmt::format("An earlier attempt with {} failed.", name)
                             : fmt::format("{} earlier attempts with {} failed.", earlier, name);
        else if (outlook.fBasis != &fAttempts.back())
            outlook.fWarning = "A later attempt gave no answer: " + fAttempts.back().fReason;
    }

    const DeviceKind fKind;
    const std::vector<Attempt>& fAttempts;
    const std::int64_t fNow;
    const Policy& fPolicy;
    const bool fFresh;

    bool fIsAtEnd = false;
    bool fIsForgiven = false;
    std::size_t fFailures = 0;
    std::size_t fFreezes = 0;
    std::size_t fUnclear = 0; // in a row, and newer than all that failed
    const Attempt* fBasis = nullptr;
    const Attempt* fLastFailure = nullptr;
    const Attempt* fLastFreeze = nullptr;
    const Attempt* fLastBad = nullptr; // the newer one of these
    const Attempt* fLastUnclear = nullptr;
    const Attempt* fLastUnknown = nullptr;
    const Attempt* fLastNothing = nullptr;
};

} // namespace

const char* GetDueName(Due due)
{
    return kDueNames[static_cast<std::size_t>(due)];
}

Outlook Judge(DeviceKind kind, const std::vector<Attempt>& attempts, std::int64_t now,
              const Policy& policy, bool fresh)
{
    return Judgement(kind, attempts, now, policy, fresh).Make();
}

} // namespace assay_host
