// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// The start of one launch: lasts until the child and its output tasks run, or until the launch
// fails. Any thread may use it.
#pragma once

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

namespace pmutil::consoleapp {

class LaunchStart {
public:
    enum class Result {
        kPending, // not over yet
        kRunning, // the child runs, or has run
        kFailed   // the launch failed or was given up before the child ran
    };

    // Waits up to `maxWaitSeconds` for the end of the start, without a limit for infinity. Returns
    // kPending on timeout.
    Result Await(double maxWaitSeconds) const;

    // Ends the start and all waits for it. Later calls have no effect.
    void End(Result result);

private:
    mutable boost::mutex fMutex;
    mutable boost::condition_variable fCond;
    Result fResult = Result::kPending;
};

} // namespace pmutil::consoleapp
