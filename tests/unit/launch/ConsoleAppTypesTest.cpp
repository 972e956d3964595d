#include "pmutil/ConsoleAppTypes.h"

#include <boost/make_shared.hpp>
#include <gtest/gtest.h>
#include <sstream>

#include "Throws.h"
#include "pmutil/OutputTask.h"

using namespace pmutil;

namespace {

template <typename T>
std::string Text(T value)
{
    std::ostringstream text;
    text << value;
    return text.str();
}

TEST(ConsoleAppTypes, TaskIDsPrintUnderTheirNames)
{
    EXPECT_EQ(Text(TaskID::kUndefined), "Undefined");
    EXPECT_EQ(Text(TaskID::kClient), "Client");
    EXPECT_EQ(Text(TaskID::kStdout), "stdout");
    EXPECT_EQ(Text(TaskID::kStderr), "stderr");
    EXPECT_EQ(Text(TaskID::kLauncher), "Launcher");
    EXPECT_EQ(Text(static_cast<TaskID>(4)), "TaskID(4)");
    EXPECT_EQ(Text(static_cast<TaskID>(-2)), "TaskID(-2)");
    EXPECT_EQ(Text(OutputChannel::kStdout), "stdout");
    EXPECT_EQ(Text(OutputChannel::kStderr), "stderr");
}

TEST(ConsoleAppTypes, StatesPrintUnderTheirNames)
{
    const char* const names[] = {"Undefined", "Idle",      "Launching", "Launched",
                                 "Running",   "Finishing", "Finished",  "Crashed",
                                 "Killing",   "Killed",    "Timeout"};
    for (int value = -1; value <= 9; ++value)
        EXPECT_EQ(Text(static_cast<State>(value)), names[value + 1]);
    EXPECT_EQ(Text(static_cast<State>(10)), "State(10)");
}

TEST(ConsoleAppTypes, StableStates)
{
    for (const State state :
         {State::kIdle, State::kRunning, State::kFinished, State::kCrashed, State::kKilled})
        EXPECT_TRUE(IsStable(state)) << state;
    for (const State state :
         {State::kUndefined, State::kLaunching, State::kLaunched, State::kFinishing,
          State::kKilling, State::kTimeout, static_cast<State>(32), static_cast<State>(35)})
        EXPECT_FALSE(IsStable(state)) << state;
}

TEST(ConsoleAppTypes, FaultsPrintUnderTheirNames)
{
    const char* const names[] = {
        "NoFault",        "NotifyLaunching",       "NotifyLaunched",      "NotifyRunning",
        "NotifyFinished", "NotifyOutputTaskBegin", "NotifyOutputTaskEnd", "LauncherLaunch",
        "LauncherWait",   "LauncherKill"};
    for (int value = 0; value <= 9; ++value)
        EXPECT_EQ(Text(static_cast<Fault>(value)), names[value]);
    EXPECT_EQ(Text(static_cast<Fault>(10)), "Fault(10)");
    EXPECT_EQ(Text(static_cast<Fault>(-1)), "Fault(-1)");
}

TEST(ConsoleAppTypes, ExceptionTellsWhoAndWhat)
{
    const consoleapp::Exception exc(TaskID::kLauncher, "no wings");
    EXPECT_STREQ(exc.what(), "Launcher: no wings");
    EXPECT_EQ(exc.GetTaskID(), TaskID::kLauncher);
    EXPECT_STREQ(consoleapp::Exception(TaskID::kStdout, nullptr).what(), "stdout: <nullptr>");
    const consoleapp::Exception copy = exc;
    EXPECT_STREQ(copy.what(), "Launcher: no wings");
}

TEST(ConsoleAppTypes, OnlyOutputChannelsPassForOne)
{
    const auto task = boost::make_shared<OutputTask>();
    LaunchParams params;
    consoleapp::ExecutionData data({}, {}, {});
    for (const int bad : {-1, 0, 3, 4}) {
        const auto channel = static_cast<OutputChannel>(bad);
        EXPECT_TRUE(
            ThrowsRuntimeError("invalid OutputChannel", [&] { params.GetOutputTask(channel); }));
        EXPECT_TRUE(ThrowsRuntimeError("invalid OutputChannel",
                                       [&] { params.SetOutputTask(channel, task); }));
        EXPECT_TRUE(
            ThrowsRuntimeError("invalid OutputChannel", [&] { data.GetOutputTask(channel); }));
        EXPECT_TRUE(ThrowsRuntimeError("invalid OutputChannel",
                                       [&] { data.SetOutputTask(channel, task); }));
    }
}

TEST(ConsoleAppTypes, LaunchParamsAreAValue)
{
    const auto out = boost::make_shared<OutputTask>();
    const auto err = boost::make_shared<OutputTask>();
    const LaunchParams params(out, err, {"a", "b"}, L"program");
    LaunchParams copy;
    EXPECT_FALSE(copy.fKeepStdin);
    copy = params;
    EXPECT_EQ(copy.GetOutputTask(OutputChannel::kStdout), out);
    EXPECT_EQ(copy.GetOutputTask(OutputChannel::kStderr), err);
    EXPECT_EQ(copy.fArgs, params.fArgs);
    EXPECT_EQ(copy.fProgram, L"program");
}

TEST(ConsoleAppTypes, ExecutionDataKeepsNothingAlive)
{
    auto out = boost::make_shared<OutputTask>();
    consoleapp::ExecutionData data({}, out, {});
    EXPECT_EQ(data.GetOutputTask(OutputChannel::kStdout), out);
    EXPECT_EQ(data.GetOutputTask(OutputChannel::kStderr), nullptr);
    data.SetOutputTask(OutputChannel::kStderr, out);
    EXPECT_EQ(data.GetOutputTask(OutputChannel::kStderr), out);
    out.reset();
    EXPECT_EQ(data.GetOutputTask(OutputChannel::kStdout), nullptr);
    EXPECT_EQ(data.GetConsoleApp(), nullptr);
}

} // namespace
