#include "pmutil/ConsoleAppLauncher.h"

#include <gtest/gtest.h>

#include "FakeLauncher.h"
#include "RecordingLogger.h"
#include "Throws.h"
#include "pmutil/Threads.h"

using namespace pmutil;
using consoleapp::Exception;

namespace {

struct Parts {
    LongShortWait longShortWait;
    boost::shared_ptr<FakeLauncher> platform = boost::make_shared<FakeLauncher>();
    boost::shared_ptr<RecordingApp> app = boost::make_shared<RecordingApp>(platform);
    boost::shared_ptr<PatientTask> out = boost::make_shared<PatientTask>();
    boost::shared_ptr<consoleapp::ExecutionData> data =
        boost::make_shared<consoleapp::ExecutionData>(boost::weak_ptr<ConsoleApp>(app),
                                                      boost::weak_ptr<OutputTask>(out),
                                                      boost::weak_ptr<OutputTask>());

    ~Parts() { End(); }
    void End()
    {
        out->fGate.Open();
        platform->End(kEndedNormally);
    }
    ConsoleAppLauncher MakeLauncher() const
    {
        ConsoleAppLauncher launcher;
        launcher.SetConsoleApp(app);
        launcher.SetLaunchParams(LaunchParams(out, nullptr, {}, L"program"));
        return launcher;
    }
};

TEST(ExecutionData, HasTheTaskOfEachOutput)
{
    const boost::shared_ptr<OutputTask> out = boost::make_shared<PatientTask>();
    const boost::shared_ptr<OutputTask> err = boost::make_shared<PatientTask>();
    const consoleapp::ExecutionData data{boost::weak_ptr<ConsoleApp>(),
                                         boost::weak_ptr<OutputTask>(out),
                                         boost::weak_ptr<OutputTask>(err)};
    EXPECT_EQ(data.GetOutputTask(OutputChannel::kStdout), out);
    EXPECT_EQ(data.GetOutputTask(OutputChannel::kStderr), err);
}

TEST(ConsoleAppAccessor, ChecksItsTaskID)
{
    for (const int bad : {-2, 4, 100})
        EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppAccessor::CopyIfValid invalid TaskID", [&] {
            ConsoleAppAccessor(static_cast<TaskID>(bad), nullptr);
        }));
    for (int good = -1; good <= 3; ++good)
        EXPECT_EQ(ConsoleAppAccessor(static_cast<TaskID>(good), nullptr).GetTaskID(),
                  static_cast<TaskID>(good));
}

TEST(ConsoleAppAccessor, WithoutExecutionData)
{
    ConsoleAppAccessor accessor(TaskID::kStdout, nullptr);
    const auto fails = [](auto call) {
        return ThrowsExactly<Exception>("stdout: no ExecutionData", call);
    };
    EXPECT_TRUE(fails([&] { accessor.GetConsoleApp(); }));
    EXPECT_TRUE(fails([&] { accessor.GetExecutionData(); }));
    EXPECT_TRUE(fails([&] { accessor.GetOutputTask(OutputChannel::kStdout); }));
    EXPECT_TRUE(fails([&] { accessor.Kill(); }));
    EXPECT_TRUE(fails([&] { accessor.Reset(); }));
    EXPECT_EQ(accessor.GetState(0.0), State::kIdle);
    accessor.NotifyFailure(Exception(TaskID::kStdout, "swallowed"));
}

TEST(ConsoleAppAccessor, OfAnAppThatIsGone)
{
    Parts parts;
    ConsoleAppAccessor accessor(TaskID::kLauncher, parts.data);
    EXPECT_EQ(accessor.GetConsoleApp(), parts.app);
    parts.app.reset();
    EXPECT_TRUE(
        ThrowsExactly<Exception>("Launcher: no console app", [&] { accessor.GetConsoleApp(); }));
    accessor.NotifyFailure(Exception(TaskID::kStdout, "swallowed"));
    EXPECT_EQ(accessor.GetState(0.0), State::kIdle);
    EXPECT_TRUE(ThrowsExactly<Exception>("Launcher: no ExecutionData", [&] {
        accessor.GetExecutionData();
    })) << "it forgot its data";
}

