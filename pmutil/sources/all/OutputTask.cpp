#include "pmutil/OutputTask.h"

#include <limits>
#include <stdexcept>
#include <utility>

#include <boost/thread/lock_guard.hpp>

#include "all/ConsoleAppLog.h"
#include "all/WaitTime.h"

namespace pmutil {

using consoleapp::ExecutionData;

OutputTask::OutputTask() : ConsoleAppAccessor(TaskID::kUndefined, nullptr) {}

OutputTask::OutputTask(TaskID channel, boost::shared_ptr<ExecutionData> data,
                       boost::shared_ptr<Reader> reader)
    : ConsoleAppAccessor(channel, std::move(data)), fReader(std::move(reader))
{}

OutputTask::OutputTask(const OutputTask& other) : OutputTask()
{
    const boost::lock_guard<boost::mutex> lock(other.fMutex);
    AssignLocked(other);
}

OutputTask& OutputTask::operator=(const OutputTask& other)
{
    if (this != &other) {
        // The copy constructor locks the other, and throws if it is running.
        // NOLINTNEXTLINE(performance-unnecessary-copy-initialization)
        const OutputTask copy(other);
        const boost::lock_guard<boost::mutex> lock(fMutex);
        AssignLocked(copy);
    }
    return *this;
}

OutputTask::~OutputTask() = default;

void OutputTask::AssignLocked(const OutputTask& other)
{
    if (other.fIsRunning)
        throw std::runtime_error("OutputTask::AssignLocked: task is running");
    fTaskID = other.fTaskID;
    fExecutionData = other.fExecutionData;
    fReader = other.fReader;
    fIsRunning = other.fIsRunning;
}

void OutputTask::Prepare(OutputChannel channel, boost::shared_ptr<ExecutionData> data,
                         boost::shared_ptr<Reader> reader)
{
    const TaskID id = pmutil::GetTaskID(channel);
    const boost::lock_guard<boost::mutex> lock(fMutex);
    if (fIsInRun)
        throw std::runtime_error("OutputTask::Prepare: task is running");
    fTaskID = id;
    fExecutionData.swap(data);
    fReader.swap(reader);
    fIsPrepared = true;
}

void OutputTask::Run(const ExecutionData* launch)
{
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        PM_LOG(gConsoleAppLog, "OutputTask::Run " << fTaskID);
        if (launch != nullptr && launch != fExecutionData.get())
            throw consoleapp::Exception(fTaskID, "no output task");
        fIsPrepared = false;
        fIsInRun = true;
    }
    try {
        {
            Lock lock(fMutex);
            PM_LOG(gConsoleAppLog, "OutputTask::Run DoBegin");
            DoBegin(lock);
        }
        SetIsRunning(true);
        PM_LOG(gConsoleAppLog, "OutputTask::Run DoRun");
        DoRun();
        SetIsRunning(false);
        PM_LOG(gConsoleAppLog, "OutputTask::Run DoEnd");
        {
            Lock lock(fMutex);
            DoEnd(lock);
        }
        PM_LOG(gConsoleAppLog, "OutputTask::Run CloseReader");
        Lock lock(fMutex);
        fIsInRun = false;
        CloseReader(lock);
    } catch (...) {
        SetIsRunning(false);
        Lock lock(fMutex);
        fIsInRun = false;
        CloseReader(lock);
        throw;
    }
}

void OutputTask::Discard(const ExecutionData* launch) noexcept
{
    try {
        Lock lock(fMutex);
        if (!fIsPrepared || launch == nullptr || launch != fExecutionData.get())
            return;
        fExecutionData.reset();
        CloseReader(lock);
    } catch (...) {
        // The reader's owner closes it.
    }
}

void OutputTask::DoBegin(Lock& /*lock*/) {}
void OutputTask::DoRun() {}
void OutputTask::DoEnd(Lock& /*lock*/) {}

void OutputTask::CloseReader(Lock& /*lock*/)
{
    boost::shared_ptr<Reader> reader;
    reader.swap(fReader);
    if (reader != nullptr)
        reader->Close();
}

boost::shared_ptr<Reader> OutputTask::GetReader()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fReader;
}

void OutputTask::AwaitStart()
{
    boost::shared_ptr<ExecutionData> launch;
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        launch = fExecutionData;
    }
    if (launch != nullptr)
        launch->GetStart().Await(std::numeric_limits<double>::infinity());
}

bool OutputTask::IsRunning(double maxWaitSeconds)
{
    Lock lock(fMutex);
    return IsRunningLocked(lock, maxWaitSeconds);
}

bool OutputTask::IsRunningLocked(Lock& lock, double maxWaitSeconds)
{
    PM_LOG(gConsoleAppLog,
           "OutputTask::IsRunning " << fTaskID << " maxWaitSeconds=" << maxWaitSeconds);
    const double deadline = GetWaitClock() + maxWaitSeconds;
    while (!fIsRunning) {
        const double left = GetTimeLeft(deadline);
        if (left <= 0.0)
            break;
        PM_LOG(gConsoleAppLog, "OutputTask::IsRunningLocked waitSeconds=" << left);
        fCond.timed_wait(lock, ToWaitDuration(left));
        PM_LOG(gConsoleAppLog, "timed_wait returns");
    }
    PM_LOG(gConsoleAppLog, "IsRunningLocked returns " << fIsRunning);
    return fIsRunning;
}

void OutputTask::SetIsRunning(bool value)
{
    PM_LOG(gConsoleAppLog, "OutputTask::SetIsRunning(" << value << ")");
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fIsRunning = value;
    fCond.notify_all();
}

} // namespace pmutil
