// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Reads one output channel of a child. Clients override DoRun, which reads from GetReader() until
// the end of the data.
//
// The launch waits until the task runs, and fails with "never started" if DoRun has returned
// before, which may happen if the child ends at once. Therefore DoRun must call AwaitStart after
// reading. OutputPump does this and passes the bytes to a function.
#pragma once

#include <boost/shared_ptr.hpp>

#include "pmutil/ConsoleAppAccessor.h"
#include "pmutil/Reader.h"

namespace pmutil {

class OutputTask : public ConsoleAppAccessor {
public:
    using Lock = boost::unique_lock<boost::mutex>;

    OutputTask();
    OutputTask(TaskID channel, boost::shared_ptr<consoleapp::ExecutionData> data,
               boost::shared_ptr<Reader> reader);

    // Throw std::runtime_error "OutputTask::AssignLocked: task is running" if `other` is running.
    OutputTask(const OutputTask& other);
    OutputTask& operator=(const OutputTask& other);
    ~OutputTask() override;

    // Prepares the task for a launch. Throws std::runtime_error "OutputTask::Prepare: task is
    // running" without effect until Run has returned, also in a launch that was given up.
    void Prepare(OutputChannel channel, boost::shared_ptr<consoleapp::ExecutionData> data,
                 boost::shared_ptr<Reader> reader);

    // Calls DoBegin, DoRun and DoEnd; closes the reader also after an exception. With a launch,
    // throws consoleapp::Exception "no output task" if the task was prepared for another one, or
    // discarded.
    void Run(const consoleapp::ExecutionData* launch = nullptr);

    // Closes the reader if the task was prepared for this launch and Run wasn't called since. A
    // later Run for this launch throws.
    void Discard(const consoleapp::ExecutionData* launch) noexcept;

    // Waits up to `maxWaitSeconds` until the task runs. Returns whether it does.
    bool IsRunning(double maxWaitSeconds);
    void SetIsRunning(bool value);

protected:
    virtual void DoBegin(Lock& lock);
    virtual void DoRun();
    virtual void DoEnd(Lock& lock);
    virtual void CloseReader(Lock& lock);

    // Returns the parent's end of the pipe; null before and after a launch.
    boost::shared_ptr<Reader> GetReader();

    // Waits until the start of the task's launch is over: until the child runs, or until the launch
    // fails or is given up. Returns at once without a launch.
    void AwaitStart();

    bool IsRunningLocked(Lock& lock, double maxWaitSeconds);

private:
    void AssignLocked(const OutputTask& other);

    boost::shared_ptr<Reader> fReader;
    bool fIsRunning = false;
    bool fIsPrepared = false; // from Prepare until Run
    bool fIsInRun = false;    // from the begin of Run until it returns
};

} // namespace pmutil
