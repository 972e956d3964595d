#include "pmutil/RunProgram.h"

#include <algorithm>
#include <exception>
#include <optional>
#include <utility>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include "all/EndState.h"
#include "all/WaitTime.h"
#include "pmutil/ChildCommand.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/StartAwareApp.h"
#include "pmutil/TrackingLauncher.h"

namespace pmutil {

using consoleapp::LaunchStart;

namespace {

// The interval, in seconds, at which a slow start checks for a kill.
constexpr double kStartPollSeconds = 0.1;

// Ignores a failure: a program that can't be killed is reported as still running.
void TryKill(TrackingLauncher& child)
{
    try {
        child.Kill();
    } catch (const std::exception&) {
    }
}

// Receives one output, for the caller's function or for the result. Exists after the run as long as
// the output is open.
class Capture {
public:
    Capture(TakeBytes take, std::size_t maxKept) : fTake(std::move(take)), fMaxKept(maxKept) {}

    // Rethrows exceptions of the caller's function.
    void Take(std::string_view block)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        if (fIsClosed)
            return;
        try {
            if (fTake)
                fTake(block);
            else
                Keep(block);
        } catch (...) {
            fFailure = std::current_exception();
            fIsClosed = true;
            throw;
        }
    }

    // Discards all further blocks.
    void Close()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fIsClosed = true;
    }

    // Call these after Close.
    void RethrowFailure() const
    {
        if (fFailure != nullptr)
            std::rethrow_exception(fFailure);
    }
    std::string TakeText() { return std::move(fText); }
    std::uint64_t GetDroppedBytes() const { return fDropped; }

private:
    void Keep(std::string_view block)
    {
        const std::size_t kept = std::min(block.size(), fMaxKept - fText.size());
        fText.append(block.substr(0, kept));
        fDropped += block.size() - kept;
    }

    const TakeBytes fTake;
    const std::size_t fMaxKept;
    boost::mutex fMutex;
    bool fIsClosed = false;
    std::exception_ptr fFailure;
    std::string fText;
    std::uint64_t fDropped = 0;
};

// Kills the program if its output can't be read or processed.
class RunPump : public OutputPump {
public:
    RunPump(const boost::shared_ptr<Capture>& capture, boost::shared_ptr<TrackingLauncher> child)
        : OutputPump([capture](std::string_view block) { capture->Take(block); }),
          fChild(std::move(child))
    {}

protected:
    void DoRun() override
    {
        try {
            OutputPump::DoRun();
        } catch (...) {
            TryKill(*fChild);
            throw;
        }
    }

private:
    const boost::shared_ptr<TrackingLauncher> fChild;
};

class ProgramRun {
public:
    explicit ProgramRun(const RunOptions& options)
        : fDeadline(GetWaitClock() + options.fTimeoutSeconds),
          fStop(options.fStop),
          fChild(boost::make_shared<TrackingLauncher>(
              options.fLauncher != nullptr ? options.fLauncher : MakeLauncher())),
          fApp(boost::make_shared<StartAwareApp>(fChild)),
          fOutput(boost::make_shared<Capture>(options.fTakeOutput, options.fMaxKeptBytes)),
          fErrors(boost::make_shared<Capture>(options.fTakeErrors, options.fMaxKeptBytes))
    {}

    // Kills the program if an exception ended the run. The application is reset here, since its
    // last reference may otherwise be that of an output's thread: this thread and the launcher's
    // would wait for each other, up to the short wait.
    ~ProgramRun()
    {
        if (!fChild->GetEnd())
            TryKill(*fChild);
        CloseOutputs();
        try {
            fApp->Reset();
        } catch (...) {
            // As in the application's destructor.
        }
    }
    ProgramRun(const ProgramRun&) = delete;
    ProgramRun& operator=(const ProgramRun&) = delete;

