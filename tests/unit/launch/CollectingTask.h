// Output tasks that collect a real child's output.
#pragma once

#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <functional>
#include <gtest/gtest.h>
#include <string>

#include "TestChild.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/OutputTask.h"
#include "support/Waits.h"

namespace pmutil {

// The platform's launcher, which reports the kill of a child.
class WatchedLauncher : public Launcher {
public:
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        ++fLaunches;
        return fPlatform->Launch(program, args);
    }

    WaitResult Wait(int* exitCode) override { return fPlatform->Wait(exitCode); }

    void Kill() override
    {
        fPlatform->Kill();
        fOnKill();
    }

    std::function<void()> fOnKill = [] {};
    std::atomic<int> fLaunches{0};

private:
    const boost::shared_ptr<Launcher> fPlatform = MakeLauncher();
};

// Keeps the tasks of a launch running until the start of the launch is over.
class StartedApp : public ConsoleApp {
public:
    StartedApp() : StartedApp(boost::make_shared<WatchedLauncher>()) {}
    ~StartedApp() override
    {
        fLauncher->fOnKill = [] {};
    }

    // Waits until the child runs, or is killed because the launch failed.
    void AwaitStart()
    {
        boost::unique_lock<boost::mutex> lock(fStartMutex);
        EXPECT_TRUE(fStartCond.timed_wait(lock,
                                          boost::posix_time::seconds(static_cast<long>(kLong)),
                                          [this] { return fStarted; }));
    }

    void ForgetStart()
    {
        const boost::lock_guard<boost::mutex> lock(fStartMutex);
        fStarted = false;
    }

    WatchedLauncher& GetLauncher() { return *fLauncher; }

protected:
    void OnRunning() override { SetStarted(); }

private:
    explicit StartedApp(const boost::shared_ptr<WatchedLauncher>& launcher)
        : ConsoleApp(launcher), fLauncher(launcher)
    {
        launcher->fOnKill = [this] { SetStarted(); };
    }

    void SetStarted()
    {
        const boost::lock_guard<boost::mutex> lock(fStartMutex);
        fStarted = true;
        fStartCond.notify_all();
    }

    const boost::shared_ptr<WatchedLauncher> fLauncher;
    boost::mutex fStartMutex;
    boost::condition_variable fStartCond;
    bool fStarted = false;
};

// Reads everything, and returns after the start of the launch is over.
class CollectingTask : public OutputTask {
public:
    explicit CollectingTask(boost::weak_ptr<StartedApp> app) : fApp(std::move(app)) {}

    std::string Text()
    {
        const boost::lock_guard<boost::mutex> lock(fTextMutex);
        return fText;
    }

    unsigned long long Count()
    {
        const boost::lock_guard<boost::mutex> lock(fTextMutex);
        return fCount;
    }

protected:
    void DoBegin(Lock& /*lock*/) override
    {
        const boost::lock_guard<boost::mutex> lock(fTextMutex);
        fText.clear();
        fCount = 0;
    }

    void DoRun() override
    {
        const boost::shared_ptr<Reader> reader = GetReader();
        std::string block(65536, '\0');
        for (auto count = reader->ReadSome(block.data(), block.size()); count > 0;
             count = reader->ReadSome(block.data(), block.size())) {
            const boost::lock_guard<boost::mutex> lock(fTextMutex);
            fCount += count;
            if (fText.size() < kMaxKept)
                fText.append(block, 0, count);
        }
        if (const auto app = fApp.lock())
            app->AwaitStart();
    }

private:
    static constexpr std::size_t kMaxKept = 1 << 22;

    boost::weak_ptr<StartedApp> fApp;
    boost::mutex fTextMutex;
    std::string fText;
    unsigned long long fCount = 0;
};

// A launcher with an application and two collecting tasks.
struct RealLaunch {
    LongShortWait longShortWait;
    boost::shared_ptr<StartedApp> app = boost::make_shared<StartedApp>();
    boost::shared_ptr<CollectingTask> out = boost::make_shared<CollectingTask>(app);
    boost::shared_ptr<CollectingTask> err = boost::make_shared<CollectingTask>(app);
    ConsoleAppLauncher launcher;

    explicit RealLaunch(std::deque<std::string> args, bool keepStdin = false,
                        std::wstring program = TEST_CHILD)
    {
        launcher.SetConsoleApp(app);
        SetArgs(std::move(args), keepStdin, std::move(program));
    }

    void SetArgs(std::deque<std::string> args, bool keepStdin = false,
                 std::wstring program = TEST_CHILD)
    {
        app->ForgetStart();
        LaunchParams params(out, err, std::move(args), std::move(program));
        params.fKeepStdin = keepStdin;
        launcher.SetLaunchParams(params);
    }
};

} // namespace pmutil
