// Supervises one console child program: launches it on a thread of its own, has its output pumped,
// lets a caller wait with a timeout, kills it, and keeps how it ended. One launch at a time, any
// number in turn.
//
// Failures on the threads of a launch are stored, oldest first, and each wait of the client throws
// one of them (consoleapp::Exception).
//
// Clients derive from it if they want the notifications, and drive it through ConsoleAppLauncher.
// Hold it by boost::shared_ptr.
//
// One Launcher serves all launches in turn, as long as the thread of each ends. If the thread of a
// launch that was given up still runs at the next launch, it keeps the launcher that it has, so
// that it reaches only its own child, and the next launch gets a new one.
//
// A boost::thread interruption ends Launch, Wait, Kill and GetState as a failure does. Reset can't
// be interrupted: the request stays pending.
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

// Makes a launcher of the kind that an application launches with; never an empty one. Called by
// ConsoleApp::Launch with the application's lock held.
using LauncherFactory = std::function<boost::shared_ptr<Launcher>()>;

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
    // alone; after any other failure, which it throws, the object is Idle. One of them is
    // "ConsoleApp: the launcher still serves a launch that was given up", for an application
    // without a LauncherFactory.
    void Launch(const boost::shared_ptr<consoleapp::ExecutionData>& data,
                const LaunchParams& params);

    // Waits for the end of the child. Finished, Crashed or Killed: it has ended, and the object is
    // Idle again; `*exitCode`, unless null, gets the code, 0 after a crash or a kill. Timeout: it
    // goes on, and so may the caller, with another Wait or a Kill; unless the launcher's thread was
    // given up, which leaves the object Idle. Idle: there was nothing to wait for, or another
    // thread has seen the launch to its end meanwhile; a newer launch isn't waited for. Throws the
    // oldest stored failure and leaves the object Idle.
    //
    // The join of the launcher's thread must fit into the wait too. A client that polls with a wait
    // of 0 seconds may find the child ended but that thread still busy, and gets Timeout, an Idle
    // object and no code.
    //
    // A failure of an output task, or an interruption, doesn't end the child: this waits for its
    // end, up to the limit, before it throws. The launch is given up then.
    State Wait(int* exitCode, double maxWaitSeconds);

    // Asks for the child's end if it is Running or the last wait ran out; doesn't wait for it.
    // Waits up to the short wait for a stable state before. Throws the oldest stored failure.
    //
    // While the start lasts longer than the short wait there may be no child to kill yet: the call
    // is lost then, the launch goes on, and the client must call again.
    void Kill();

    // Waits up to `maxWaitSeconds` for a stable state; Timeout if none came. Throws the oldest
    // stored failure.
    State GetState(double maxWaitSeconds);

    // Back to Idle whatever it was doing. Waits up to the short wait for the launcher's thread to
    // end, and not at all if the caller is that thread. The child isn't killed.
    void Reset();

    // A bit for each thread of the launch that runs, at the place of its TaskID. Needs a launch,
    // and both output tasks alive.
    unsigned GetTasksRunning();

    // The child's standard input; only with LaunchParams::fKeepStdin, from Running on. A write
    // blocks while the pipe is full, and so do all other operations meanwhile, without a limit:
    // Wait, Kill and Reset too. Throw std::runtime_error "pmutil::Channel not open" and what
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

    // For the threads of a launch, through ConsoleAppAccessor. `launch` is the one that the caller
    // belongs to; null stands for the present one. The notifications of a launch that was given up
    // throw consoleapp::Exception "no console app"; no failure or fault is thrown to its threads.

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

    // Arms a fault, which fires once; call it before Launch.
    void SetInjectedFault(Fault fault) { fInjectedFault = fault; }

protected:
    // Without `makeLauncher` there is no other launcher than `launcher`: Launch fails as long as
    // the thread of a launch that was given up still runs, since both would reach the same child.
    explicit ConsoleApp(const boost::shared_ptr<Launcher>& launcher,
                        LauncherFactory makeLauncher = nullptr);

    // Called on the threads of a launch, without a lock, so that they may call back in. An
    // exception is a failure of the launch.
    virtual void OnLaunching();
    virtual void OnRunning();
    virtual void OnOutputTaskBegin(OutputChannel channel);
    virtual void OnOutputTaskEnd(OutputChannel channel);
    virtual void OnFinished(int exitCode);
    virtual void OnReserved();

    // The link of the present or latest launch; empty before the first, and after Reset.
    boost::shared_ptr<consoleapp::ExecutionData> GetExecutionData();

    State GetStateLocked(Lock& lock, double maxWaitSeconds);
    void SetState(State state);
    void SetStateLocked(const Lock& lock, State state);

private:
    using LaunchNumber = std::uint64_t;

    void ReadyLauncherLocked();
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

    // Held to join fLauncherThread once it has ended, or to give it up; never to wait for its end.
    // Taken before fMutex. Launch alone sets fLauncherThread without it, but with fMutex, while
    // the state is Idle: no other thread uses it then.
    boost::mutex fJoinMutex;
};

} // namespace pmutil
