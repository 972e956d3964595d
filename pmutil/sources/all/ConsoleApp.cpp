#include "pmutil/ConsoleApp.h"

#include <algorithm>
#include <sstream>
#include <stdexcept>
#include <utility>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/thread.hpp>

#include "all/ConsoleAppLog.h"
#include "all/LaunchThreadTask.h"
#include "all/ThreadEnd.h"
#include "all/WaitTime.h"
#include "pmutil/OutputTask.h"

namespace pmutil {

using consoleapp::Exception;
using consoleapp::ExecutionData;

using JoinLock = boost::lock_guard<boost::mutex>;

namespace {

// The names say how each value is converted to seconds.
DebugValue gDefaultWaitSecondsMinus10{"ConsoleAppDefaultWaitSecondsMinus10", 0};
DebugValue gShortWaitSecondsMinusOne{"ConsoleAppShortWaitSecondsMinusOne", 0};
DebugValue gDefaultStateWaitSecondsTimesTenMinus1{"ConsoleAppDefaultStateWaitSecondsTimesTenMinus1",
                                                  0};

// The maximum time between the end of a ThreadEnd and the exit of its thread, far above the usual.
constexpr double kMaxThreadExitSeconds = 10.0;

constexpr char kNotOpen[] = "pmutil::Channel not open";

const char* GetText(const std::exception* exc)
{
    return exc != nullptr ? exc->what() : "?";
}

// Returns false if the launch was given up. Null is the current launch.
bool IsLinked(const ExecutionData* launch)
{
    return launch == nullptr || launch->HasConsoleApp();
}

// Removes the access of the launch's threads to the application and to the tasks.
void Unlink(const boost::shared_ptr<ExecutionData>& data)
{
    if (data == nullptr)
        return;
    data->ClearConsoleApp();
    data->SetOutputTask(OutputChannel::kStdout, {});
    data->SetOutputTask(OutputChannel::kStderr, {});
}

bool HasEnded(State state)
{
    return state == State::kFinished || state == State::kCrashed || state == State::kKilled;
}

} // namespace

ConsoleApp::ConsoleApp() : ConsoleApp(MakeLauncher(), MakeLauncher) {}

ConsoleApp::ConsoleApp(const boost::shared_ptr<Launcher>& launcher, LauncherFactory makeLauncher)
    : fLauncher(launcher), fMakeLauncher(std::move(makeLauncher))
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::ConsoleApp()");
}

ConsoleApp::~ConsoleApp()
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::~ConsoleApp()");
    try {
        Reset();
    } catch (...) {
        // The members' destructors release the rest.
    }
}

double ConsoleApp::GetDefaultWaitSeconds()
{
    return GetDebugValue(gDefaultWaitSecondsMinus10) + 10.0;
}

double ConsoleApp::GetShortWaitSeconds()
{
    return GetDebugValue(gShortWaitSecondsMinusOne) + 1.0;
}

double ConsoleApp::GetDefaultStateWaitSeconds()
{
    return (GetDebugValue(gDefaultStateWaitSecondsTimesTenMinus1) + 1.0) / 10.0;
}

void ConsoleApp::Launch(const boost::shared_ptr<ExecutionData>& data, const LaunchParams& params)
{
    Lock lock(fMutex);
    if (fState != State::kIdle)
        throw std::runtime_error("ConsoleApp: must be idle");
    PrepareLauncherLocked();
    const LaunchNumber launch = ++fLaunchNumber;
    try {
        SetStateLocked(lock, State::kLaunching);
        // An output task of the last launch may still run, even if the launcher's thread was
        // joined.
        if (fExecutionData != data)
            Unlink(fExecutionData);
        fExecutionData = data;
        fLaunchParams = params;
        {
            const LaunchThreadTask task(fExecutionData, fLauncher, fLaunchParams);
            const auto end = boost::make_shared<ThreadEnd>();
            fLauncherThread.Assign(StartThread(task, end).release());
            fThreadEnd = end;
        }
        try {
            GetStateLocked(lock, GetShortWaitSeconds());
        } catch (const std::exception& exc) {
            LaunchHandleException(lock, &exc, GetShortWaitSeconds(), launch);
            throw;
        } catch (...) {
            LaunchHandleException(lock, nullptr, GetShortWaitSeconds(), launch);
            throw;
        }
    } catch (...) {
        PM_LOG(gConsoleAppLog, "Launch exception: calling Reset()");
        lock.unlock();
        ResetLaunch(launch);
        throw;
    }
}

