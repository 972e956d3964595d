// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Supervises one console child program: launches it on a separate thread, has its output read,
// waits for it with a timeout, kills it, and stores how it ended. One launch at a time; any number
// of launches in sequence.
//
// Failures on the threads of a launch are stored in order. Each wait of the client throws the
// oldest one (consoleapp::Exception).
//
// Clients use it through ConsoleAppLauncher, and derive from it to get notifications. Hold it by
// boost::shared_ptr.
//
// All launches use one Launcher as long as the thread of each ends. If the thread of a launch that
// was given up still runs at the next launch, that thread keeps its launcher, so that it can reach
// only its own child, and the next launch gets a new one.
//
// A boost::thread interruption ends Launch, Wait, Kill and GetState like a failure. Reset can't be
// interrupted: the request stays pending.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <exception>
#include <functional>
#include <string>

#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/ConsoleAppTypes.h"
#include "pmutil/Launcher.h"
#include "pmutil/ManagedThread.h"

namespace pmutil {

class ThreadEnd;

// Returns a new launcher for an application; never null. Called by ConsoleApp::Launch with the
// application's lock held.
using LauncherFactory = std::function<boost::shared_ptr<Launcher>()>;

class ConsoleApp {
public:
    using Lock = boost::unique_lock<boost::mutex>;

    ConsoleApp();

    // Resets. Doesn't kill a child that still runs.
    virtual ~ConsoleApp();
    ConsoleApp(const ConsoleApp&) = delete;
    ConsoleApp& operator=(const ConsoleApp&) = delete;

    // For the client.

    // Starts the child. Returns when the child runs or has ended, or after the short wait,
    // whichever comes first. Throws std::runtime_error "ConsoleApp: must be idle" without effect on
    // a running launch. Throws any other failure and leaves the object Idle, among them
    // "ConsoleApp: the launcher still serves a launch that was given up" for an application without
    // a LauncherFactory.
    void Launch(const boost::shared_ptr<consoleapp::ExecutionData>& data,
                const LaunchParams& params);

    // Waits for the end of the child. Returns
    // - Finished, Crashed or Killed if the child has ended. The object is Idle again. `*exitCode`,
    //   unless null, is set to the exit code, or to 0 after a crash or a kill.
    // - Timeout if the child still runs. The caller may call Wait again, or Kill. If the launcher's
    //   thread was given up, the object is Idle.
    // - Idle if there is no launch, or if another thread has ended the launch meanwhile. Doesn't
    //   wait for a newer launch.
    // Throws the oldest stored failure and leaves the object Idle.
    //
    // The timeout includes the join of the launcher's thread. With a timeout of 0 seconds, the
    // child may have ended while that thread is still busy: the result is Timeout, the object is
    // Idle and the exit code is lost.
    //
    // A failure of an output task, or an interruption, doesn't end the child: Wait waits for its
    // end, up to the timeout, and then throws. The launch is given up.
    State Wait(int* exitCode, double maxWaitSeconds);

    // Waits up to the short wait for a stable state. Then kills the child if it is Running or if
    // the last wait timed out; doesn't wait for its end. Throws the oldest stored failure.
    //
    // If the start takes longer than the short wait, there may be no child yet. Then the call has
    // no effect, the launch continues, and the client must call again.
    void Kill();

    // Waits up to `maxWaitSeconds` for a stable state. Returns Timeout if there was none. Throws
    // the oldest stored failure.
    State GetState(double maxWaitSeconds);

    // Sets the object to Idle. Waits up to the short wait for the end of the launcher's thread,
    // unless called on that thread. Doesn't kill the child.
    void Reset();

    // Returns a mask of the running threads of the launch; the bit number is the TaskID. Requires a
    // launch whose output tasks both exist.
    unsigned GetTasksRunning();

    // Write to and close the child's standard input. Require LaunchParams::fKeepStdin, and a child
    // that is Running. A write blocks while the pipe is full, and with it all other functions of
    // the object, also Wait, Kill and Reset, without a timeout. Throw std::runtime_error
    // "pmutil::Channel not open" and the failures of the channel. A null text throws
    // std::invalid_argument "ConsoleApp::WritelnAppStdin str=nullptr".
    void CloseAppStdin();
    void WriteAppStdin(const unsigned char* data, std::size_t nbytes);
    void WritelnAppStdin(const char* str);
    void WritelnAppStdin(const std::string& str);

    // 10 s, 1 s and 0.1 s unless changed by debug values.
    static double GetDefaultWaitSeconds();
    static double GetShortWaitSeconds();
    static double GetDefaultStateWaitSeconds();

