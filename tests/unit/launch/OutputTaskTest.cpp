#include "pmutil/OutputTask.h"

#include <boost/make_shared.hpp>
#include <boost/thread/thread.hpp>
#include <functional>
#include <gmock/gmock.h>

#include "FakeChannel.h"
#include "Journal.h"
#include "Throws.h"

using namespace pmutil;
using testing::ElementsAre;

namespace {

class RecordingTask : public OutputTask {
public:
    using OutputTask::GetReader;
    using OutputTask::OutputTask;

    std::vector<std::string> fCalls;
    std::string fThrowIn;
    std::function<void()> fDo = [] {};
    bool fWasRunning = false;

protected:
    void DoBegin(Lock& lock) override { Record("begin", lock.owns_lock()); }

    void DoRun() override
    {
        fWasRunning = IsRunning(0.0);
        fDo();
        Record("run", false);
    }

    void DoEnd(Lock& lock) override { Record("end", lock.owns_lock()); }

    void CloseReader(Lock& lock) override
    {
        Record("close", lock.owns_lock());
        OutputTask::CloseReader(lock);
    }

private:
    void Record(const std::string& name, bool locked)
    {
        fCalls.push_back(name + (locked ? " locked" : ""));
        if (name == fThrowIn)
            throw std::runtime_error(name + " failed");
    }
};

boost::shared_ptr<consoleapp::ExecutionData> MakeData()
{
    return boost::make_shared<consoleapp::ExecutionData>(boost::weak_ptr<ConsoleApp>(),
                                                         boost::weak_ptr<OutputTask>(),
                                                         boost::weak_ptr<OutputTask>());
}

TEST(OutputTask, RunsItsStepsInOrderWithTheRightLocks)
{
    const auto reader = boost::make_shared<FakeChannel>();
    RecordingTask task(TaskID::kStdout, nullptr, reader);
    EXPECT_FALSE(task.IsRunning(0.0));
    task.Run();
    EXPECT_THAT(task.fCalls, ElementsAre("begin locked", "run", "end locked", "close locked"));
    EXPECT_TRUE(task.fWasRunning);
    EXPECT_FALSE(task.IsRunning(0.0));
    EXPECT_FALSE(reader->fOpen);
    EXPECT_EQ(task.GetReader(), nullptr);
}

TEST(OutputTask, AnExceptionClosesTheReaderAndGoesOn)
{
    for (const char* const step : {"begin", "run", "end"}) {
        const auto reader = boost::make_shared<FakeChannel>();
        RecordingTask task(TaskID::kStdout, nullptr, reader);
        task.fThrowIn = step;
        EXPECT_TRUE(ThrowsRuntimeError(std::string(step) + " failed", [&] { task.Run(); }));
        EXPECT_FALSE(task.IsRunning(0.0));
        EXPECT_EQ(task.GetReader(), nullptr);
        EXPECT_FALSE(reader->fOpen);
        EXPECT_EQ(task.fCalls.back(), "close locked");
    }
}

TEST(OutputTask, AClosedReaderIsNotClosedAgain)
{
    const auto reader = boost::make_shared<FakeChannel>();
    reader->Close();
    OutputTask task(TaskID::kStdout, nullptr, reader);
    task.Run();
    EXPECT_THAT(reader->fCalls, ElementsAre("close"));
}

// Only the start ends this wait within the time of the test.
TEST(OutputTask, IsRunningReturnsAsSoonAsItRuns)
{
    const DebugValueSetter log("ConsoleAppLog", 1);
    Journal journal;
    OutputTask task;
    bool runs = false;
    boost::thread waiter([&] {
        journal.Enter("waiter");
        constexpr double kDays = 1e6;
        runs = task.IsRunning(kDays);
    });
    journal.Await("waiter", "OutputTask::IsRunningLocked waitSeconds=");
    task.SetIsRunning(true);
    waiter.join();
    EXPECT_TRUE(runs);
    task.SetIsRunning(false);
    EXPECT_FALSE(task.IsRunning(0.01));
}

TEST(OutputTask, CopyingARunningTaskFails)
{
    OutputTask task;
    OutputTask other;
    task.SetIsRunning(true);
    const auto running = [](auto call) {
        return ThrowsRuntimeError("OutputTask::AssignLocked: task is running", call);
    };
    EXPECT_TRUE(running([&] { const OutputTask copy(task); }));
    EXPECT_TRUE(running([&] { other = task; }));
    const OutputTask& same = task;
    task = same;
    task.SetIsRunning(false);
    other = task;
}

TEST(OutputTask, CopiesTakeAllFields)
{
    const auto data = MakeData();
    const auto reader = boost::make_shared<FakeChannel>();
    const RecordingTask task(TaskID::kStderr, data, reader);
    RecordingTask copy(task);
    EXPECT_EQ(copy.GetTaskID(), TaskID::kStderr);
    EXPECT_EQ(copy.GetExecutionData(), data);
    EXPECT_EQ(copy.GetReader(), reader);
    RecordingTask assigned;
    assigned = copy;
    EXPECT_EQ(assigned.GetTaskID(), TaskID::kStderr);
    EXPECT_EQ(assigned.GetReader(), reader);
}

TEST(OutputTask, PrepareReadiesItForAnotherRun)
{
    RecordingTask task;
    task.Run();
    const auto reader = boost::make_shared<FakeChannel>();
    task.Prepare(OutputChannel::kStderr, nullptr, reader);
    EXPECT_EQ(task.GetTaskID(), TaskID::kStderr);
    EXPECT_EQ(task.GetReader(), reader);
    task.Run();
    EXPECT_FALSE(reader->fOpen);
}

TEST(OutputTask, PrepareRefusesATaskInItsRun)
{
    const auto reader = boost::make_shared<FakeChannel>();
    const auto next = boost::make_shared<FakeChannel>();
    RecordingTask task(TaskID::kStdout, nullptr, reader);
    const auto prepare = [&] { task.Prepare(OutputChannel::kStderr, MakeData(), next); };
    task.fDo = [&] {
        EXPECT_TRUE(ThrowsRuntimeError("OutputTask::Prepare: task is running", prepare));
        EXPECT_EQ(task.GetReader(), reader);
        EXPECT_EQ(task.GetTaskID(), TaskID::kStdout);
    };
    task.fThrowIn = "end";
    EXPECT_THROW(task.Run(), std::runtime_error);
    EXPECT_EQ(next.use_count(), 1);
    prepare();
    EXPECT_EQ(task.GetReader(), next) << "free after a run that failed too";
    EXPECT_TRUE(next->fOpen);
}

TEST(OutputTask, RunOfAnotherLaunchIsRefused)
{
    const auto old = MakeData();
    const auto present = MakeData();
    const auto reader = boost::make_shared<FakeChannel>();
    RecordingTask task;
    task.Prepare(OutputChannel::kStdout, present, reader);
    EXPECT_TRUE(ThrowsExactly<consoleapp::Exception>("stdout: no output task",
                                                     [&] { task.Run(old.get()); }));
    EXPECT_THAT(task.fCalls, ElementsAre());
    EXPECT_TRUE(reader->fOpen);
    task.Run(present.get());
    EXPECT_FALSE(reader->fOpen);
}

TEST(OutputTask, DiscardEndsALaunchBeforeItsRun)
{
    const auto old = MakeData();
    const auto present = MakeData();
    const auto reader = boost::make_shared<FakeChannel>();
    RecordingTask task;
    task.Prepare(OutputChannel::kStdout, present, reader);
    task.Discard(old.get());
    EXPECT_TRUE(reader->fOpen) << "not that launch's";
    task.Discard(present.get());
    EXPECT_FALSE(reader->fOpen);
    EXPECT_EQ(task.GetReader(), nullptr);
    EXPECT_THROW(task.Run(present.get()), consoleapp::Exception) << "too late";
    const auto next = boost::make_shared<FakeChannel>();
    task.Prepare(OutputChannel::kStdout, present, next);
    task.fDo = [&] {
        task.Discard(present.get());
        EXPECT_TRUE(next->fOpen) << "a run closes its reader itself";
    };
    task.Run(present.get());
    EXPECT_FALSE(next->fOpen);
}

TEST(OutputTask, DiscardLeavesATaskThatHasRunAlone)
{
    const auto data = MakeData();
    RecordingTask task;
    task.Prepare(OutputChannel::kStdout, data, boost::make_shared<FakeChannel>());
    task.Run(data.get());
    task.Discard(data.get());
    EXPECT_THAT(task.fCalls, ElementsAre("begin locked", "run", "end locked", "close locked"));
    EXPECT_EQ(task.GetExecutionData(), data);
}

} // namespace