// Replaces fLauncher if a launch that was given up still uses it.
void ConsoleApp::PrepareLauncherLocked()
{
    if (fGivenUpThread != nullptr && !fGivenUpThread->HasEnded()) {
        if (!fMakeLauncher)
            throw std::runtime_error(
                "ConsoleApp: the launcher still serves a launch that was given up");
        fLauncher = fMakeLauncher();
    }
    fGivenUpThread.reset();
}

void ConsoleApp::LaunchHandleException(Lock& lock, const std::exception* exc,
                                       double joinWaitSeconds, LaunchNumber launch)
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::LaunchHandleException exc="
                               << GetText(exc) << " joinWaitSEconds=" << joinWaitSeconds);
    // An interruption would replace the failure.
    const boost::this_thread::disable_interruption uninterrupted;
    lock.unlock();
    bool joined = false;
    if (AwaitThreadEnd(launch, joinWaitSeconds)) {
        const JoinLock joinLock(fJoinMutex);
        joined = JoinEndedThread(launch);
    }
    PM_LOG(gConsoleAppLog, "fLauncherThread.TimedJoin returns " << joined);
    lock.lock();
}

State ConsoleApp::Wait(int* exitCode, double maxWaitSeconds)
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::Wait() maxWaitSeconds=" << maxWaitSeconds);
    const double deadline = GetWaitClock() + maxWaitSeconds;
    const LaunchNumber launch = GetLaunchNumber();
    try {
        int code = 0;
        State result = WaitForEnd(launch, code, deadline);
        if (HasEnded(result)) {
            if (!JoinAfterEnd(launch, deadline)) {
                ResetLaunch(launch);
                result = State::kTimeout;
            } else if (exitCode != nullptr) {
                *exitCode = code;
            }
        }
        {
            const Lock lock(fMutex);
            if (fLaunchNumber == launch)
                ThrowIfFailurePendingLocked(lock);
        }
        PM_LOG(gConsoleAppLog, "ConsoleApp::Wait returns " << result);
        return result;
    } catch (...) {
        ResetLaunch(launch);
        throw;
    }
}

ConsoleApp::LaunchNumber ConsoleApp::GetLaunchNumber()
{
    const Lock lock(fMutex);
    return fLaunchNumber;
}

// The last part of Wait: joins the launcher's thread and sets the state to Idle. Returns false if
// the thread didn't end and was given up.
bool ConsoleApp::JoinAfterEnd(LaunchNumber launch, double deadline)
{
    if (IsOver(launch)) // another thread has joined it
        return true;
    const double joinWait = std::min(GetTimeLeft(deadline), GetShortWaitSeconds());
    PM_LOG(gConsoleAppLog, "ConsoleApp::Wait fLauncherThread.TimedJoin(" << joinWait << ")");
    const bool ended = AwaitThreadEnd(launch, joinWait);
    const JoinLock joinLock(fJoinMutex);
    // If another thread has joined it or given it up, the child's end is still reported.
    if (HoldsThread(launch) && (!ended || !JoinEndedThread(launch))) {
        PM_LOG(gConsoleAppLog, "ConsoleApp::Wait fLauncherThread never finished");
        GiveThreadUp();
        return false;
    }
    if (!IsOver(launch))
        SetState(State::kIdle);
    return true;
}

