#include "supervise/StopRequest.h"

#include <utility>

namespace assay_host {

void StopRequest::Raise()
{
    const std::lock_guard<std::mutex> lock(fMutex);
    fRaised = true;
    if (fHeard)
        fHeard();
}

bool StopRequest::IsRaised() const
{
    const std::lock_guard<std::mutex> lock(fMutex);
    return fRaised;
}

void StopRequest::SetListener(std::function<void()> heard)
{
    const std::lock_guard<std::mutex> lock(fMutex);
    fHeard = std::move(heard);
}

} // namespace assay_host
