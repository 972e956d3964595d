#include "pmutil/StopRequest.h"

#include <utility>

#include <boost/thread/lock_guard.hpp>

namespace pmutil {

void StopRequest::Raise()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fRaised = true;
    for (const std::function<void()>& listener : fListeners)
        listener();
}

bool StopRequest::IsRaised() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fRaised;
}

StopListener::StopListener(StopRequest& stop, std::function<void()> listener) : fStop(stop)
{
    const boost::lock_guard<boost::mutex> lock(fStop.fMutex);
    fPlace = fStop.fListeners.insert(fStop.fListeners.end(), std::move(listener));
    if (fStop.fRaised)
        (*fPlace)();
}

StopListener::~StopListener()
{
    const boost::lock_guard<boost::mutex> lock(fStop.fMutex);
    fStop.fListeners.erase(fPlace);
}

} // namespace pmutil
