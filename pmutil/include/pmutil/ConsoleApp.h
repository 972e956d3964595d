// Supervises one console child program: launches it on a thread of its own, has its output pumped,
// lets a caller wait with a timeout, kills it, and keeps how it ended. One launch at a time, any
// number in turn.
//
// Failures on the threads of a launch are stored, oldest first, and each wait of the client throws
// one of them (consoleapp::Exception).
//
// Clients derive from it if they want the notifications, and drive it through ConsoleAppLauncher.
// Hold it by boost::shared_ptr.
#pragma once

#include <atomic>
#include <cstddef>
#include <deque>
#include <exception>
#include <string>

#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/ConsoleAppTypes.h"
#include "pmutil/Launcher.h"
#include "pmutil/ManagedThread.h"

namespace pmutil {

class ConsoleApp {
public:
    using Lock = boost::unique_lock<boost::mutex>;

    ConsoleApp();

    // Resets. A child that still runs goes on unless it was killed.
    virtual ~ConsoleApp();
    ConsoleApp(const ConsoleApp&) = delete;
    ConsoleApp& operator=(const ConsoleApp&) = delete;

    // For the client.

    // Starts the child and returns when it runs or has ended, or after the short wait, whatever
    // comes first. Throws std::runtime_error "ConsoleApp: must be idle" and leaves a running launch
    // alone; after any other failure, which it throws, the object is Idle.
    void Launch(const boost::shared_ptr<consoleapp::ExecutionData>& data,
                const LaunchParams& params);

    // Waits for the end of the child. Finished, Crashed or Killed: it has ended, and the object is
    // Idle again; `*exitCode`, unless null, gets the code, 0 after a crash or a kill. Timeout: it
    // goes on, and so may the caller, with another Wait or a Kill; unless the launcher's thread was
    // given up, which leaves the object Idle. Idle: there was nothing to wait for. Throws the
    // oldest stored failure and leaves the object Idle.
    State Wait(int* exitCode, double maxWaitSeconds);

    // Asks for the child's end if it is Running or the last wait ran out; doesn't wait for it.
    // Waits up to the short wait for a stable state before. Throws the oldest stored failure.
    void Kill();

    // Waits up to `maxWaitSeconds` for a stable state; Timeout if none came. Throws the oldest
    // stored failure.
    State GetState(double maxWaitSeconds);

    // Back to Idle whatever it was doing; gives the launcher's thread the short wait to end.
    void Reset();

    // A bit for each thread of the launch that runs, at the place of its TaskID. Needs a launch,
    // and both output tasks alive.
    unsigned GetTasksRunning();

    // The child's standard input; only with LaunchParams::fKeepStdin, from Running on. A write
    // blocks while the pipe is full. Throw std::runtime_error "pmutil::Channel not open" and what
    // the channel throws; a null text throws std::invalid_argument
    // "ConsoleApp::WritelnAppStdin str=nullptr".
    void CloseAppStdin();
    void WriteAppStdin(const unsigned char* data, std::size_t nbytes);
    void WritelnAppStdin(const char* str);
    void WritelnAppStdin(const std::string& str);

    // 10 s, 1 s and 0.1 s, unless debug values say otherwise.
    static double GetDefaultWaitSeconds();
    static double GetShortWaitSeconds();
    static double GetDefaultStateWaitSeconds();

    // For the threads of a launch, through ConsoleAppAccessor.

    void NotifyLaunching(TaskID who);
    void NotifyLaunched(TaskID who);
    void NotifyRunning(TaskID who, const LaunchResult& result);
    void NotifyFinished(TaskID who, int exitCode, State state);
    void NotifyOutputTaskBegin(OutputChannel channel);
    void NotifyOutputTaskEnd(OutputChannel channel);
    void NotifyFailure(const consoleapp::Exception& exc);
    void ThrowIfFailurePending();
    void ThrowIfInjected(TaskID who, Fault fault, const char* caller);

    // Arms a fault, which fires once; call it before Launch.
    void SetInjectedFault(Fault fault) { fInjectedFault = fault; }

protected:
    explicit ConsoleApp(const boost::shared_ptr<Launcher>& launcher);

    // Called on the threads of a launch, without a lock, so that they may call back in. An
    // exception is a failure of the launch.
    virtual void OnLaunching();
    virtual void OnRunning();
    virtual void OnOutputTaskBegin(OutputChannel channel);
    virtual void OnOutputTaskEnd(OutputChannel channel);
    virtual void OnFinished(int exitCode);
    virtual void OnReserved();

    State GetStateLocked(Lock& lock, double maxWaitSeconds);
    void SetState(State state);
    void SetStateLocked(const Lock& lock, State state);

private:
    bool HasEventLocked() const;
    State WaitForEnd(double deadline);
    bool JoinAfterEnd(int* exitCode, double deadline);
    bool JoinAfterFailure(double seconds);
    void NotifyFailureLocked(const Lock& lock, const consoleapp::Exception& exc);
    void ThrowIfFailurePendingLocked(const Lock& lock);
    void ThrowIfInjectedLocked(const Lock& lock, TaskID who, Fault fault, const char* caller);
    void LaunchHandleException(Lock& lock, const std::exception* exc, double joinWaitSeconds);
    void HandleWaitException(Lock& lock, const std::exception* exc, double deadline);

    boost::mutex fMutex;
    boost::condition_variable fCond;
    State fState = State::kIdle;
    int fExitCode = 0;
    std::atomic<Fault> fInjectedFault{Fault::kNoFault};
    boost::shared_ptr<Launcher> fLauncher;
    ManagedThread fLauncherThread{"Launcher"};
    boost::shared_ptr<Writer> fAppStdin;
    LaunchParams fLaunchParams;
    boost::shared_ptr<consoleapp::ExecutionData> fExecutionData;
    std::deque<consoleapp::Exception> fFailures;

    // Held to join fLauncherThread or let go of it, by one client thread at a time; taken before
    // fMutex. Only Launch, with fMutex and while Idle, when nobody joins, sets it without.
    boost::mutex fJoinMutex;
};

} // namespace pmutil
