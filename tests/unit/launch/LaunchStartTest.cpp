// Waiting for the end of the start of a launch.
#include "pmutil/LaunchStart.h"

#include <gmock/gmock.h>
#include <limits>

#include "ConsoleAppFixture.h"
#include "pmutil/StartAwareApp.h"

using namespace pmutil;
using consoleapp::Exception;
using consoleapp::LaunchStart;
using Result = LaunchStart::Result;

namespace {

constexpr double kEndless = std::numeric_limits<double>::infinity();

TEST(LaunchStart, EndsOnce)
{
    LaunchStart start;
    EXPECT_EQ(start.Await(0.0), Result::kPending);
    start.End(Result::kFailed);
    start.End(Result::kRunning);
    EXPECT_EQ(start.Await(0.0), Result::kFailed);
    EXPECT_EQ(start.Await(kEndless), Result::kFailed);
}

TEST(LaunchStart, ItsEndWakesAllThatWait)
{
    LaunchStart start;
    Result results[2] = {};
    boost::thread first([&] { results[0] = start.Await(kEndless); });
    boost::thread second([&] { results[1] = start.Await(1000 * kLong); });
    start.End(Result::kRunning);
    first.join();
    second.join();
    EXPECT_THAT(results, testing::Each(Result::kRunning));
}

TEST(LaunchStart, EndsWithTheLaunchThatIsGivenUp)
{
    consoleapp::ExecutionData data({}, {}, {});
    data.ClearConsoleApp();
    EXPECT_EQ(data.GetStart().Await(kEndless), Result::kFailed);
}

// A StartAwareApp whose OnRunning can wait or fail.
class HeldApp : public StartAwareApp {
public:
    using StartAwareApp::StartAwareApp;

    Gate fMayRun;
    std::string fFailure;

protected:
    void OnRunning() override
    {
        fMayRun.Await();
        if (!fFailure.empty())
            throw std::runtime_error(fFailure);
    }
};

class StartOfAnApp : public ConsoleAppFixture {
protected:
    StartOfAnApp()
    {
        fData = boost::make_shared<consoleapp::ExecutionData>(boost::weak_ptr<ConsoleApp>(fHeld),
                                                              boost::weak_ptr<OutputTask>(fStdout),
                                                              boost::weak_ptr<OutputTask>(fStderr));
    }

    ~StartOfAnApp() override
    {
        fHeld->fMayRun.Open();
        End(kEndedNormally);
    }

    boost::shared_ptr<HeldApp> fHeld = boost::make_shared<HeldApp>(fLauncher);
};

TEST_F(StartOfAnApp, IsOverWhenTheAppWasNotified)
{
    EXPECT_EQ(fHeld->AwaitStart(kEndless), Result::kFailed) << "no launch yet";
    fHeld->Launch(fData, fParams);
    EXPECT_EQ(fHeld->GetState(0.0), State::kRunning);
    EXPECT_EQ(fHeld->AwaitStart(0.0), Result::kPending);
    fHeld->fMayRun.Open();
    EXPECT_EQ(fHeld->AwaitStart(kEndless), Result::kRunning);
    End(kEndedNormally);
    EXPECT_EQ(fHeld->Wait(nullptr, kLong), State::kFinished);
    EXPECT_EQ(fHeld->AwaitStart(0.0), Result::kRunning) << "the latest launch";
}

TEST_F(StartOfAnApp, FailsWithTheLaunch)
{
    fHeld->fFailure = "broken";
    fHeld->Launch(fData, fParams);
    Result result = Result::kPending;
    boost::thread waiter([&] { result = fData->GetStart().Await(kEndless); });
    fHeld->fMayRun.Open();
    waiter.join();
    EXPECT_EQ(result, Result::kFailed);
    EXPECT_TRUE(ThrowsFailure("Launcher: broken", [&] { fHeld->Wait(nullptr, kLong); }));
    EXPECT_EQ(fHeld->AwaitStart(kEndless), Result::kFailed);
}

TEST_F(StartOfAnApp, FailsWhenTheProgramCannotBeStarted)
{
    fLauncher->fLaunchFailure = "no such program";
    EXPECT_TRUE(ThrowsFailure("Launcher: no such program", [&] { fHeld->Launch(fData, fParams); }));
    EXPECT_EQ(fData->GetStart().Await(kEndless), Result::kFailed);
}

TEST_F(StartOfAnApp, FailsWithAReset)
{
    const std::size_t threads = ManagedThread::GetRegisteredThreadCount();
    fHeld->Launch(fData, fParams);
    {
        const NoShortWait noWait;
        fHeld->Reset();
    }
    EXPECT_EQ(fData->GetStart().Await(kEndless), Result::kFailed);
    fHeld->fMayRun.Open();
    End(kEndedNormally);
    EXPECT_TRUE(Eventually([&] {
        return ManagedThread::GetRegisteredThreadCount() == threads + 1;
    })) << "the launcher's thread was given up, and joins its pumps";
}

} // namespace
