// The application of one supervised launch. Its output tasks must outlast the launch's start, and
// learn here when that is.
#pragma once

#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/ConsoleApp.h"

namespace assay_host {

class SupervisedApp : public pmutil::ConsoleApp {
public:
    explicit SupervisedApp(const boost::shared_ptr<pmutil::Launcher>& launcher);

    // Waits until the launch is through its start; for less than the time after which the launch
    // would give up an output task, since in a launch that fails this never comes.
    void AwaitRunning();

protected:
    void OnRunning() override;

private:
    boost::mutex fRunningMutex;
    boost::condition_variable fRunningCond;
    bool fRunning = false;
};

} // namespace assay_host
