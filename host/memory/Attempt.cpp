#include "memory/Attempt.h"

#include <iterator>
#include <tuple>
#include <utility>

namespace assay_host {

namespace {

constexpr const char* kEndNames[] = {"open",         "ended",      "crashed",
                                     "hung",         "killed",     "not-started",
                                     "host-stopped", "host-ended", "system-ended"};

bool ShowsNothing(const Attempt& attempt)
{
    return (attempt.fEnd == AttemptEnd::kNotStarted || attempt.fEnd == AttemptEnd::kStopped) &&
           attempt.fOpenGL.fUsability == Usability::kUnknown &&
           attempt.fOpenCL.fUsability == Usability::kUnknown;
}

} // namespace

const char* GetAttemptEndName(AttemptEnd end)
{
    return kEndNames[static_cast<std::size_t>(end)];
}

std::optional<AttemptEnd> ReadAttemptEnd(const std::string& name)
{
    for (std::size_t index = 0; index < std::size(kEndNames); ++index)
        if (name == kEndNames[index])
            return static_cast<AttemptEnd>(index);
    return std::nullopt;
}

bool operator==(const HostMark& left, const HostMark& right)
{
    return std::tie(left.fProcess, left.fStart, left.fBoot, left.fMachine) ==
           std::tie(right.fProcess, right.fStart, right.fBoot, right.fMachine);
}

void AddAttempt(Knowledge& knowledge, Attempt attempt)
{
    std::vector<Attempt>& attempts = knowledge.fAttempts;
    if (!attempts.empty() && ShowsNothing(attempts.back()))
        attempts.pop_back();
    while (attempts.size() >= kMaxAttempts)
        attempts.erase(attempts.begin());
    attempts.push_back(std::move(attempt));
    ++knowledge.fCount;
}

} // namespace assay_host