// Returns whether the launcher's thread of this launch was neither joined nor given up. While
// fJoinMutex is locked, true doesn't change.
bool ConsoleApp::HoldsThread(LaunchNumber launch)
{
    const Lock lock(fMutex);
    return fLaunchNumber == launch && fThreadEnd != nullptr;
}

// Returns whether another thread has joined or reset the launch.
bool ConsoleApp::IsOver(LaunchNumber launch)
{
    const Lock lock(fMutex);
    return fLaunchNumber != launch || fState == State::kIdle;
}

// Waits for the end of the launcher's thread of this launch. Returns false if it didn't end, or if
// there is none. Holds no lock while waiting, so that any number of threads can wait.
bool ConsoleApp::AwaitThreadEnd(LaunchNumber launch, double seconds)
{
    boost::shared_ptr<ThreadEnd> end;
    {
        const Lock lock(fMutex);
        if (fLaunchNumber == launch)
            end = fThreadEnd;
    }
    return end != nullptr && end->Await(seconds);
}

// Requires fJoinMutex locked and a successful AwaitThreadEnd. Returns false if another thread has
// joined it or given it up.
bool ConsoleApp::JoinEndedThread(LaunchNumber launch)
{
    if (!HoldsThread(launch))
        return false;
    const boost::this_thread::disable_interruption uninterrupted;
    if (!fLauncherThread.TimedJoin(kMaxThreadExitSeconds))
        return false;
    const Lock lock(fMutex);
    fThreadEnd.reset();
    return true;
}

// Requires fJoinMutex locked. The launcher's thread continues with its launcher; no thread waits
// for its end any more.
void ConsoleApp::GiveThreadUp()
{
    fLauncherThread.Abandon();
    const Lock lock(fMutex);
    if (fThreadEnd == nullptr)
        return;
    fThreadEnd->GiveUp();
    fGivenUpThread.swap(fThreadEnd);
    fThreadEnd.reset();
}

// The first part of Wait. Returns Finished, Crashed or Killed with the exit code, Idle, or Timeout.
State ConsoleApp::WaitForEnd(LaunchNumber launch, int& exitCode, double deadline)
{
    Lock lock(fMutex);
    try {
        while (fLaunchNumber == launch) {
            const State state = GetStateLocked(lock, GetTimeLeft(deadline));
            if (HasEnded(state))
                exitCode = fExitCode;
            if (HasEnded(state) || state == State::kIdle)
                return state;
            const double left = GetTimeLeft(deadline);
            PM_LOG(gConsoleAppLog, "ConsoleApp::Wait fState="
                                       << fState << " fCond.timed_wait waitSeconds=" << left);
            if (fCond.timed_wait(lock, ToWaitDuration(left)) || HasEventLocked() ||
                fLaunchNumber != launch)
                continue;
            PM_LOG(gConsoleAppLog, "ConsoleApp::Wait Wait timed out");
            SetStateLocked(lock, State::kTimeout);
            return State::kTimeout;
        }
        return State::kIdle;
    } catch (const std::exception& exc) {
        HandleWaitException(lock, &exc, deadline, launch);
        throw;
    } catch (...) {
        HandleWaitException(lock, nullptr, deadline, launch);
        throw;
    }
}

// Returns whether there is an event that a wait must report even if it has just timed out.
bool ConsoleApp::HasEventLocked() const
{
    return HasEnded(fState) || fState == State::kIdle || !fFailures.empty();
}

void ConsoleApp::HandleWaitException(Lock& lock, const std::exception* exc, double deadline,
                                     LaunchNumber launch)
{
    const double waitSeconds = GetTimeLeft(deadline);
    PM_LOG(gConsoleAppLog, "ConsoleApp::HandleWaitException exc=" << GetText(exc)
                                                                  << " waitSeconds=" << waitSeconds
                                                                  << " fState=" << fState);
    if (fLaunchNumber != launch || fThreadEnd == nullptr)
        return;
    const bool mayJoin = fState != State::kTimeout;
    lock.unlock();
    if (!mayJoin || !TimedJoin(launch, waitSeconds)) {
        const JoinLock joinLock(fJoinMutex);
        if (HoldsThread(launch)) {
            PM_LOG(gConsoleAppLog, "abandon fLauncherThread");
            GiveThreadUp();
        }
    }
    lock.lock();
}

