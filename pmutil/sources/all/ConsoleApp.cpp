#include "pmutil/ConsoleApp.h"

#include <algorithm>
#include <memory>
#include <sstream>
#include <stdexcept>

#include <boost/thread/lock_guard.hpp>

#include "all/ConsoleAppLog.h"
#include "all/LaunchThreadTask.h"
#include "all/WaitTime.h"
#include "pmutil/OutputTask.h"

namespace pmutil {

using consoleapp::Exception;
using consoleapp::ExecutionData;

using JoinLock = boost::lock_guard<boost::mutex>;

namespace {

// The names tell how each value becomes seconds.
DebugValue gDefaultWaitSecondsMinus10{"ConsoleAppDefaultWaitSecondsMinus10", 0};
DebugValue gShortWaitSecondsMinusOne{"ConsoleAppShortWaitSecondsMinusOne", 0};
DebugValue gDefaultStateWaitSecondsTimesTenMinus1{"ConsoleAppDefaultStateWaitSecondsTimesTenMinus1",
                                                  0};

constexpr char kNotOpen[] = "pmutil::Channel not open";

const char* GetText(const std::exception* exc)
{
    return exc != nullptr ? exc->what() : "?";
}

bool HasEnded(State state)
{
    return state == State::kFinished || state == State::kCrashed || state == State::kKilled;
}

} // namespace

ConsoleApp::ConsoleApp() : ConsoleApp(MakeLauncher()) {}

ConsoleApp::ConsoleApp(const boost::shared_ptr<Launcher>& launcher) : fLauncher(launcher)
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::ConsoleApp()");
}

ConsoleApp::~ConsoleApp()
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::~ConsoleApp()");
    try {
        Reset();
    } catch (...) {
        // The members' destructors let go of what is left.
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
    try {
        SetStateLocked(lock, State::kLaunching);
        fExecutionData = data;
        fLaunchParams = params;
        {
            const LaunchThreadTask task(fExecutionData, fLauncher, fLaunchParams);
            auto thread = std::make_unique<boost::thread>(task);
            fLauncherThread.Assign(thread.release());
        }
        try {
            GetStateLocked(lock, GetShortWaitSeconds());
        } catch (const std::exception& exc) {
            LaunchHandleException(lock, &exc, GetShortWaitSeconds());
            throw;
        } catch (...) {
            LaunchHandleException(lock, nullptr, GetShortWaitSeconds());
            throw;
        }
    } catch (...) {
        PM_LOG(gConsoleAppLog, "Launch exception: calling Reset()");
        lock.unlock();
        Reset();
        throw;
    }
}

void ConsoleApp::LaunchHandleException(Lock& lock, const std::exception* exc,
                                       double joinWaitSeconds)
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::LaunchHandleException exc="
                               << GetText(exc) << " joinWaitSEconds=" << joinWaitSeconds);
    lock.unlock();
    {
        const JoinLock joinLock(fJoinMutex);
        const bool joined = fLauncherThread.TimedJoin(joinWaitSeconds);
        PM_LOG(gConsoleAppLog, "fLauncherThread.TimedJoin returns " << joined);
    }
    lock.lock();
}

State ConsoleApp::Wait(int* exitCode, double maxWaitSeconds)
{
    PM_LOG(gConsoleAppLog, "ConsoleApp::Wait() maxWaitSeconds=" << maxWaitSeconds);
    const double deadline = GetWaitClock() + maxWaitSeconds;
    try {
        State result = WaitForEnd(deadline);
        if (HasEnded(result) && !JoinAfterEnd(exitCode, deadline)) {
            Reset();
            result = State::kTimeout;
        }
        ThrowIfFailurePending();
        PM_LOG(gConsoleAppLog, "ConsoleApp::Wait returns " << result);
        return result;
    } catch (...) {
        Reset();
        throw;
    }
}

// The last part of Wait, after which the object is Idle; false if the launcher's thread won't end.
bool ConsoleApp::JoinAfterEnd(int* exitCode, double deadline)
{
    const JoinLock joinLock(fJoinMutex);
    {
        const Lock lock(fMutex);
        if (fState == State::kIdle) { // another thread's wait was first
            if (exitCode != nullptr)
                *exitCode = fExitCode;
            return true;
        }
    }
    const double joinWait = std::min(GetTimeLeft(deadline), GetShortWaitSeconds());
    PM_LOG(gConsoleAppLog, "ConsoleApp::Wait fLauncherThread.TimedJoin(" << joinWait << ")");
    if (!fLauncherThread.TimedJoin(joinWait)) {
        PM_LOG(gConsoleAppLog, "ConsoleApp::Wait fLauncherThread never finished");
        fLauncherThread.Abandon();
        return false;
    }
    const Lock lock(fMutex);
    SetStateLocked(lock, State::kIdle);
    if (exitCode != nullptr)
        *exitCode = fExitCode;
    return true;
}

// The first part of Wait: Finished, Crashed, Killed or Idle, or Timeout if none came.
State ConsoleApp::WaitForEnd(double deadline)
{
    Lock lock(fMutex);
    try {
        for (;;) {
            const State state = GetStateLocked(lock, GetTimeLeft(deadline));
            if (HasEnded(state) || state == State::kIdle)
                return state;
            const double left = GetTimeLeft(deadline);
            PM_LOG(gConsoleAppLog, "ConsoleApp::Wait fState="
                                       << fState << " fCond.timed_wait waitSeconds=" << left);
            if (fCond.timed_wait(lock, ToWaitDuration(left)) || HasEventLocked())
                continue;
            PM_LOG(gConsoleAppLog, "ConsoleApp::Wait Wait timed out");
            SetStateLocked(lock, State::kTimeout);
            return State::kTimeout;
        }
    } catch (const std::exception& exc) {
        HandleWaitException(lock, &exc, deadline);
        throw;
    } catch (...) {
        HandleWaitException(lock, nullptr, deadline);
        throw;
    }
}

