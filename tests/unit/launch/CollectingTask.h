// Output tasks that collect a real child's output.
#pragma once

#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <gtest/gtest.h>
#include <string>
#include <string_view>

#include "TestChild.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/OutputPump.h"
#include "pmutil/StartAwareApp.h"
#include "support/Waits.h"

namespace pmutil {

// The platform's launcher, which counts its launches.
class CountingLauncher : public Launcher {
public:
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        ++fLaunches;
        return fPlatform->Launch(program, args);
    }

    WaitResult Wait(int* exitCode) override
    {
        const WaitResult result = fPlatform->Wait(exitCode);
        const boost::lock_guard<boost::mutex> lock(fHoldsEnd);
        return result;
    }
    void Kill() override { fPlatform->Kill(); }

    std::atomic<int> fLaunches{0};
    boost::mutex fHoldsEnd; // while a test has it locked, no wait learns the child's end

private:
    const boost::shared_ptr<Launcher> fPlatform = MakeLauncher();
};

// The output of one channel.
class Collected {
public:
    void Clear()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fText.clear();
        fCount = 0;
    }

    void Add(std::string_view block)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fCount += block.size();
        if (fText.size() < kMaxKept)
            fText += block;
    }

    std::string GetText()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fText;
    }

    unsigned long long GetCount()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fCount;
    }

private:
    static constexpr std::size_t kMaxKept = 1 << 22;

    boost::mutex fMutex;
    std::string fText;
    unsigned long long fCount = 0;
};

// Keeps the output of the latest launch.
class CollectingTask : public OutputPump {
public:
    CollectingTask() : CollectingTask(boost::make_shared<Collected>()) {}

    std::string Text() { return fCollected->GetText(); }
    unsigned long long Count() { return fCollected->GetCount(); }

protected:
    void DoBegin(Lock& /*lock*/) override { fCollected->Clear(); }

private:
    explicit CollectingTask(const boost::shared_ptr<Collected>& collected)
        : OutputPump([collected](std::string_view block) { collected->Add(block); }),
          fCollected(collected)
    {}

    const boost::shared_ptr<Collected> fCollected;
};

// A launcher with an application and two collecting tasks.
struct RealLaunch {
    LongShortWait longShortWait;
    boost::shared_ptr<CountingLauncher> platform = boost::make_shared<CountingLauncher>();
    boost::shared_ptr<StartAwareApp> app = boost::make_shared<StartAwareApp>(platform);
    boost::shared_ptr<CollectingTask> out = boost::make_shared<CollectingTask>();
    boost::shared_ptr<CollectingTask> err = boost::make_shared<CollectingTask>();
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
        LaunchParams params(out, err, std::move(args), std::move(program));
        params.fKeepStdin = keepStdin;
        launcher.SetLaunchParams(params);
    }

    void AwaitStart() const
    {
        EXPECT_EQ(app->AwaitStart(kLong), consoleapp::LaunchStart::Result::kRunning);
    }
};

} // namespace pmutil
