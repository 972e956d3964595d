// The guarded way to a ConsoleApp for everything that may outlive it: each use looks first whether
// it is still there. One object serves one thread; a thread gets a copy of its own.
#pragma once

#include <cstddef>
#include <string>

#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/ConsoleApp.h"

namespace pmutil {

class ConsoleAppAccessor {
public:
    // Throws std::runtime_error "ConsoleAppAccessor::CopyIfValid invalid TaskID".
    ConsoleAppAccessor(TaskID id, boost::shared_ptr<consoleapp::ExecutionData> data);
    ConsoleAppAccessor(const ConsoleAppAccessor& other);
    ConsoleAppAccessor& operator=(const ConsoleAppAccessor& other);
    virtual ~ConsoleAppAccessor();

    // Each operation that needs the application throws consoleapp::Exception "no ExecutionData"
    // before a launch and "no console app" when the application is gone or was reset.

    boost::shared_ptr<ConsoleApp> GetConsoleApp() const;
    boost::shared_ptr<consoleapp::ExecutionData> GetExecutionData() const;

    // Throws consoleapp::Exception "no output task" if the task is gone.
    boost::shared_ptr<OutputTask> GetOutputTask(OutputChannel channel) const;

    // The thread's id and this party, such as "1f2e(app.stdout)".
    std::string GetThreadLabel() const;

    // The application's state, Idle if there is none. Waits for the default state wait, whatever
    // the argument.
    State GetState(double maxWaitSeconds);

    void Reset();
    void Launch(const boost::shared_ptr<consoleapp::ExecutionData>& data,
                const LaunchParams& params);
    State Wait(int* exitCode, double maxWaitSeconds);
    void Kill();
    void CloseAppStdin();
    void WriteAppStdin(const unsigned char* data, std::size_t nbytes);
    void WritelnAppStdin(const char* str);
    void WritelnAppStdin(const std::string& str);
    void ThrowIfFailurePending();
    void ThrowIfInjected(Fault fault, const char* caller);
    void SetInjectedFault(Fault fault);

    // Stores a failure for the client; if the application is gone, the log is all that tells of it.
    void NotifyFailure(const consoleapp::Exception& exc) noexcept;

    // For the launcher; another party gets std::runtime_error
    // "ConsoleAppAccessor::GetConsoleAppFor wrong TaskID".
    void NotifyLaunching();
    void NotifyLaunched();
    void NotifyRunning(const LaunchResult& result);
    void NotifyFinished(int exitCode, State state);

    // For the output channels; another party gets std::runtime_error
    // "ConsoleAppAccessor::GetConsoleAppIf condition not ok".
    void NotifyOutputTaskBegin();
    void NotifyOutputTaskEnd();

    TaskID GetTaskID() const { return fTaskID; }

protected:
    boost::shared_ptr<ConsoleApp> GetConsoleAppFor(TaskID id) const;
    boost::shared_ptr<ConsoleApp> GetConsoleAppIf(bool condition) const;

    mutable boost::mutex fMutex;
    boost::condition_variable fCond;
    TaskID fTaskID;
    boost::shared_ptr<consoleapp::ExecutionData> fExecutionData;

private:
    struct Fields {
        TaskID id;
        boost::shared_ptr<consoleapp::ExecutionData> data;
    };
    explicit ConsoleAppAccessor(Fields fields);
    Fields CopyFields() const;
    bool IsOutputChannel() const;
};

} // namespace pmutil