// True if something came that a wait that just ran out of time must not lose.
bool ConsoleApp::HasEventLocked() const
{
    return HasEnded(fState) || fState == State::kIdle || !fFailures.empty();
}

void ConsoleApp::HandleWaitException(Lock& lock, const std::exception* exc, double deadline)
{
    const double waitSeconds = GetTimeLeft(deadline);
    PM_LOG(gConsoleAppLog, "ConsoleApp::HandleWaitException exc=" << GetText(exc)
                                                                  << " waitSeconds=" << waitSeconds
                                                                  << " fState=" << fState);
    const bool mayJoin = fState != State::kTimeout;
    lock.unlock();
    {
        const JoinLock joinLock(fJoinMutex);
        if (fLauncherThread.HoldsThread() && !(mayJoin && JoinAfterFailure(waitSeconds))) {
            PM_LOG(gConsoleAppLog, "abandon fLauncherThread");
            fLauncherThread.Abandon();
        }
    }
    lock.lock();
}

bool ConsoleApp::JoinAfterFailure(double seconds)
{
    PM_LOG(gConsoleAppLog, "TimedJoin(" << seconds << ")");
    const bool joined = fLauncherThread.TimedJoin(seconds);
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

State ConsoleApp::GetState(double maxWaitSeconds)
{
    Lock lock(fMutex);
    return GetStateLocked(lock, maxWaitSeconds);
}

State ConsoleApp::GetStateLocked(Lock& lock, double maxWaitSeconds)
{
    const double deadline = GetWaitClock() + maxWaitSeconds;
    for (int nloops = 0;; ++nloops) {
        PM_LOG(gConsoleAppLog,
               "ConsoleApp::GetStateLocked nloops=" << nloops << " fState=" << fState);
        ThrowIfFailurePendingLocked(lock);
        if (IsStable(fState))
            return fState;
        const auto duration = ToWaitDuration(GetTimeLeft(deadline));
        const bool woken = !duration.is_not_a_date_time() && fCond.timed_wait(lock, duration);
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
    boost::shared_ptr<ExecutionData> data;
    {
        const Lock lock(fMutex);
        data = fExecutionData;
    }
    if (data != nullptr) {
        data->ClearConsoleApp();
        data->SetOutputTask(OutputChannel::kStdout, {});
        data->SetOutputTask(OutputChannel::kStderr, {});
    }
    const JoinLock joinLock(fJoinMutex);
    Lock lock(fMutex);
    if (fLauncherThread.HoldsThread()) {
        lock.unlock();
        if (!fLauncherThread.TimedJoin(GetShortWaitSeconds())) {
            PM_LOG(gConsoleAppLog, "ConsoleApp::Reset abandon fLauncherThread");
            fLauncherThread.Abandon();
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
    for (const OutputChannel channel : {OutputChannel::kStdout, OutputChannel::kStderr}) {
        if (fExecutionData->GetOutputTask(channel)->IsRunning(0.0))
            result |= 1U << static_cast<unsigned>(channel);
    }
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

void ConsoleApp::NotifyLaunching(TaskID who)
{
    {
        const Lock lock(fMutex);
        ThrowIfInjectedLocked(lock, who, Fault::kNotifyLaunching, "NotifyLaunching");
        SetStateLocked(lock, State::kLaunching);
    }
    OnLaunching();
}

void ConsoleApp::NotifyLaunched(TaskID who)
{
    const Lock lock(fMutex);
    ThrowIfInjectedLocked(lock, who, Fault::kNotifyLaunched, "NotifyLaunched");
    SetStateLocked(lock, State::kLaunched);
}

void ConsoleApp::NotifyRunning(TaskID who, const LaunchResult& result)
{
    {
        const Lock lock(fMutex);
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

void ConsoleApp::NotifyFinished(TaskID who, int exitCode, State state)
{
    {
        const Lock lock(fMutex);
        ThrowIfInjectedLocked(lock, who, Fault::kNotifyFinished, "NotifyFinished");
        fExitCode = exitCode;
        SetStateLocked(lock, state);
    }
    OnFinished(exitCode);
}

void ConsoleApp::NotifyOutputTaskBegin(OutputChannel channel)
{
    ThrowIfInjected(GetTaskID(channel), Fault::kNotifyOutputTaskBegin, "NotifyOutputTaskBegin");
    OnOutputTaskBegin(channel);
}

void ConsoleApp::NotifyOutputTaskEnd(OutputChannel channel)
{
    ThrowIfInjected(GetTaskID(channel), Fault::kNotifyOutputTaskEnd, "NotifyOutputTaskEnd");
    OnOutputTaskEnd(channel);
}

void ConsoleApp::NotifyFailure(const Exception& exc)
{
    const Lock lock(fMutex);
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

void ConsoleApp::ThrowIfFailurePending()
{
    const Lock lock(fMutex);
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

void ConsoleApp::ThrowIfInjected(TaskID who, Fault fault, const char* caller)
{
    const Lock lock(fMutex);
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
