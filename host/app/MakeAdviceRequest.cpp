#include "app/MakeAdviceRequest.h"

#include "app/PolicyTime.h"

namespace assay_host {

AdviceRequest MakeAdviceRequest(const AdviseChoice& choice)
{
    AdviceRequest request;
    request.fNeedsOpenGL = choice.fNeed != Need::kOpenCL;
    request.fNeedsOpenCL = choice.fNeed != Need::kOpenGL;
    request.fFresh = choice.fFresh;
    request.fWaitSeconds = choice.fWaitSeconds;
    request.fPolicy.fMaxAge = ToSeconds(choice.fMaxAgeDays, Policy::kDay);
    request.fPolicy.fFirstPause = ToSeconds(choice.fPauseSeconds, 1);
    request.fPolicy.fRetries = choice.fRetries;
    request.fPolicy.fForgiven = ToSeconds(choice.fForgiveDays, Policy::kDay);
    request.fPolicy.fAbsentKept = ToSeconds(choice.fKeepAbsentSeconds, 1);
    request.fPolicy.fUnknownKept = ToSeconds(choice.fKeepUnknownSeconds, 1);
    request.fPolicy.fPauseGrowth = choice.fPauseGrowth;
    request.fPolicy.fFreezeForgiven = ToSeconds(choice.fForgiveFreezeDays, Policy::kDay);
    request.fPolicy.fMaxUnclear = choice.fUnclear;
    request.fPolicy.fUnclearPause = ToSeconds(choice.fUnclearPauseSeconds, 1);
    return request;
}

} // namespace assay_host
