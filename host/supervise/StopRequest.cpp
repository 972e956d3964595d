#include "supervise/StopRequest.h"

#include <utility>

namespace assay_host {

void StopRequest::Raise()
{
    const std::lock_guard<std::mutex> lock(fMutex);
    fRaised = true;
    if (fListener)
        fListener();
}

bool StopRequest::IsRaised() const
{
    const std::lock_guard<std::mutex> lock(fMutex);
    return fRaised;
}

void StopRequest::SetListener(std::function<void()> listener)
{
    const std::lock_guard<std::mutex> lock(fMutex);
    fListener = std::move(listener);
}

} // namespace assay_host
