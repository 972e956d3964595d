#include "pmutil/ConsoleAppAccessor.h"

#include <sstream>
#include <stdexcept>
#include <utility>

#include <boost/thread/lock_guard.hpp>

#include "all/ConsoleAppLog.h"
#include "pmutil/OutputTask.h"
#include "pmutil/Threads.h"

namespace pmutil {

using consoleapp::Exception;
using consoleapp::ExecutionData;

namespace {

TaskID CopyIfValid(TaskID id)
{
    if (id < TaskID::kUndefined || id > TaskID::kLauncher)
        throw std::runtime_error("ConsoleAppAccessor::CopyIfValid invalid TaskID");
    return id;
}

} // namespace

ConsoleAppAccessor::ConsoleAppAccessor(TaskID id, boost::shared_ptr<ExecutionData> data)
    : fTaskID(CopyIfValid(id)), fExecutionData(std::move(data))
{}

ConsoleAppAccessor::ConsoleAppAccessor(const ConsoleAppAccessor& other)
    : ConsoleAppAccessor(other.CopyFields())
{}

ConsoleAppAccessor::ConsoleAppAccessor(Fields fields)
    : fTaskID(fields.id), fExecutionData(std::move(fields.data))
{}

ConsoleAppAccessor::Fields ConsoleAppAccessor::CopyFields() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return {fTaskID, fExecutionData};
}

ConsoleAppAccessor& ConsoleAppAccessor::operator=(const ConsoleAppAccessor& other)
{
    if (this != &other) {
        Fields fields = other.CopyFields();
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fTaskID = fields.id;
        fExecutionData.swap(fields.data);
    }
    return *this;
}

ConsoleAppAccessor::~ConsoleAppAccessor() = default;

boost::shared_ptr<ExecutionData> ConsoleAppAccessor::GetExecutionData() const
{
    if (fExecutionData == nullptr)
        throw Exception(fTaskID, "no ExecutionData");
    return fExecutionData;
}

boost::shared_ptr<ConsoleApp> ConsoleAppAccessor::GetConsoleApp() const
{
    boost::shared_ptr<ConsoleApp> app = GetExecutionData()->GetConsoleApp();
    if (app == nullptr)
        throw Exception(fTaskID, "no console app");
    return app;
}

boost::shared_ptr<OutputTask> ConsoleAppAccessor::GetOutputTask(OutputChannel channel) const
{
    boost::shared_ptr<OutputTask> task = GetExecutionData()->GetOutputTask(channel);
    if (task == nullptr)
        throw Exception(fTaskID, "no output task");
    return task;
}

std::string ConsoleAppAccessor::GetThreadLabel() const
{
    std::ostringstream label;
    label << GetCurrentThreadIDString() << "(app." << fTaskID << ")";
    return label.str();
}

State ConsoleAppAccessor::GetState(double /*maxWaitSeconds*/)
{
    if (fExecutionData == nullptr)
        return State::kIdle;
    const boost::shared_ptr<ConsoleApp> app = fExecutionData->GetConsoleApp();
    if (app == nullptr) {
        fExecutionData.reset();
        return State::kIdle;
    }
    return app->GetState(ConsoleApp::GetDefaultStateWaitSeconds());
}

void ConsoleAppAccessor::Reset()
{
    GetConsoleApp()->Reset();
    fExecutionData.reset();
}

void ConsoleAppAccessor::Launch(const boost::shared_ptr<ExecutionData>& data,
                                const LaunchParams& params)
{
    fExecutionData = data;
    GetConsoleApp()->Launch(data, params);
}

State ConsoleAppAccessor::Wait(int* exitCode, double maxWaitSeconds)
{
    return GetConsoleApp()->Wait(exitCode, maxWaitSeconds);
}

void ConsoleAppAccessor::Kill()
{
    GetConsoleApp()->Kill();
}

void ConsoleAppAccessor::CloseAppStdin()
{
    GetConsoleApp()->CloseAppStdin();
}

void ConsoleAppAccessor::WriteAppStdin(const unsigned char* data, std::size_t nbytes)
{
    GetConsoleApp()->WriteAppStdin(data, nbytes);
}

void ConsoleAppAccessor::WritelnAppStdin(const char* str)
{
    GetConsoleApp()->WritelnAppStdin(str);
}

void ConsoleAppAccessor::WritelnAppStdin(const std::string& str)
{
    GetConsoleApp()->WritelnAppStdin(str);
}

void ConsoleAppAccessor::ThrowIfFailurePending()
{
    GetConsoleApp()->ThrowIfFailurePending(fExecutionData.get());
}

void ConsoleAppAccessor::ThrowIfInjected(Fault fault, const char* caller)
{
    GetConsoleApp()->ThrowIfInjected(fTaskID, fault, caller, fExecutionData.get());
}

void ConsoleAppAccessor::SetInjectedFault(Fault fault)
{
    GetConsoleApp()->SetInjectedFault(fault);
}

void ConsoleAppAccessor::NotifyFailure(const Exception& exc) noexcept
{
    try {
        GetConsoleApp()->NotifyFailure(exc, fExecutionData.get());
    } catch (const std::exception& reason) {
        PM_LOG(gConsoleAppLog, "ConsoleAppAccessor::NotifyFailure exc="
                                   << exc.what() << " could not notify app because "
                                   << reason.what());
    } catch (...) {
        PM_LOG(gConsoleAppLog, "ConsoleAppAccessor::NotifyFailure exc="
                                   << exc.what()
                                   << " could not notify app because of unknown exception");
    }
}

boost::shared_ptr<ConsoleApp> ConsoleAppAccessor::GetConsoleAppFor(TaskID id) const
{
    if (fTaskID != id)
        throw std::runtime_error("ConsoleAppAccessor::GetConsoleAppFor wrong TaskID");
    return GetConsoleApp();
}

boost::shared_ptr<ConsoleApp> ConsoleAppAccessor::GetConsoleAppIf(bool condition) const
{
    if (!condition)
        throw std::runtime_error("ConsoleAppAccessor::GetConsoleAppIf condition not ok");
    return GetConsoleApp();
}

bool ConsoleAppAccessor::IsOutputChannel() const
{
    return fTaskID == TaskID::kStdout || fTaskID == TaskID::kStderr;
}

void ConsoleAppAccessor::NotifyLaunching()
{
    GetConsoleAppFor(TaskID::kLauncher)->NotifyLaunching(fTaskID, fExecutionData.get());
}

void ConsoleAppAccessor::NotifyLaunched()
{
    GetConsoleAppFor(TaskID::kLauncher)->NotifyLaunched(fTaskID, fExecutionData.get());
}

void ConsoleAppAccessor::NotifyRunning(const LaunchResult& result)
{
    GetConsoleAppFor(TaskID::kLauncher)->NotifyRunning(fTaskID, result, fExecutionData.get());
}

void ConsoleAppAccessor::NotifyFinished(int exitCode, State state)
{
    GetConsoleAppFor(TaskID::kLauncher)
        ->NotifyFinished(fTaskID, exitCode, state, fExecutionData.get());
}

void ConsoleAppAccessor::NotifyOutputTaskBegin()
{
    GetConsoleAppIf(IsOutputChannel())
        ->NotifyOutputTaskBegin(GetOutputChannel(fTaskID), fExecutionData.get());
}

void ConsoleAppAccessor::NotifyOutputTaskEnd()
{
    GetConsoleAppIf(IsOutputChannel())
        ->NotifyOutputTaskEnd(GetOutputChannel(fTaskID), fExecutionData.get());
}

} // namespace pmutil
