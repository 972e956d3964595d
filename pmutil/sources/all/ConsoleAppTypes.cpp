#include "pmutil/ConsoleAppTypes.h"

#include <sstream>
#include <utility>

#include <boost/thread/lock_guard.hpp>

#include "pmutil/OutputTask.h"

namespace pmutil {

namespace {

// The mask of stable states; the bit number is the state's value.
constexpr unsigned kStableStates = 0x169;
constexpr unsigned kMaxStableState = 8;

// Prints the name of an enumerator; names[0] is that of the value `first`.
template <std::size_t count>
std::ostream& Print(std::ostream& out, const char* type, const char* const (&names)[count],
                    int first, int value)
{
    if (value >= first && value < first + static_cast<int>(count))
        return out << names[value - first];
    return out << type << '(' << value << ')';
}

std::string MakeText(TaskID id, const char* message)
{
    std::ostringstream text;
    text << id << ": " << (message != nullptr ? message : "<nullptr>");
    return text.str();
}

} // namespace

bool IsStable(State state)
{
    const auto value = static_cast<unsigned>(state);
    return value <= kMaxStableState && (kStableStates >> value & 1) != 0;
}

std::ostream& operator<<(std::ostream& out, TaskID id)
{
    static constexpr const char* kNames[] = {"Undefined", "Client", "stdout", "stderr", "Launcher"};
    return Print(out, "TaskID", kNames, -1, static_cast<int>(id));
}

std::ostream& operator<<(std::ostream& out, OutputChannel channel)
{
    return out << static_cast<TaskID>(channel);
}

std::ostream& operator<<(std::ostream& out, State state)
{
    static constexpr const char* kNames[] = {"Undefined", "Idle",      "Launching", "Launched",
                                             "Running",   "Finishing", "Finished",  "Crashed",
                                             "Killing",   "Killed",    "Timeout"};
    return Print(out, "State", kNames, -1, static_cast<int>(state));
}

std::ostream& operator<<(std::ostream& out, Fault fault)
{
    static constexpr const char* kNames[] = {
        "NoFault",        "NotifyLaunching",       "NotifyLaunched",      "NotifyRunning",
        "NotifyFinished", "NotifyOutputTaskBegin", "NotifyOutputTaskEnd", "LauncherLaunch",
        "LauncherWait",   "LauncherKill"};
    return Print(out, "Fault", kNames, 0, static_cast<int>(fault));
}

int GetOutputIndex(OutputChannel channel)
{
    if (channel != OutputChannel::kStdout && channel != OutputChannel::kStderr)
        throw std::runtime_error("invalid OutputChannel");
    return static_cast<int>(channel);
}

TaskID GetTaskID(OutputChannel channel)
{
    return static_cast<TaskID>(GetOutputIndex(channel));
}

OutputChannel GetOutputChannel(TaskID id)
{
    const auto channel = static_cast<OutputChannel>(id);
    GetOutputIndex(channel);
    return channel;
}

LaunchParams::LaunchParams(boost::shared_ptr<OutputTask> stdoutTask,
                           boost::shared_ptr<OutputTask> stderrTask, std::deque<std::string> args,
                           std::wstring program)
    : fProgram(std::move(program)), fArgs(std::move(args))
{
    SetOutputTask(OutputChannel::kStdout, std::move(stdoutTask));
    SetOutputTask(OutputChannel::kStderr, std::move(stderrTask));
}

boost::shared_ptr<OutputTask> LaunchParams::GetOutputTask(OutputChannel channel) const
{
    return fOutputTasks[GetOutputIndex(channel)];
}

void LaunchParams::SetOutputTask(OutputChannel channel, boost::shared_ptr<OutputTask> task)
{
    fOutputTasks[GetOutputIndex(channel)].swap(task);
}

namespace consoleapp {

Exception::Exception(TaskID id, const char* message)
    : std::runtime_error(MakeText(id, message)), fTaskID(id)
{}

ExecutionData::ExecutionData(boost::weak_ptr<ConsoleApp> app,
                             boost::weak_ptr<OutputTask> stdoutTask,
                             boost::weak_ptr<OutputTask> stderrTask)
    : fConsoleApp(std::move(app))
{
    fOutputTasks[GetOutputIndex(OutputChannel::kStdout)].swap(stdoutTask);
    fOutputTasks[GetOutputIndex(OutputChannel::kStderr)].swap(stderrTask);
}

boost::shared_ptr<ConsoleApp> ExecutionData::GetConsoleApp() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fConsoleApp.lock();
}

void ExecutionData::ClearConsoleApp()
{
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fConsoleApp.reset();
    }
    fStart.End(LaunchStart::Result::kFailed);
}

bool ExecutionData::HasConsoleApp() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return !fConsoleApp.expired();
}

boost::shared_ptr<OutputTask> ExecutionData::GetOutputTask(OutputChannel channel) const
{
    const int index = GetOutputIndex(channel);
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fOutputTasks[index].lock();
}

void ExecutionData::SetOutputTask(OutputChannel channel, boost::weak_ptr<OutputTask> task)
{
    const int index = GetOutputIndex(channel);
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fOutputTasks[index].swap(task);
}

} // namespace consoleapp
} // namespace pmutil