    RunResult Run(const ChildCommand& command)
    {
        if (fStop != nullptr && fStop->IsRaised()) {
            fResult.fStopped = true;
            return std::move(fResult);
        }
        std::optional<StopListener> listener;
        if (fStop != nullptr)
            listener.emplace(*fStop, [child = fChild] { TryKill(*child); });
        try {
            fLaunch.SetConsoleApp(fApp);
            fLaunch.SetLaunchParams(LaunchParams(boost::make_shared<RunPump>(fOutput, fChild),
                                                 boost::make_shared<RunPump>(fErrors, fChild),
                                                 command.fArgs, command.fProgram));
            Launch();
            if (Follow())
                Join();
        } catch (const consoleapp::Exception& exc) {
            RethrowFailures(); // of the caller's functions first
            // After the program's end, which may come before Launch returns, the launcher's only
            // failure is to give up an output.
            if (exc.GetTaskID() != TaskID::kLauncher || !fChild->GetEnd())
                throw;
            fResult.fIsOutputOpen = true;
        }
        RethrowFailures();
        SetEnd();
        return std::move(fResult);
    }

private:
    void Launch()
    {
        // An interrupted launch would wait for a program that isn't killed.
        const boost::this_thread::disable_interruption uninterrupted;
        fLaunch.Launch();
    }

    // Waits until the program has ended or its launch has failed. Returns false if it can't be
    // killed.
    bool Follow()
    {
        if (AwaitEnd(fDeadline, true))
            return true;
        if (!fChild->IsKilled()) {
            fResult.fTimedOut = true;
            TryKill(*fChild);
        }
        return AwaitEnd(GetWaitClock() + ConsoleApp::GetDefaultWaitSeconds(), false);
    }

    // Returns false at the deadline, or with `orKill` when the program is killed.
    bool AwaitEnd(double deadline, bool orKill)
    {
        using Result = LaunchStart::Result;
        Result start = Result::kPending;
        do
            start = fApp->AwaitStart(std::min(GetTimeLeft(deadline), kStartPollSeconds));
        while (start == Result::kPending && GetTimeLeft(deadline) > 0.0 &&
               !(orKill && fChild->IsKilled()));
        if (start != Result::kRunning)
            return start == Result::kFailed;
        const double left = GetTimeLeft(deadline);
        return orKill ? fChild->AwaitEndOrKill(left) : fChild->AwaitEnd(left);
    }

    // Throws failures of the launch.
    void Join()
    {
        if (fLaunch.Wait(nullptr, ConsoleApp::GetDefaultWaitSeconds()) == State::kTimeout)
            fResult.fIsOutputOpen = true;
    }

    void CloseOutputs()
    {
        fOutput->Close();
        fErrors->Close();
    }

    void RethrowFailures()
    {
        CloseOutputs();
        fOutput->RethrowFailure();
        fErrors->RethrowFailure();
    }

    void SetEnd()
    {
        const std::optional<ChildEnd> end = fChild->GetEnd();
        fResult.fEnd = end ? GetEndState(end->fResult) : State::kTimeout;
        if (end) {
            fResult.fExitCode = end->fExitCode;
            fResult.fTerminationText = end->fTerminationText;
        }
        const bool wasKilled = fResult.fEnd == State::kKilled || fResult.fEnd == State::kTimeout;
        fResult.fTimedOut = fResult.fTimedOut && wasKilled;
        fResult.fStopped = wasKilled && !fResult.fTimedOut && fStop != nullptr && fStop->IsRaised();
        fResult.fOutput = fOutput->TakeText();
        fResult.fErrors = fErrors->TakeText();
        fResult.fDroppedBytes = fOutput->GetDroppedBytes() + fErrors->GetDroppedBytes();
    }

    const double fDeadline;
    StopRequest* const fStop;
    const boost::shared_ptr<TrackingLauncher> fChild;
    const boost::shared_ptr<StartAwareApp> fApp;
    const boost::shared_ptr<Capture> fOutput;
    const boost::shared_ptr<Capture> fErrors;
    ConsoleAppLauncher fLaunch;
    RunResult fResult;
};

} // namespace

RunResult RunProgram(const std::string& program, const std::vector<std::string>& args,
                     const RunOptions& options)
{
    return ProgramRun(options).Run(MakeChildCommand(program, args));
}

} // namespace pmutil
