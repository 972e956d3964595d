#include "supervise/SupervisedApp.h"

#include <boost/thread/lock_guard.hpp>

namespace assay_host {

namespace {

constexpr double kPartOfShortWait = 0.8;

} // namespace

SupervisedApp::SupervisedApp(const boost::shared_ptr<pmutil::Launcher>& launcher)
    : ConsoleApp(launcher)
{}

void SupervisedApp::AwaitRunning()
{
    const auto limit = boost::posix_time::milliseconds(
        static_cast<long>(GetShortWaitSeconds() * kPartOfShortWait * 1000));
    boost::unique_lock<boost::mutex> lock(fRunningMutex);
    fRunningCond.timed_wait(lock, limit, [this] { return fRunning; });
}

void SupervisedApp::OnRunning()
{
    const boost::lock_guard<boost::mutex> lock(fRunningMutex);
    fRunning = true;
    fRunningCond.notify_all();
}

} // namespace assay_host
