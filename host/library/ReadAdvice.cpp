// The functions that read an advice.
#include "library/Advice.h"
#include "library/ReturnText.h"
#include "memory/AdviceForms.h"

using namespace assay_host;

namespace {

const AdvicePart* GetPart(const assay_host_advice* advice, assay_host_interface which)
{
    if (advice == nullptr || (which != ASSAY_HOST_OPENGL && which != ASSAY_HOST_OPENCL))
        return nullptr;
    return &advice->fParts[which];
}

const Finding* GetFinding(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? nullptr : &part->fAdvice.fOutlook.fFinding;
}

int ReturnSeconds(const std::optional<std::int64_t>& value, double* seconds)
{
    if (!value)
        return 0;
    if (seconds != nullptr)
        *seconds = static_cast<double>(*value);
    return 1;
}

} // namespace

assay_host_usability assay_host_advice_usable(const assay_host_advice* advice,
                                              assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? ASSAY_HOST_UNKNOWN
                           : static_cast<assay_host_usability>(part->fAdvice.GetUsability());
}

const char* assay_host_advice_reason(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fReason.c_str();
}

const char* assay_host_advice_text(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fText.c_str();
}

const char* assay_host_advice_source(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fSource;
}

assay_host_usability assay_host_advice_learnt(const assay_host_advice* advice,
                                              assay_host_interface which)
{
    const Finding* const finding = GetFinding(advice, which);
    return finding == nullptr ? ASSAY_HOST_UNKNOWN
                              : static_cast<assay_host_usability>(finding->fUsability);
}

const char* assay_host_advice_device(const assay_host_advice* advice, assay_host_interface which)
{
    const Finding* const finding = GetFinding(advice, which);
    return finding == nullptr ? "" : finding->fTag.c_str();
}

const char* assay_host_advice_device_name(const assay_host_advice* advice,
                                          assay_host_interface which, size_t* size)
{
    const Finding* const finding = GetFinding(advice, which);
    return finding == nullptr ? ReturnNothing(size) : ReturnText(finding->fDevice, size);
}

const char* assay_host_advice_device_driver(const assay_host_advice* advice,
                                            assay_host_interface which, size_t* size)
{
    const Finding* const finding = GetFinding(advice, which);
    return finding == nullptr ? ReturnNothing(size) : ReturnText(finding->fDriver, size);
}

const char* assay_host_advice_end(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fEnd;
}

const char* assay_host_advice_end_text(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fEndText.c_str();
}

const char* assay_host_advice_last_line(const assay_host_advice* advice, assay_host_interface which,
                                        size_t* size)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? ReturnNothing(size) : ReturnText(part->fAdvice.fLastLine, size);
}

int assay_host_advice_age(const assay_host_advice* advice, assay_host_interface which,
                          double* seconds)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? 0 : ReturnSeconds(part->fAge, seconds);
}

uint64_t assay_host_advice_failures(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? 0 : part->fAdvice.fOutlook.fFailures;
}

int assay_host_advice_next_attempt(const assay_host_advice* advice, assay_host_interface which,
                                   double* seconds)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? 0 : ReturnSeconds(part->fNext, seconds);
}

const char* assay_host_advice_change(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fChange.c_str();
}

const char* assay_host_advice_warning(const assay_host_advice* advice, assay_host_interface which)
{
    const AdvicePart* const part = GetPart(advice, which);
    return part == nullptr ? "" : part->fWarning.c_str();
}

assay_host_plan assay_host_advice_plan(const assay_host_advice* advice)
{
    return advice == nullptr ? ASSAY_HOST_ANSWER
                             : static_cast<assay_host_plan>(advice->fAdvice.fPlan);
}

const char* assay_host_advice_due(const assay_host_advice* advice)
{
    return advice == nullptr ? "" : GetDueName(advice->fAdvice.fDue);
}

int assay_host_advice_tried(const assay_host_advice* advice)
{
    return advice != nullptr && advice->fAdvice.fTried ? 1 : 0;
}

int assay_host_advice_stopped(const assay_host_advice* advice)
{
    return advice != nullptr && advice->fAdvice.fStopped ? 1 : 0;
}

const char* assay_host_advice_identity(const assay_host_advice* advice)
{
    return advice == nullptr ? "" : advice->fAdvice.fName.c_str();
}

uint64_t assay_host_advice_attempts(const assay_host_advice* advice)
{
    return advice == nullptr ? 0 : advice->fAdvice.fCount;
}

size_t assay_host_advice_message_count(const assay_host_advice* advice)
{
    return advice == nullptr ? 0 : advice->fAdvice.fMessages.size();
}

const char* assay_host_advice_message(const assay_host_advice* advice, size_t index)
{
    return index < assay_host_advice_message_count(advice)
               ? advice->fAdvice.fMessages[index].c_str()
               : "";
}

const char* assay_host_advice_document(const assay_host_advice* advice, size_t* size)
{
    return advice == nullptr ? ReturnNothing(size) : ReturnText(advice->fDocument, size);
}