bool ConsoleApp::TimedJoin(LaunchNumber launch, double seconds)
{
    PM_LOG(gConsoleAppLog, "TimedJoin(" << seconds << ")");
    bool joined = false;
    if (AwaitThreadEnd(launch, seconds)) {
        const JoinLock joinLock(fJoinMutex);
        joined = JoinEndedThread(launch);
    }
    PM_LOG(gConsoleAppLog, "fLauncherThread.TimedJoin timeout=" << joined);
    return joined;
}

void ConsoleApp::Kill()
{
    Lock lock(fMutex);
    const State state = GetStateLocked(lock, GetShortWaitSeconds());
    if (state == State::kRunning || state == State::kTimeout) {
        SetStateLocked(lock, State::kKilling);
        ThrowIfInjectedLocked(lock, TaskID::kClient, Fault::kLauncherKill, "LauncherKill");
        fLauncher->Kill();
    }
}

boost::shared_ptr<ExecutionData> ConsoleApp::GetExecutionData()
{
    const Lock lock(fMutex);
    return fExecutionData;
}

State ConsoleApp::GetState(double maxWaitSeconds)
{
    Lock lock(fMutex);
    return GetStateLocked(lock, maxWaitSeconds);
}

State ConsoleApp::GetStateLocked(Lock& lock, double maxWaitSeconds)
{
    const double deadline = GetWaitClock() + maxWaitSeconds;
    const LaunchNumber launch = fLaunchNumber;
    for (int nloops = 0;; ++nloops) {
        PM_LOG(gConsoleAppLog,
               "ConsoleApp::GetStateLocked nloops=" << nloops << " fState=" << fState);
        ThrowIfFailurePendingLocked(lock);
        if (IsStable(fState))
            return fState;
        const auto duration = ToWaitDuration(GetTimeLeft(deadline));
        const bool woken = !duration.is_not_a_date_time() && fCond.timed_wait(lock, duration);
        if (fLaunchNumber != launch)
            return State::kIdle; // the launch that this waits for is over
        if (woken || IsStable(fState) || !fFailures.empty())
            continue;
        PM_LOG(gConsoleAppLog, "ConsoleApp::GetStateLocked timeout, fState=" << fState);
        SetStateLocked(lock, State::kTimeout);
        return fState;
    }
}

void ConsoleApp::SetState(State state)
{
    const Lock lock(fMutex);
    SetStateLocked(lock, state);
}

void ConsoleApp::SetStateLocked(const Lock& /*lock*/, State state)
{
    PM_LOG(gConsoleAppLog, "SetStateLocked state=" << state);
    fState = state;
    fCond.notify_all();
}

void ConsoleApp::Reset()
{
    ResetLaunch(GetLaunchNumber());
}

// Does nothing after a newer launch.
void ConsoleApp::ResetLaunch(LaunchNumber launch)
{
    // It must complete: the next launch requires an Idle object.
    const boost::this_thread::disable_interruption uninterrupted;
    boost::shared_ptr<ExecutionData> data;
    {
        const Lock lock(fMutex);
        if (fLaunchNumber == launch)
            data = fExecutionData;
    }
    Unlink(data);
    const bool ended = AwaitThreadEnd(launch, GetShortWaitSeconds());
    const JoinLock joinLock(fJoinMutex);
    Lock lock(fMutex);
    if (fLaunchNumber != launch)
        return;
    if (fLauncherThread.HoldsThread()) {
        lock.unlock();
        if (!ended || !JoinEndedThread(launch)) {
            PM_LOG(gConsoleAppLog, "ConsoleApp::Reset abandon fLauncherThread");
            GiveThreadUp();
        }
        lock.lock();
    }
    SetStateLocked(lock, State::kIdle);
    fExitCode = 0;
    fInjectedFault = Fault::kNoFault;
    if (fAppStdin != nullptr)
        fAppStdin->Close();
    fAppStdin.reset();
    fExecutionData.reset();
    fFailures.clear();
}

