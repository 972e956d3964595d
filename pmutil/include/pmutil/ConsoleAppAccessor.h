// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Access to a ConsoleApp for objects that may outlive it: each function checks first whether the
// application still exists. Use an object on one thread only; copy it for another.
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

    // Every function that requires the application throws consoleapp::Exception "no ExecutionData"
    // before a launch, and "no console app" if the application was destroyed or reset.

    boost::shared_ptr<ConsoleApp> GetConsoleApp() const;
    boost::shared_ptr<consoleapp::ExecutionData> GetExecutionData() const;

    // Throws consoleapp::Exception "no output task" if the task was destroyed.
    boost::shared_ptr<OutputTask> GetOutputTask(OutputChannel channel) const;

    // Returns the current thread's id and this party, such as "1f2e(app.stdout)".
    std::string GetThreadLabel() const;

    // Returns the application's state, Idle if there is none. Waits up to the default state wait
    // and ignores the argument.
    State GetState(double maxWaitSeconds);

    // As those of ConsoleApp.
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

    // Stores a failure for the client. If the application doesn't exist, only logs it.
    void NotifyFailure(const consoleapp::Exception& exc) noexcept;

    // For the launcher. For another party they throw std::runtime_error
    // "ConsoleAppAccessor::GetConsoleAppFor wrong TaskID".
    void NotifyLaunching();
    void NotifyLaunched();
    void NotifyRunning(const LaunchResult& result);
    void NotifyFinished(int exitCode, State state);

    // For the output channels. For another party they throw std::runtime_error
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