TEST(ConsoleAppAccessor, LogsAFailureThatItCannotNotify)
{
    const DebugValueSetter log("ConsoleAppLog", 1);
    const RecordingLogger logger;
    ConsoleAppAccessor accessor(TaskID::kStdout, nullptr);
    accessor.NotifyFailure(Exception(TaskID::kStderr, "first"));
    ASSERT_EQ(logger.lines.size(), 1U);
    EXPECT_EQ(MessageOf(logger.lines[0]),
              "ConsoleAppAccessor::NotifyFailure exc=stderr: first could not notify app because "
              "stdout: no ExecutionData\n");
}

TEST(ConsoleAppAccessor, OfATaskThatIsGone)
{
    Parts parts;
    const ConsoleAppAccessor accessor(TaskID::kStdout, parts.data);
    EXPECT_EQ(accessor.GetOutputTask(OutputChannel::kStdout), parts.out);
    EXPECT_TRUE(ThrowsExactly<Exception>("stdout: no output task",
                                         [&] { accessor.GetOutputTask(OutputChannel::kStderr); }));
    EXPECT_TRUE(ThrowsRuntimeError("invalid OutputChannel",
                                   [&] { accessor.GetOutputTask(static_cast<OutputChannel>(3)); }));
}

TEST(ConsoleAppAccessor, NotificationsCheckTheSender)
{
    Parts parts;
    LaunchResult result;
    for (const TaskID id :
         {TaskID::kUndefined, TaskID::kClient, TaskID::kStdout, TaskID::kStderr}) {
        ConsoleAppAccessor accessor(id, parts.data);
        const auto wrong = [](auto call) {
            return ThrowsRuntimeError("ConsoleAppAccessor::GetConsoleAppFor wrong TaskID", call);
        };
        EXPECT_TRUE(wrong([&] { accessor.NotifyLaunching(); }));
        EXPECT_TRUE(wrong([&] { accessor.NotifyLaunched(); }));
        EXPECT_TRUE(wrong([&] { accessor.NotifyRunning(result); }));
        EXPECT_TRUE(wrong([&] { accessor.NotifyFinished(0, State::kFinished); }));
    }
    for (const TaskID id : {TaskID::kUndefined, TaskID::kClient, TaskID::kLauncher}) {
        ConsoleAppAccessor accessor(id, parts.data);
        const auto wrong = [](auto call) {
            return ThrowsRuntimeError("ConsoleAppAccessor::GetConsoleAppIf condition not ok", call);
        };
        EXPECT_TRUE(wrong([&] { accessor.NotifyOutputTaskBegin(); }));
        EXPECT_TRUE(wrong([&] { accessor.NotifyOutputTaskEnd(); }));
    }
    ConsoleAppAccessor(TaskID::kStderr, parts.data).NotifyOutputTaskBegin();
    EXPECT_EQ(parts.app->Events(), std::vector<std::string>{"begin stderr"});
}

TEST(ConsoleAppAccessor, ForwardsToTheApp)
{
    Parts parts;
    ConsoleAppAccessor accessor(TaskID::kStderr, parts.data);
    accessor.SetInjectedFault(Fault::kLauncherWait);
    EXPECT_TRUE(ThrowsExactly<Exception>(
        "stderr: here", [&] { accessor.ThrowIfInjected(Fault::kLauncherWait, "here"); }));
    accessor.NotifyFailure(Exception(TaskID::kStdout, "stored"));
    EXPECT_TRUE(
        ThrowsExactly<Exception>("stdout: stored", [&] { accessor.ThrowIfFailurePending(); }));
    EXPECT_EQ(accessor.Wait(nullptr, 0.0), State::kIdle);
    accessor.Kill();
    accessor.CloseAppStdin();
    EXPECT_THROW(accessor.WritelnAppStdin(static_cast<const char*>(nullptr)),
                 std::invalid_argument);
    EXPECT_EQ(accessor.GetState(0.0), State::kIdle);
    accessor.Reset();
    EXPECT_THROW(accessor.GetExecutionData(), Exception);
}

TEST(ConsoleAppAccessor, GetStateIgnoresItsArgument)
{
    Parts parts;
    ConsoleAppAccessor accessor(TaskID::kClient, parts.data);
    parts.app->SetState(State::kLaunched);
    constexpr double kDays = 1e6;
    EXPECT_EQ(accessor.GetState(kDays), State::kTimeout);
    parts.app->Reset();
}

