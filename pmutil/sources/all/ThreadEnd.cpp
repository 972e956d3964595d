#include "all/ThreadEnd.h"

#include <boost/thread/lock_guard.hpp>

#include "all/WaitTime.h"

namespace pmutil {

void ThreadEnd::Begin()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fThread = boost::this_thread::get_id();
}

void ThreadEnd::End()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fEnded = true;
    fCond.notify_all();
}

bool ThreadEnd::HasEnded() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fEnded;
}

bool ThreadEnd::Await(double seconds) const
{
    const double deadline = GetWaitClock() + seconds;
    boost::unique_lock<boost::mutex> lock(fMutex);
    while (!fEnded && !fGivenUp && fThread != boost::this_thread::get_id()) {
        const double left = GetTimeLeft(deadline);
        if (left <= 0.0)
            break;
        fCond.timed_wait(lock, ToWaitDuration(left));
    }
    return fEnded;
}

void ThreadEnd::GiveUp()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fGivenUp = true;
    fCond.notify_all();
}

} // namespace pmutil
