// The consumer of one output channel of a child. Clients override DoRun, which reads from
// GetReader() until the end of the data.
//
// The launch looks for the task to be running before it goes on, and fails with "never started" if
// DoRun has come and gone by then, which a child that ends at once may bring about. So a DoRun
// calls AwaitStart once it has read everything. OutputPump does all this for a function that takes
// the bytes.
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

    // Throw std::runtime_error "OutputTask::AssignLocked: task is running" if `other` is.
    OutputTask(const OutputTask& other);
    OutputTask& operator=(const OutputTask& other);
    ~OutputTask() override;

    // Readies the task for a launch. Throws std::runtime_error "OutputTask::Prepare: task is
    // running", and changes nothing, until Run has returned: a task whose DoRun was given up serves
    // no other launch before.
    void Prepare(OutputChannel channel, boost::shared_ptr<consoleapp::ExecutionData> data,
                 boost::shared_ptr<Reader> reader);

    // DoBegin, DoRun and DoEnd in turn; closes the reader in any case. With a launch, throws
    // consoleapp::Exception "no output task" if the task was readied for another, or discarded.
    void Run(const consoleapp::ExecutionData* launch = nullptr);

    // Closes the reader if the task was readied for this launch and Run wasn't called since; a Run
    // for this launch that comes later is refused.
    void Discard(const consoleapp::ExecutionData* launch) noexcept;

    // Whether the task runs. Waits up to `maxWaitSeconds` for one that doesn't.
    bool IsRunning(double maxWaitSeconds);
    void SetIsRunning(bool value);

protected:
    virtual void DoBegin(Lock& lock);
    virtual void DoRun();
    virtual void DoEnd(Lock& lock);
    virtual void CloseReader(Lock& lock);

    // The parent's end of the pipe; empty before a launch and after it.
    boost::shared_ptr<Reader> GetReader();

    // Returns when the start of the launch that the task serves is over: the child runs, or the
    // launch has failed or was given up. At once without a launch.
    void AwaitStart();

    bool IsRunningLocked(Lock& lock, double maxWaitSeconds);

private:
    void AssignLocked(const OutputTask& other);

    boost::shared_ptr<Reader> fReader;
    bool fIsRunning = false;
    bool fIsReadied = false; // from Prepare until Run
    bool fIsInRun = false;   // from the begin of Run until it returns
};

} // namespace pmutil
