#include "pmutil/TrackingLauncher.h"

#include <utility>

#include <boost/thread/lock_guard.hpp>

#include "all/WaitTime.h"

namespace pmutil {

TrackingLauncher::TrackingLauncher(boost::shared_ptr<Launcher> launcher,
                                   std::function<void()> onEnd)
    : fLauncher(std::move(launcher)), fOnEnd(std::move(onEnd))
{}

LaunchResult TrackingLauncher::Launch(const std::wstring& program,
                                      const std::deque<std::string>& args)
{
    LaunchResult result = fLauncher->Launch(program, args);
    bool mustKill = false;
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fLaunched = true;
        mustKill = fIsKilled;
    }
    if (mustKill) {
        try {
            fLauncher->Kill();
        } catch (const std::exception&) {
            // The launch continues. The caller of Kill finds that the child doesn't end.
        }
    }
    return result;
}

WaitResult TrackingLauncher::Wait(int* exitCode)
{
    ChildEnd end;
    try {
        end.fResult = fLauncher->Wait(&end.fExitCode);
        end.fTerminationText = GetTerminationText(*fLauncher);
    } catch (...) {
        SetOver({});
        throw;
    }
    if (end.fResult == kEndedNormally)
        *exitCode = end.fExitCode;
    SetOver(end);
    if (fOnEnd)
        fOnEnd();
    return end.fResult;
}

void TrackingLauncher::Kill()
{
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fIsKilled = true;
        fCond.notify_all();
        if (!fLaunched)
            return;
    }
    fLauncher->Kill();
}

bool TrackingLauncher::HasLaunched() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fLaunched;
}

std::optional<ChildEnd> TrackingLauncher::GetEnd() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fEnd;
}

bool TrackingLauncher::IsKilled() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fIsKilled;
}

bool TrackingLauncher::AwaitEnd(double maxWaitSeconds) const
{
    return Await(maxWaitSeconds, false);
}

bool TrackingLauncher::AwaitEndOrKill(double maxWaitSeconds) const
{
    return Await(maxWaitSeconds, true);
}

bool TrackingLauncher::Await(double maxWaitSeconds, bool orKill) const
{
    const double deadline = GetWaitClock() + maxWaitSeconds;
    boost::unique_lock<boost::mutex> lock(fMutex);
    while (!fOver && !(orKill && fIsKilled)) {
        const double left = GetTimeLeft(deadline);
        if (left <= 0.0)
            break;
        fCond.timed_wait(lock, ToWaitDuration(left));
    }
    return fOver;
}

void TrackingLauncher::SetOver(const std::optional<ChildEnd>& end)
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fEnd = end;
    fOver = true;
    fCond.notify_all();
}

} // namespace pmutil
