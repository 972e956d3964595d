// A launcher without processes, a task and an application that record what happens to them.
#pragma once

#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include "FakeChannel.h"
#include "pmutil/ConsoleApp.h"
#include "pmutil/Launcher.h"
#include "pmutil/OutputTask.h"

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
        fEnded = fEndsAtOnce;
        fKilled = false;
        fInput = boost::make_shared<FakeChannel>();
        LaunchResult result;
        result.fAppInput = fInput;
        for (int channel = 1; channel < kOutputSlots; ++channel) {
            fOutput[channel] = boost::make_shared<FakeChannel>();
            result.fAppOutput[channel] = fOutput[channel];
        }
        return result;
    }

    WaitResult Wait(int* exitCode) override
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
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
        const boost::lock_guard<boost::mutex> lock(fMutex);
        ++fKills;
        if (!fEnded && fMortal) {
            fKilled = true;
            fEnded = true;
        }
        fCond.notify_all();
    }

    void End(WaitResult result, int exitCode = 0)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fEnded = true;
        fResult = result;
        fExitCode = exitCode;
        fCond.notify_all();
    }

    boost::mutex fMutex;
    boost::condition_variable fCond;
    std::string fLaunchFailure;
    std::string fWaitFailure;
    std::wstring fProgram;
    std::deque<std::string> fArgs;
    boost::shared_ptr<FakeChannel> fInput;
    boost::shared_ptr<FakeChannel> fOutput[kOutputSlots];
    bool fEndsAtOnce = false;
    bool fMortal = true;
    bool fEnded = false;
    bool fKilled = false;
    WaitResult fResult = kEndedNormally;
    int fExitCode = 0;
    std::atomic<int> fLaunches{0};
    std::atomic<int> fKills{0};
};

// Runs until it is let go, or until its launch's application runs or has failed.
class PatientTask : public OutputTask {
public:
    ~PatientTask() override { fOpen = true; }

    std::atomic<bool> fOpen{false};

protected:
    void DoRun() override
    {
        while (!fOpen)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
};

// Records its notifications, and whether its lock was free in each: GetState from within takes it.
class RecordingApp : public ConsoleApp {
public:
    explicit RecordingApp(const boost::shared_ptr<Launcher>& launcher) : ConsoleApp(launcher) {}

    using ConsoleApp::GetStateLocked;
    using ConsoleApp::SetState;

    std::vector<std::string> Events()
    {
        const boost::lock_guard<boost::mutex> lock(fEventMutex);
        return fEvents;
    }

    std::string fThrowIn;

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

private:
    void Record(const std::string& event)
    {
        TakeTheLock();
        const boost::lock_guard<boost::mutex> lock(fEventMutex);
        fEvents.push_back(event);
        if (event == fThrowIn)
            throw std::runtime_error(event + " failed");
    }

    // Hangs, and the test with it, if the caller holds the lock.
    void TakeTheLock() { ThrowIfInjected(TaskID::kClient, Fault::kNoFault, nullptr); }

    boost::mutex fEventMutex;
    std::vector<std::string> fEvents;
};

} // namespace pmutil
