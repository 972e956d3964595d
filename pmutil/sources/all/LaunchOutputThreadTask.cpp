#include "all/LaunchOutputThreadTask.h"

#include <utility>

#include "all/ConsoleAppLog.h"
#include "pmutil/OutputTask.h"
#include "pmutil/Threads.h"

namespace pmutil {

using consoleapp::Exception;
using consoleapp::ExecutionData;

LaunchOutputThreadTask::LaunchOutputThreadTask(OutputChannel channel,
                                               boost::shared_ptr<ExecutionData> data)
    : ConsoleAppAccessor(pmutil::GetTaskID(channel), std::move(data))
{}

LaunchOutputThreadTask::~LaunchOutputThreadTask() = default;

void LaunchOutputThreadTask::operator()()
{
    try {
        PM_LOG(gConsoleAppLog, "LaunchOutputThreadTask::operator()() fOutputChannel=" << fTaskID);
        SetCurrentThreadName(GetThreadLabel());
        NotifyOutputTaskBegin();
        ThrowIfFailurePending();
        const boost::shared_ptr<OutputTask> task = GetOutputTask(GetOutputChannel(fTaskID));
        task->Run(fExecutionData.get());
        ThrowIfFailurePending();
        NotifyOutputTaskEnd();
    } catch (const Exception& exc) {
        NotifyFailure(exc);
    } catch (const std::exception& exc) {
        NotifyFailure(Exception(fTaskID, exc.what()));
    } catch (...) {
        NotifyFailure(Exception(fTaskID, "LaunchOutputThreadTask failed"));
    }
}

} // namespace pmutil
