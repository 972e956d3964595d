#include "report/RunOutcome.h"

#include <algorithm>

namespace assay_host {

namespace {

constexpr const char* kNames[] = {
    "complete", "failed-tests", "usage-error", "crashed", "hung", "never-started", "interrupted",
};

} // namespace

const char* GetVerdictName(Verdict verdict)
{
    return kNames[static_cast<std::size_t>(verdict)];
}

int GetVerdictStatus(Verdict verdict)
{
    return static_cast<int>(verdict);
}

std::string RunOutcome::FindCause(const std::string& key) const
{
    const auto cause = std::find_if(fCauses.begin(), fCauses.end(),
                                    [&key](const Cause& each) { return each.fKey == key; });
    return cause == fCauses.end() ? std::string() : cause->fText;
}

double RunOutcome::FindLowerBound(const std::string& key) const
{
    const auto bound = std::find_if(fLowerBounds.begin(), fLowerBounds.end(),
                                    [&key](const LowerBound& each) { return each.fKey == key; });
    return bound == fLowerBounds.end() ? 0 : bound->fValue;
}

} // namespace assay_host