    // For the threads of a launch, through ConsoleAppAccessor. `launch` is the caller's launch, or
    // null for the current one. In a launch that was given up, the notifications throw
    // consoleapp::Exception "no console app", and the ThrowIf functions do nothing.

    void NotifyLaunching(TaskID who, const consoleapp::ExecutionData* launch = nullptr);
    void NotifyLaunched(TaskID who, const consoleapp::ExecutionData* launch = nullptr);
    void NotifyRunning(TaskID who, const LaunchResult& result,
                       const consoleapp::ExecutionData* launch = nullptr);
    void NotifyFinished(TaskID who, int exitCode, State state,
                        const consoleapp::ExecutionData* launch = nullptr);
    void NotifyOutputTaskBegin(OutputChannel channel,
                               const consoleapp::ExecutionData* launch = nullptr);
    void NotifyOutputTaskEnd(OutputChannel channel,
                             const consoleapp::ExecutionData* launch = nullptr);
    void NotifyFailure(const consoleapp::Exception& exc,
                       const consoleapp::ExecutionData* launch = nullptr);
    void ThrowIfFailurePending(const consoleapp::ExecutionData* launch = nullptr);
    void ThrowIfInjected(TaskID who, Fault fault, const char* caller,
                         const consoleapp::ExecutionData* launch = nullptr);

    // Makes one operation of the next launch fail, once. Call before Launch.
    void SetInjectedFault(Fault fault) { fInjectedFault = fault; }

protected:
    // Without `makeLauncher`, all launches use `launcher`, and Launch fails as long as the thread
    // of a launch that was given up still runs, since both would reach the same child.
    explicit ConsoleApp(const boost::shared_ptr<Launcher>& launcher,
                        LauncherFactory makeLauncher = nullptr);

    // Called on the threads of a launch without a lock, so that they may call this object. An
    // exception is a failure of the launch.
    virtual void OnLaunching();
    virtual void OnRunning();
    virtual void OnOutputTaskBegin(OutputChannel channel);
    virtual void OnOutputTaskEnd(OutputChannel channel);
    virtual void OnFinished(int exitCode);
    virtual void OnReserved();

    // Returns the data of the current or latest launch; null before the first launch and after
    // Reset.
    boost::shared_ptr<consoleapp::ExecutionData> GetExecutionData();

    State GetStateLocked(Lock& lock, double maxWaitSeconds);
    void SetState(State state);
    void SetStateLocked(const Lock& lock, State state);

private:
    using LaunchNumber = std::uint64_t;

    void PrepareLauncherLocked();
    bool HasEventLocked() const;
    LaunchNumber GetLaunchNumber();
    State WaitForEnd(LaunchNumber launch, int& exitCode, double deadline);
    bool JoinAfterEnd(LaunchNumber launch, double deadline);
    bool IsOver(LaunchNumber launch);
    bool HoldsThread(LaunchNumber launch);
    bool AwaitThreadEnd(LaunchNumber launch, double seconds);
    bool JoinEndedThread(LaunchNumber launch);
    bool TimedJoin(LaunchNumber launch, double seconds);
    void GiveThreadUp();
    void ResetLaunch(LaunchNumber launch);
    void RequireLinkedLocked(const Lock& lock, TaskID who,
                             const consoleapp::ExecutionData* launch) const;
    void ThrowIfOutputInjected(OutputChannel channel, Fault fault, const char* caller,
                               const consoleapp::ExecutionData* launch);
    void NotifyFailureLocked(const Lock& lock, const consoleapp::Exception& exc);
    void ThrowIfFailurePendingLocked(const Lock& lock);
    void ThrowIfInjectedLocked(const Lock& lock, TaskID who, Fault fault, const char* caller);
    void LaunchHandleException(Lock& lock, const std::exception* exc, double joinWaitSeconds,
                               LaunchNumber launch);
    void HandleWaitException(Lock& lock, const std::exception* exc, double deadline,
                             LaunchNumber launch);

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

    const LauncherFactory fMakeLauncher;
    LaunchNumber fLaunchNumber = 0;              // of the latest launch
    boost::shared_ptr<ThreadEnd> fThreadEnd;     // of fLauncherThread, while that holds a thread
    boost::shared_ptr<ThreadEnd> fGivenUpThread; // of the latest thread that was given up

    // Locked to join fLauncherThread after its end or to give it up, never while waiting for its
    // end. Locked before fMutex. Only Launch sets fLauncherThread without this lock, but with
    // fMutex, while the state is Idle and no other thread uses it.
    boost::mutex fJoinMutex;
};

} // namespace pmutil
