// A launcher without processes, and a task and an application that record their calls.
#pragma once

#include <algorithm>
#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>
#include <functional>
#include <string>
#include <vector>

#include "FakeChannel.h"
#include "pmutil/ConsoleApp.h"
#include "pmutil/Launcher.h"
#include "pmutil/OutputTask.h"
#include "support/Waits.h"

namespace pmutil {

// Its child lives until End or, if the child can be killed, Kill.
class FakeLauncher : public Launcher {
public:
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        if (!fLaunchFailure.empty())
            throw std::runtime_error(fLaunchFailure);
        ++fLaunches;
        fProgram = program;
        fArgs = args;
        fEnded = false;
        fKilled = false;
        fInput = boost::make_shared<FakeChannel>();
        LaunchResult result;
        result.fAppInput = fInput;
        for (int channel = 1; channel < kOutputSlots; ++channel) {
            fOutput[channel] = boost::make_shared<FakeChannel>();
            result.fAppOutput[channel] = fOutput[channel];
        }
        if (fOnLaunch)
            fOnLaunch();
        return result;
    }

    WaitResult Wait(int* exitCode) override
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        ++fWaits;
        while (!fEnded)
            fCond.wait(lock);
        if (!fWaitFailure.empty())
            throw std::runtime_error(fWaitFailure);
        if (fKilled)
            return kEndedByKill;
        if (fResult == kEndedNormally)
            *exitCode = fExitCode;
        return fResult;
    }

    void Kill() override
    {
        {
            const boost::lock_guard<boost::mutex> lock(fMutex);
            ++fKills;
            if (!fEnded && fMortal) {
                fKilled = true;
                fEnded = true;
            }
            fCond.notify_all();
        }
        if (fOnKill)
            fOnKill();
    }

    void End(WaitResult result, int exitCode = 0)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fEnded = true;
        fResult = result;
        fExitCode = exitCode;
        fCond.notify_all();
    }

    // A kill may come shortly after the failure that causes it is reported.
    bool AwaitKills(int kills)
    {
        return Eventually([&] { return fKills >= kills; }) && fKills == kills;
    }

    boost::mutex fMutex;
    boost::condition_variable fCond;
    std::string fLaunchFailure;
    std::string fWaitFailure;
    std::wstring fProgram;
    std::deque<std::string> fArgs;
    boost::shared_ptr<FakeChannel> fInput;
    boost::shared_ptr<FakeChannel> fOutput[kOutputSlots];
    std::function<void()> fOnLaunch;
    std::function<void()> fOnKill;
    bool fMortal = true;
    bool fEnded = false;
    bool fKilled = false;
    WaitResult fResult = kEndedNormally;
    int fExitCode = 0;
    std::atomic<int> fLaunches{0};
    std::atomic<int> fWaits{0};
    std::atomic<int> fKills{0};
};

// An event that threads wait for. Initially closed.
class Gate {
public:
    void Open() { Set(true); }
    void Close() { Set(false); }

    void Await()
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        while (!fOpen)
            fCond.wait(lock);
    }

private:
    void Set(bool open)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fOpen = open;
        fCond.notify_all();
    }

    boost::mutex fMutex;
    boost::condition_variable fCond;
    bool fOpen = false;
};

// Runs until its gate is open.
class PatientTask : public OutputTask {
public:
    Gate fGate;

protected:
    void DoRun() override { fGate.Await(); }
};

// Records its notifications, and whether its lock was free in each.
class RecordingApp : public ConsoleApp {
public:
    explicit RecordingApp(const boost::shared_ptr<Launcher>& launcher,
                          LauncherFactory makeLauncher = nullptr)
        : ConsoleApp(launcher, std::move(makeLauncher))
    {}

    using ConsoleApp::GetStateLocked;
    using ConsoleApp::SetState;

    std::vector<std::string> Events()
    {
        const boost::lock_guard<boost::mutex> lock(fEventMutex);
        return fEvents;
    }

    auto CountEvents(const std::string& event)
    {
        const auto events = Events();
        return std::count(events.begin(), events.end(), event);
    }

    // Whether any thread, or the calling one, holds the lock for this time.
    bool IsLocked(double seconds = kLong)
    {
        const auto done = boost::make_shared<std::atomic<bool>>(false);
        boost::thread asker([this, done] {
            ThrowIfInjected(TaskID::kClient, Fault::kNoFault, nullptr); // takes the lock
            *done = true;
        });
        const bool locked = !asker.timed_join(
            boost::posix_time::milliseconds(static_cast<std::int64_t>(seconds * 1000)));
        if (locked) {
            const boost::lock_guard<boost::mutex> lock(fEventMutex);
            fAskers.push_back(std::move(asker));
        }
        return locked;
    }

    // Call when the lock is free again.
    void JoinAskers()
    {
        for (boost::thread& asker : fAskers)
            asker.join();
        fAskers.clear();
    }

    std::string fThrowIn;                                   // the event that fails
    std::function<void(const std::string& event)> fOnEvent; // called in each

protected:
    void OnLaunching() override { Record("OnLaunching"); }
    void OnRunning() override { Record("OnRunning"); }
    void OnOutputTaskBegin(OutputChannel channel) override
    {
        Record(channel == OutputChannel::kStdout ? "begin stdout" : "begin stderr");
    }
    void OnOutputTaskEnd(OutputChannel channel) override
    {
        Record(channel == OutputChannel::kStdout ? "end stdout" : "end stderr");
    }
    void OnFinished(int exitCode) override { Record("OnFinished " + std::to_string(exitCode)); }
    void OnReserved() override { Record("OnReserved"); }

private:
    void Record(const std::string& event)
    {
        const bool locked = IsLocked();
        {
            const boost::lock_guard<boost::mutex> lock(fEventMutex);
            fEvents.push_back(event + (locked ? " locked" : ""));
        }
        if (fOnEvent)
            fOnEvent(event);
        if (event == fThrowIn)
            throw std::runtime_error(event + " failed");
    }

    boost::mutex fEventMutex;
    std::vector<std::string> fEvents;
    std::vector<boost::thread> fAskers;
};

} // namespace pmutil
