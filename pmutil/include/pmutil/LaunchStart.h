// The start of one launch: from the call until the child runs and its output tasks were seen
// running, or until it fails. Any thread may use it.
#pragma once

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

namespace pmutil::consoleapp {

class LaunchStart {
public:
    enum class Result {
        kPending, // not over yet
        kRunning, // the child runs, or has run
        kFailed   // the launch failed or was given up before
    };

    // Waits up to `maxWaitSeconds` for the end of the start; infinity: without limit.
    Result Await(double maxWaitSeconds) const;

    // Ends the start, and all waits for it. A start ends once: later calls change nothing.
    void End(Result result);

private:
    mutable boost::mutex fMutex;
    mutable boost::condition_variable fCond;
    Result fResult = Result::kPending;
};

} // namespace pmutil::consoleapp
