// The functions that name the values of enumerations.
#include <cstddef>
#include <iterator>

#include "assay_host.h"
#include "memory/Adviser.h"
#include "report/RunOutcome.h"
#include "report/Usable.h"

const char* assay_host_version()
{
    return ASSAY_VERSION;
}

const char* assay_host_error_text(assay_host_error error)
{
    constexpr const char* kTexts[] = {
        "no error",
        "out of memory",
        "a pointer is null",
        "a value is out of its range",
        "a text is empty",
        "the system refused a thread or another resource",
        "the state can't be changed",
        "another process or thread makes an attempt",
    };
    const auto index = static_cast<std::size_t>(error);
    return index < std::size(kTexts) ? kTexts[index] : "unknown error";
}

const char* assay_host_verdict_name(assay_host_verdict verdict)
{
    if (verdict < ASSAY_HOST_COMPLETE || verdict > ASSAY_HOST_INTERRUPTED)
        return "unknown";
    return assay_host::GetVerdictName(static_cast<assay_host::Verdict>(verdict));
}

const char* assay_host_usability_name(assay_host_usability usability)
{
    return assay_host::GetUsabilityName(static_cast<assay_host::Usability>(usability));
}

const char* assay_host_plan_name(assay_host_plan plan)
{
    if (plan < ASSAY_HOST_ANSWER || plan > ASSAY_HOST_WAIT)
        return "unknown";
    return assay_host::GetPlanName(static_cast<assay_host::Plan>(plan));
}
