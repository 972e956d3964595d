#include "report/RunOutcome.h"

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

} // namespace assay_host
