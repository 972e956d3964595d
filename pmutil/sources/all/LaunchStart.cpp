#include "pmutil/LaunchStart.h"

#include <boost/thread/lock_guard.hpp>

#include "all/WaitTime.h"

namespace pmutil::consoleapp {

LaunchStart::Result LaunchStart::Await(double maxWaitSeconds) const
{
    const double deadline = GetWaitClock() + maxWaitSeconds;
    boost::unique_lock<boost::mutex> lock(fMutex);
    while (fResult == Result::kPending) {
        const double left = GetTimeLeft(deadline);
        if (left <= 0.0)
            break;
        fCond.timed_wait(lock, ToWaitDuration(left));
    }
    return fResult;
}

void LaunchStart::End(Result result)
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    if (fResult != Result::kPending)
        return;
    fResult = result;
    fCond.notify_all();
}

} // namespace pmutil::consoleapp
