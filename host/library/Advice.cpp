#include "library/Advice.h"

#include <algorithm>
#include <utility>

#include "memory/AdviceForms.h"
#include "report/Bytes.h"

using namespace assay_host;

namespace {

std::optional<std::int64_t> GetNext(const Advice& advice, const InterfaceAdvice& part)
{
    if (!part.fOutlook.fNextTime)
        return std::nullopt;
    return std::max<std::int64_t>(*part.fOutlook.fNextTime - advice.fTime, 0);
}

} // namespace

AdvicePart::AdvicePart(const Advice& advice, DeviceKind kind)
    : fAdvice(advice.Get(kind)),
      fReason(GetAdviceReason(fAdvice)),
      fText(GetAdviceText(fAdvice, kind)),
      fSource(GetSourceName(advice, kind)),
      fEnd(fAdvice.fEnd == AttemptEnd::kOpen ? "" : GetAttemptEndName(fAdvice.fEnd)),
      fEndText(ShowBytes(fAdvice.fEndReason)),
      fWarning(ShowBytes(fAdvice.fOutlook.fWarning)),
      fChange(GetChangeText(advice, kind)),
      fAge(GetAdviceAge(advice, fAdvice)),
      fNext(GetNext(advice, fAdvice))
{}

assay_host_advice::assay_host_advice(Advice advice, int status)
    : fAdvice(std::move(advice)),
      fParts{{fAdvice, DeviceKind::kOpenGL}, {fAdvice, DeviceKind::kOpenCL}},
      fDocument(MakeAdviceDocument(fAdvice, assay_host_version(), status))
{}
