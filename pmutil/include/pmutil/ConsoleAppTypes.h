// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// The types of a supervised launch: its parties, its states, its parameters and its failures.
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

// The parties that read the child's output. Every function with such a parameter throws
// std::runtime_error "invalid OutputChannel" for any other value.
enum class OutputChannel : std::int32_t { kStdout = 1, kStderr = 2 };

// The size of arrays indexed by TaskID in which only the two output channels are used.
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

// Returns whether a wait for a state ends at `state`: Idle, Running, Finished, Crashed or Killed.
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

// Print the name of the value, such as "Launcher", and an unknown value as "TaskID(7)".
std::ostream& operator<<(std::ostream& out, TaskID id);
std::ostream& operator<<(std::ostream& out, OutputChannel channel);
std::ostream& operator<<(std::ostream& out, State state);
std::ostream& operator<<(std::ostream& out, Fault fault);

// Convert between a channel, its index and its party.
int GetOutputIndex(OutputChannel channel);
TaskID GetTaskID(OutputChannel channel);
OutputChannel GetOutputChannel(TaskID id);

// The program to launch, and the tasks that read its output.
// NOLINTNEXTLINE(bugprone-reserved-identifier): in code that the compiler generates for the array
class LaunchParams {
public:
    LaunchParams() = default;
    LaunchParams(boost::shared_ptr<OutputTask> stdoutTask, boost::shared_ptr<OutputTask> stderrTask,
                 std::deque<std::string> args, std::wstring program);

    // Without a task, the channel's pipe is closed as soon as the child runs: the child's writes
    // fail, and on Linux SIGPIPE ends it by default.
    boost::shared_ptr<OutputTask> GetOutputTask(OutputChannel channel) const;
    void SetOutputTask(OutputChannel channel, boost::shared_ptr<OutputTask> task);

    std::wstring fProgram;         // the program's path
    std::deque<std::string> fArgs; // its arguments, without the program's name
    bool fKeepStdin = false;       // keep the child's standard input open for the client

private:
    boost::shared_ptr<OutputTask> fOutputTasks[kOutputSlots];
};

namespace consoleapp {

// A failure of one party of a launch. The text is the party's name, ": " and the message
// ("<nullptr>" for a null message).
class Exception : public std::runtime_error {
public:
    Exception(TaskID id, const char* message);

    TaskID GetTaskID() const { return fTaskID; }

private:
    TaskID fTaskID;
};

// The reference of the threads of one launch to the application and the output tasks. Owns neither.
// Any thread may use it.
class ExecutionData {
public:
    ExecutionData(boost::weak_ptr<ConsoleApp> app, boost::weak_ptr<OutputTask> stdoutTask,
                  boost::weak_ptr<OutputTask> stderrTask);
    ExecutionData(const ExecutionData&) = delete;
    ExecutionData& operator=(const ExecutionData&) = delete;

    // Returns null if the application was destroyed or reset. ClearConsoleApp gives the launch up;
    // a start that isn't over fails.
    boost::shared_ptr<ConsoleApp> GetConsoleApp() const;
    void ClearConsoleApp();
    bool HasConsoleApp() const;

    // Returns null if the task was destroyed.
    boost::shared_ptr<OutputTask> GetOutputTask(OutputChannel channel) const;
    void SetOutputTask(OutputChannel channel, boost::weak_ptr<OutputTask> task);

    // The launcher's thread ends the start.
    LaunchStart& GetStart() { return fStart; }

private:
    mutable boost::mutex fMutex;
    boost::weak_ptr<ConsoleApp> fConsoleApp;
    boost::weak_ptr<OutputTask> fOutputTasks[kOutputSlots];
    LaunchStart fStart;
};

} // namespace consoleapp
} // namespace pmutil