unsigned ConsoleApp::GetTasksRunning()
{
    unsigned result = 0;
    if (fLauncherThread.HoldsThread())
        result |= 1U << static_cast<unsigned>(TaskID::kLauncher);
    for (const OutputChannel channel : {OutputChannel::kStdout, OutputChannel::kStderr})
        if (fExecutionData->GetOutputTask(channel)->IsRunning(0.0))
            result |= 1U << static_cast<unsigned>(channel);
    PM_LOG(gConsoleAppLog, "GetTasksRunning result=" << result);
    return result;
}

void ConsoleApp::CloseAppStdin()
{
    const Lock lock(fMutex);
    if (fAppStdin != nullptr)
        fAppStdin->Close();
    fAppStdin.reset();
}

void ConsoleApp::WriteAppStdin(const unsigned char* data, std::size_t nbytes)
{
    const Lock lock(fMutex);
    if (!fAppStdin->IsOpen())
        throw std::runtime_error(kNotOpen);
    fAppStdin->WriteAll(data, nbytes);
    if (!fAppStdin->IsOpen())
        throw std::runtime_error(kNotOpen);
}

void ConsoleApp::WritelnAppStdin(const char* str)
{
    if (str == nullptr)
        throw std::invalid_argument("ConsoleApp::WritelnAppStdin str=nullptr");
    WritelnAppStdin(std::string(str));
}

void ConsoleApp::WritelnAppStdin(const std::string& str)
{
    const std::string line = str + '\n';
    WriteAppStdin(reinterpret_cast<const unsigned char*>(line.data()), line.size());
}

// Reset unlinks a launch before it locks the mutex to set the state. A notification that passes
// this check before that is overwritten by Reset; a later one throws.
void ConsoleApp::RequireLinkedLocked(const Lock& /*lock*/, TaskID who,
                                     const ExecutionData* launch) const
{
    if (!IsLinked(launch))
        throw Exception(who, "no console app");
}

void ConsoleApp::NotifyLaunching(TaskID who, const ExecutionData* launch)
{
    {
        const Lock lock(fMutex);
        RequireLinkedLocked(lock, who, launch);
        ThrowIfInjectedLocked(lock, who, Fault::kNotifyLaunching, "NotifyLaunching");
        SetStateLocked(lock, State::kLaunching);
    }
    OnLaunching();
}

void ConsoleApp::NotifyLaunched(TaskID who, const ExecutionData* launch)
{
    const Lock lock(fMutex);
    RequireLinkedLocked(lock, who, launch);
    ThrowIfInjectedLocked(lock, who, Fault::kNotifyLaunched, "NotifyLaunched");
    SetStateLocked(lock, State::kLaunched);
}

void ConsoleApp::NotifyRunning(TaskID who, const LaunchResult& result, const ExecutionData* launch)
{
    {
        const Lock lock(fMutex);
        RequireLinkedLocked(lock, who, launch);
        ThrowIfInjectedLocked(lock, who, Fault::kNotifyRunning, "NotifyRunning");
        if (fAppStdin != nullptr)
            fAppStdin->Close();
        fAppStdin.reset();
        if (fLaunchParams.fKeepStdin)
            fAppStdin = result.fAppInput;
        SetStateLocked(lock, State::kRunning);
    }
    OnRunning();
}

void ConsoleApp::NotifyFinished(TaskID who, int exitCode, State state, const ExecutionData* launch)
{
    {
        const Lock lock(fMutex);
        RequireLinkedLocked(lock, who, launch);
        ThrowIfInjectedLocked(lock, who, Fault::kNotifyFinished, "NotifyFinished");
        fExitCode = exitCode;
        SetStateLocked(lock, state);
    }
    OnFinished(exitCode);
}

