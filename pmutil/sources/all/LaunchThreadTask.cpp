#include "all/LaunchThreadTask.h"

#include <sstream>
#include <stdexcept>
#include <utility>

#include "all/ConsoleAppLog.h"
#include "all/EndState.h"
#include "all/LaunchOutputThreadTask.h"
#include "all/ThreadEnd.h"
#include "pmutil/OutputTask.h"
#include "pmutil/Threads.h"

namespace pmutil {

using consoleapp::Exception;
using consoleapp::ExecutionData;
using consoleapp::LaunchStart;

namespace {

constexpr OutputChannel kChannels[] = {OutputChannel::kStdout, OutputChannel::kStderr};

// Releases the outputs first, so that those without a task are closed when the child reads the end
// of its input.
void ReleaseEnds(LaunchResult& result)
{
    for (boost::shared_ptr<Reader>& reader : result.fAppOutput)
        reader.reset();
    result.fAppInput.reset();
}

} // namespace

LaunchThreadTask::LaunchThreadTask(boost::shared_ptr<ExecutionData> data,
                                   boost::shared_ptr<Launcher> launcher, LaunchParams params)
    : ConsoleAppAccessor(TaskID::kLauncher, std::move(data)),
      fLauncher(std::move(launcher)),
      fLaunchParams(std::move(params))
{}

LaunchThreadTask::~LaunchThreadTask() = default;

void LaunchThreadTask::operator()()
{
    try {
        SetCurrentThreadName(GetThreadLabel());
        PM_LOG(gConsoleAppLog, "LaunchThreadTask::operator()()");
        Threads threads;
        bool mustKill = false;
        LaunchResult result;
        try {
            RunLaunch(mustKill, result, threads);
        } catch (const Exception& exc) {
            PM_LOG(gConsoleAppLog, "LaunchThreadTask inner exception=" << exc.what());
            NotifyFailure(exc);
        } catch (const std::exception& exc) {
            PM_LOG(gConsoleAppLog, "LaunchThreadTask inner exception=" << exc.what());
            NotifyFailure(Exception(fTaskID, exc.what()));
        } catch (...) {
            PM_LOG(gConsoleAppLog, "LaunchThreadTask inner exception=?");
            NotifyFailure(Exception(fTaskID, "LaunchThreadTask failed"));
        }
        EndStart();
        CleanupLaunchThreadTask(mustKill, result, threads);
    } catch (const std::exception& exc) {
        PM_LOG(gConsoleAppLog, "LaunchThreadTask outer exception=" << exc.what());
    } catch (...) {
        PM_LOG(gConsoleAppLog, "LaunchThreadTask outer exception=?");
    }
    EndStart();
    for (const OutputChannel channel : kChannels)
        if (const boost::shared_ptr<OutputTask> task = fLaunchParams.GetOutputTask(channel))
            task->Discard(fExecutionData.get());
}

// Ends a start that isn't over as failed, so that the output tasks can end.
void LaunchThreadTask::EndStart()
{
    if (fExecutionData != nullptr)
        fExecutionData->GetStart().End(LaunchStart::Result::kFailed);
}

// Sets `mustKill` while the child runs. `result` belongs to the caller, so that after a failure the
// child doesn't read the end of its input before it is killed.
void LaunchThreadTask::RunLaunch(bool& mustKill, LaunchResult& result, Threads& threads)
{
    NotifyLaunching();
    for (const OutputChannel channel : kChannels) {
        std::ostringstream label;
        label << channel;
        threads[GetOutputIndex(channel)].SetName(label.str().c_str());
    }
    ThrowIfInjected(Fault::kLauncherLaunch, "LauncherLaunch");
    result = fLauncher->Launch(fLaunchParams.fProgram, fLaunchParams.fArgs);
    mustKill = true;
    NotifyLaunched();

    const boost::shared_ptr<ExecutionData> data = GetExecutionData();
    for (const OutputChannel channel : kChannels) {
        const int index = GetOutputIndex(channel);
        StartOutputTask(channel, data, result.fAppOutput[index], threads[index]);
    }
    NotifyRunning(result);
    data->GetStart().End(LaunchStart::Result::kRunning);

    // Release this thread's references to the pipes: the child's input ends when the client closes
    // its writer, and each reader is closed by its task.
    ReleaseEnds(result);

    ThrowIfInjected(Fault::kLauncherWait, "LauncherWait");
    PM_LOG(gConsoleAppLog, "calling fLauncher->Wait");
    int exitCode = 0;
    const WaitResult waited = fLauncher->Wait(&exitCode);
    mustKill = false;
    PM_LOG(gConsoleAppLog, "fLauncher->Wait returns " << waited << " exitCode=" << exitCode);
    NotifyFinished(exitCode, GetEndState(waited));
}

void LaunchThreadTask::StartOutputTask(OutputChannel channel,
                                       const boost::shared_ptr<ExecutionData>& data,
                                       const boost::shared_ptr<Reader>& reader,
                                       ManagedThread& thread)
{
    PM_LOG(gConsoleAppLog,
           "LaunchThreadTask fAppOutput[" << channel << "] use_count=" << reader.use_count());
    const boost::shared_ptr<OutputTask> task = fLaunchParams.GetOutputTask(channel);
    data->SetOutputTask(channel, task);
    if (task == nullptr)
        return;
    task->Prepare(channel, data, reader);
    {
        const LaunchOutputThreadTask body(channel, data);
        thread.Assign(StartThread(body).release());
    }
    PM_LOG(gConsoleAppLog, "LaunchThreadTask OutputThreadTask spawned, use_count["
                               << channel << "]=" << reader.use_count());
    if (task->IsRunning(ConsoleApp::GetShortWaitSeconds()))
        return;
    // Prefer the failure of the output thread.
    ThrowIfFailurePending();
    std::ostringstream text;
    text << "LauncherTask: output task " << channel << " never started";
    PM_LOG(gConsoleAppLog, text.str());
    throw std::runtime_error(text.str());
}

void LaunchThreadTask::CleanupLaunchThreadTask(bool mustKill, LaunchResult& result,
                                               Threads& threads)
{
    PM_LOG(gConsoleAppLog, "LaunchThreadTask::CleanupLaunchThreadTask mustKill=" << mustKill);
    if (mustKill) {
        // Kill the child even if the application no longer exists; then there is no fault either.
        const boost::shared_ptr<ConsoleApp> app = GetExecutionData()->GetConsoleApp();
        if (app != nullptr)
            app->ThrowIfInjected(fTaskID, Fault::kLauncherKill, "LauncherKill",
                                 fExecutionData.get());
        PM_LOG(gConsoleAppLog, "CleanupLaunchThreadTask: calling fLauncher->Kill()");
        fLauncher->Kill();
        ReleaseEnds(result);
    }
    for (const OutputChannel channel : kChannels) {
        ManagedThread& thread = threads[GetOutputIndex(channel)];
        if (!thread.HoldsThread())
            continue;
        const double wait = ConsoleApp::GetShortWaitSeconds();
        PM_LOG(gConsoleAppLog, "CleanupLaunchThreadTask: joining output task thread for "
                                   << channel << " maxWait=" << wait);
        if (thread.TimedJoin(wait))
            continue;
        PM_LOG(gConsoleAppLog,
               "CleanupLaunchThreadTask: giving up waiting for output task " << channel);
        thread.Abandon();
        NotifyFailure(Exception(fTaskID, "output task thread abandoned"));
    }
}

} // namespace pmutil
