#include "supervise/WatchedLauncher.h"

#include <utility>

#include <boost/thread/lock_guard.hpp>

namespace assay_host {

WatchedLauncher::WatchedLauncher(boost::shared_ptr<pmutil::Launcher> launcher,
                                 boost::shared_ptr<EventQueue> queue)
    : fLauncher(std::move(launcher)), fQueue(std::move(queue))
{}

pmutil::LaunchResult WatchedLauncher::Launch(const std::wstring& program,
                                             const std::deque<std::string>& args)
{
    pmutil::LaunchResult result = fLauncher->Launch(program, args);
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fLaunched = true;
    return result;
}

pmutil::WaitResult WatchedLauncher::Wait(int* exitCode)
{
    ChildEnd end;
    end.fResult = fLauncher->Wait(&end.fExitCode);
    if (end.fResult == pmutil::kEndedNormally)
        *exitCode = end.fExitCode;
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fEnd = end;
    }
    fQueue->Push({Event::Kind::kChildEnd, {}, {}});
    return end.fResult;
}

void WatchedLauncher::Kill()
{
    fLauncher->Kill();
}

bool WatchedLauncher::HasLaunched() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fLaunched;
}

std::optional<ChildEnd> WatchedLauncher::GetEnd() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fEnd;
}

} // namespace assay_host