void ConsoleApp::NotifyOutputTaskBegin(OutputChannel channel, const ExecutionData* launch)
{
    ThrowIfOutputInjected(channel, Fault::kNotifyOutputTaskBegin, "NotifyOutputTaskBegin", launch);
    OnOutputTaskBegin(channel);
}

void ConsoleApp::NotifyOutputTaskEnd(OutputChannel channel, const ExecutionData* launch)
{
    ThrowIfOutputInjected(channel, Fault::kNotifyOutputTaskEnd, "NotifyOutputTaskEnd", launch);
    OnOutputTaskEnd(channel);
}

void ConsoleApp::ThrowIfOutputInjected(OutputChannel channel, Fault fault, const char* caller,
                                       const ExecutionData* launch)
{
    const TaskID who = GetTaskID(channel);
    const Lock lock(fMutex);
    RequireLinkedLocked(lock, who, launch);
    ThrowIfInjectedLocked(lock, who, fault, caller);
}

void ConsoleApp::NotifyFailure(const Exception& exc, const ExecutionData* launch)
{
    const Lock lock(fMutex);
    RequireLinkedLocked(lock, exc.GetTaskID(), launch);
    NotifyFailureLocked(lock, exc);
}

void ConsoleApp::NotifyFailureLocked(const Lock& /*lock*/, const Exception& exc)
{
    PM_LOG(gConsoleAppLog, "NotifyFailureLocked: exc=" << exc.what());
    fFailures.push_back(exc);
    if (fFailures.size() > 1)
        PM_LOG(gConsoleAppLog, "NotifyFailureLocked: fFailures.size()=" << fFailures.size());
    fCond.notify_all();
}

void ConsoleApp::ThrowIfFailurePending(const ExecutionData* launch)
{
    const Lock lock(fMutex);
    if (IsLinked(launch))
        ThrowIfFailurePendingLocked(lock);
}

void ConsoleApp::ThrowIfFailurePendingLocked(const Lock& /*lock*/)
{
    PM_LOG(gConsoleAppLog,
           "ConsoleApp::ThrowIfFailurePendingLocked numFailures=" << fFailures.size());
    if (fFailures.empty())
        return;
    const Exception oldest = fFailures.front();
    fFailures.pop_front();
    fCond.notify_all();
    PM_LOG(gConsoleAppLog, "ThrowIfFailurePendingLocked throwing exc=" << oldest.what());
    throw Exception(oldest);
}

void ConsoleApp::ThrowIfInjected(TaskID who, Fault fault, const char* caller,
                                 const ExecutionData* launch)
{
    const Lock lock(fMutex);
    if (IsLinked(launch))
        ThrowIfInjectedLocked(lock, who, fault, caller);
}

void ConsoleApp::ThrowIfInjectedLocked(const Lock& /*lock*/, TaskID who, Fault fault,
                                       const char* caller)
{
    if (fault != fInjectedFault || fault == Fault::kNoFault)
        return;
    const Exception exc(who, caller);
    PM_LOG(gConsoleAppLog, "ConsoleApp::ThrowIfInjectedLocked throwing, caller="
                               << who << " fault=" << fault
                               << " msg=" << (caller != nullptr ? caller : "<NULL>"));
    fInjectedFault = Fault::kNoFault;
    throw Exception(exc);
}

void ConsoleApp::OnLaunching() {}
void ConsoleApp::OnRunning() {}
void ConsoleApp::OnOutputTaskBegin(OutputChannel /*channel*/) {}
void ConsoleApp::OnOutputTaskEnd(OutputChannel /*channel*/) {}
void ConsoleApp::OnFinished(int /*exitCode*/) {}
void ConsoleApp::OnReserved() {}

} // namespace pmutil
