// What the parties of a supervised launch say to each other: who they are, in which state the
// launch is, what is to be launched, and what failed.
#pragma once

#include <cstdint>
#include <deque>
#include <ostream>
#include <stdexcept>
#include <string>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/weak_ptr.hpp>

#include "pmutil/LaunchStart.h"

namespace pmutil {

class ConsoleApp;
class OutputTask;

// A party of a launch.
enum class TaskID : std::int32_t {
    kUndefined = -1,
    kClient = 0,
    kStdout = 1,
    kStderr = 2,
    kLauncher = 3
};

// The parties that consume the child's output. Every operation that takes one throws
// std::runtime_error "invalid OutputChannel" for any other value.
enum class OutputChannel : std::int32_t { kStdout = 1, kStderr = 2 };

// Arrays indexed by TaskID, of which the entries for the two output channels are used.
inline constexpr int kOutputSlots = 3;

enum class State : std::int32_t {
    kUndefined = -1,
    kIdle = 0,
    kLaunching = 1,
    kLaunched = 2,
    kRunning = 3,
    kFinishing = 4,
    kFinished = 5,
    kCrashed = 6,
    kKilling = 7,
    kKilled = 8,
    kTimeout = 9
};

// True for the states at which a wait for a state ends: Idle, Running, Finished, Crashed, Killed.
bool IsStable(State state);

// The points of a launch that can be made to fail.
enum class Fault : std::int32_t {
    kNoFault = 0,
    kNotifyLaunching = 1,
    kNotifyLaunched = 2,
    kNotifyRunning = 3,
    kNotifyFinished = 4,
    kNotifyOutputTaskBegin = 5,
    kNotifyOutputTaskEnd = 6,
    kLauncherLaunch = 7,
    kLauncherWait = 8,
    kLauncherKill = 9
};

// Each prints under its name, such as "Launcher", and an unknown value as "TaskID(7)".
std::ostream& operator<<(std::ostream& out, TaskID id);
std::ostream& operator<<(std::ostream& out, OutputChannel channel);
std::ostream& operator<<(std::ostream& out, State state);
std::ostream& operator<<(std::ostream& out, Fault fault);

// The channel as an index and as a party, checked.
int GetOutputIndex(OutputChannel channel);
TaskID GetTaskID(OutputChannel channel);
OutputChannel GetOutputChannel(TaskID id);

// What to launch, and who consumes its output.
// NOLINTNEXTLINE(bugprone-reserved-identifier): the compiler's own, which copies the array
class LaunchParams {
public:
    LaunchParams() = default;
    LaunchParams(boost::shared_ptr<OutputTask> stdoutTask, boost::shared_ptr<OutputTask> stderrTask,
                 std::deque<std::string> args, std::wstring program);

    // Empty if nobody consumes the channel: its pipe is closed then once the child runs, so that a
    // child that writes to it fails to, or on Linux dies of SIGPIPE.
    boost::shared_ptr<OutputTask> GetOutputTask(OutputChannel channel) const;
    void SetOutputTask(OutputChannel channel, boost::shared_ptr<OutputTask> task);

    std::wstring fProgram;         // the program's path
    std::deque<std::string> fArgs; // its arguments, without the program's name
    bool fKeepStdin = false;       // the client writes to the child's standard input

private:
    boost::shared_ptr<OutputTask> fOutputTasks[kOutputSlots];
};

namespace consoleapp {

// A failure of one party of a launch. The text is the party's name, ": " and the message, or
// "<nullptr>" for a null one.
class Exception : public std::runtime_error {
public:
    Exception(TaskID id, const char* message);

    TaskID GetTaskID() const { return fTaskID; }

private:
    TaskID fTaskID;
};

// The link by which the threads of one launch reach the application and the output tasks. It keeps
// neither alive. Any thread may use it.
class ExecutionData {
public:
    ExecutionData(boost::weak_ptr<ConsoleApp> app, boost::weak_ptr<OutputTask> stdoutTask,
                  boost::weak_ptr<OutputTask> stderrTask);
    ExecutionData(const ExecutionData&) = delete;
    ExecutionData& operator=(const ExecutionData&) = delete;

    // Empty if the application is gone or was reset. Clearing it gives the launch up, and with it a
    // start that is not over yet.
    boost::shared_ptr<ConsoleApp> GetConsoleApp() const;
    void ClearConsoleApp();
    bool HasConsoleApp() const;

    // Empty if the task is gone.
    boost::shared_ptr<OutputTask> GetOutputTask(OutputChannel channel) const;
    void SetOutputTask(OutputChannel channel, boost::weak_ptr<OutputTask> task);

    // Ended by the launcher's thread.
    LaunchStart& GetStart() { return fStart; }

private:
    mutable boost::mutex fMutex;
    boost::weak_ptr<ConsoleApp> fConsoleApp;
    boost::weak_ptr<OutputTask> fOutputTasks[kOutputSlots];
    LaunchStart fStart;
};

} // namespace consoleapp
} // namespace pmutil
