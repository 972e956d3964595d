// An application with a fake launcher, and tasks that run until the test ends them.
#pragma once

#include <gtest/gtest.h>

#include "FakeLauncher.h"
#include "ThreadsEnd.h"
#include "Throws.h"

namespace pmutil {

template <typename Call>
testing::AssertionResult ThrowsFailure(const std::string& text, Call call)
{
    return ThrowsExactly<consoleapp::Exception>(text, call);
}

class ConsoleAppFixture : public testing::Test {
protected:
    ConsoleAppFixture()
    {
        fParams.SetOutputTask(OutputChannel::kStdout, fStdout);
        fParams.SetOutputTask(OutputChannel::kStderr, fStderr);
        fParams.fProgram = L"program";
        // The output of a killed child ends, as with a real one.
        fLauncher->fOnKill = [out = fStdout, err = fStderr] {
            out->fGate.Open();
            err->fGate.Open();
        };
        NewData();
    }

    ~ConsoleAppFixture() override
    {
        fGate->Open();
        OpenTasks();
        fLauncher->End(kEndedNormally);
    }

    void OpenTasks()
    {
        fStdout->fGate.Open();
        fStderr->fGate.Open();
    }

    void NewData()
    {
        fData = boost::make_shared<consoleapp::ExecutionData>(boost::weak_ptr<ConsoleApp>(fApp),
                                                              boost::weak_ptr<OutputTask>(fStdout),
                                                              boost::weak_ptr<OutputTask>(fStderr));
    }

    void Launch()
    {
        NewData();
        fStdout->fGate.Close();
        fStderr->fGate.Close();
        fApp->Launch(fData, fParams);
    }

    // Launches, and returns once the launcher's thread waits for the child.
    void LaunchUntilItWaits()
    {
        const int waits = fLauncher->fWaits;
        Launch();
        EXPECT_TRUE(Eventually([&] { return fLauncher->fWaits > waits; }));
    }

    // Kill first waits for a state other than Timeout, which doesn't come.
    void KillAtTimeout()
    {
        const NoShortWait noWait;
        fApp->Kill();
    }

    // Ends the child and its output.
    void End(WaitResult result, int exitCode = 0)
    {
        OpenTasks();
        fLauncher->End(result, exitCode);
    }

    // Whether a launch succeeds.
    testing::AssertionResult RunsClean()
    {
        try {
            Launch();
            End(kEndedNormally, 3);
            int exitCode = -1;
            const State end = fApp->Wait(&exitCode, kLong);
            if (end == State::kFinished && exitCode == 3)
                return testing::AssertionSuccess();
            return testing::AssertionFailure() << end << ' ' << exitCode;
        } catch (const std::exception& exc) {
            return testing::AssertionFailure() << exc.what();
        }
    }

    State Peek() { return fApp->GetState(0.0); }

    const ThreadsEnd fNoThreadIsLeft; // which the next test would count
    const LongShortWait fLongShortWait;
    boost::shared_ptr<FakeLauncher> fLauncher = boost::make_shared<FakeLauncher>();
    // The same fake is used as a new launcher.
    boost::shared_ptr<RecordingApp> fApp =
        boost::make_shared<RecordingApp>(fLauncher, [this] { return fLauncher; });
    boost::shared_ptr<PatientTask> fStdout = boost::make_shared<PatientTask>();
    boost::shared_ptr<PatientTask> fStderr = boost::make_shared<PatientTask>();
    boost::shared_ptr<Gate> fGate = boost::make_shared<Gate>(); // for a test to block something
    boost::shared_ptr<consoleapp::ExecutionData> fData;
    LaunchParams fParams;
};

} // namespace pmutil