TEST(ConsoleAppAccessor, ThreadLabel)
{
    const ConsoleAppAccessor accessor(TaskID::kLauncher, nullptr);
    EXPECT_EQ(accessor.GetThreadLabel(), GetCurrentThreadIDString() + "(app.Launcher)");
}

TEST(ConsoleAppAccessor, CopiesTakeIdAndData)
{
    const Parts parts;
    const ConsoleAppAccessor accessor(TaskID::kStdout, parts.data);
    const ConsoleAppAccessor copy(accessor);
    EXPECT_EQ(copy.GetTaskID(), TaskID::kStdout);
    EXPECT_EQ(copy.GetExecutionData(), parts.data);
    ConsoleAppAccessor assigned(TaskID::kClient, nullptr);
    assigned = accessor;
    const ConsoleAppAccessor& same = assigned;
    assigned = same;
    EXPECT_EQ(assigned.GetTaskID(), TaskID::kStdout);
    EXPECT_EQ(assigned.GetExecutionData(), parts.data);
}

TEST(ConsoleAppLauncher, NeedsAnApp)
{
    ConsoleAppLauncher launcher;
    EXPECT_TRUE(
        ThrowsRuntimeError("ConsoleAppLauncher: no ConsoleApp", [&] { launcher.Launch(); }));
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher: no ConsoleApp",
                                   [&] { launcher.LaunchAndWait(nullptr, 0.0); }));
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode, 100.0), State::kIdle);
    EXPECT_EQ(exitCode, -1);
}

TEST(ConsoleAppLauncher, RefusesChangesAfterALaunch)
{
    Parts parts;
    ConsoleAppLauncher launcher = parts.MakeLauncher();
    launcher.Launch();
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::SetLaunchParams: already launched",
                                   [&] { launcher.SetLaunchParams({}); }));
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::SetConsoleApp: already launched",
                                   [&] { launcher.SetConsoleApp(nullptr); }));
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::Launch: already launched",
                                   [&] { launcher.Launch(); }));
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::Launch: already launched",
                                   [&] { launcher.LaunchAndWait(nullptr, 0.0); }));
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::SetLaunchParams: already launched",
                                   [&] { const ConsoleAppLauncher copy(launcher); }));
    ConsoleAppLauncher other;
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher::SetLaunchParams: already launched",
                                   [&] { other = launcher; }));
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleAppLauncher: can't assign while running",
                                   [&] { launcher = other; }));
    EXPECT_EQ(launcher.Wait(nullptr, 0.0), State::kTimeout);
    EXPECT_THROW(launcher.Launch(), std::runtime_error) << "a timeout keeps the launch";
    parts.End();
    EXPECT_EQ(launcher.Wait(nullptr, kLong), State::kFinished);
    parts.out->fGate.Close();
    launcher.Launch();
    parts.End();
    EXPECT_EQ(launcher.Wait(nullptr, kLong), State::kFinished);
}

TEST(ConsoleAppLauncher, CopiesLaunchThroughTheSameApp)
{
    Parts parts;
    ConsoleAppLauncher launcher = parts.MakeLauncher();
    ConsoleAppLauncher copy(launcher);
    EXPECT_EQ(copy.GetConsoleApp(), parts.app);
    EXPECT_EQ(copy.GetLaunchParams().fProgram, L"program");
    launcher.Launch();
    EXPECT_TRUE(ThrowsRuntimeError("ConsoleApp: must be idle", [&] { copy.Launch(); }));
    parts.End();
    EXPECT_EQ(launcher.Wait(nullptr, kLong), State::kFinished);
}

TEST(ConsoleAppLauncher, KillReachesTheApp)
{
    Parts parts;
    ConsoleAppLauncher launcher = parts.MakeLauncher();
    launcher.Launch();
    parts.platform->fOnKill = [&] { parts.out->fGate.Open(); };
    launcher.Kill();
    EXPECT_EQ(launcher.Wait(nullptr, kLong), State::kKilled);
    EXPECT_EQ(parts.platform->fKills, 1);
}

} // namespace
