// The end of a wait: one thread at a time joins or abandons the launcher's thread.
#include <algorithm>

#include "ConsoleAppFixture.h"
#include "Journal.h"
#include "all/WaitTime.h"

using namespace pmutil;

namespace {

constexpr char kJoins[] = "ConsoleApp::Wait fLauncherThread.TimedJoin(0)";
constexpr char kGivesUp[] = "ConsoleApp::Wait fLauncherThread never finished";

class LaunchJoin : public ConsoleAppFixture {
protected:
    ~LaunchJoin() override
    {
        fGate->Open();
        End(kEndedNormally);
    }

    // Launches a child that ends, while the launcher's thread doesn't.
    void LaunchAndEnd()
    {
        fApp->fOnEvent = [gate = fGate](const std::string& event) {
            if (event == "OnFinished 3")
                gate->Await();
        };
        Launch();
        fJournal.Await("Launcher", "calling fLauncher->Wait");
        End(kEndedNormally, 3);
        fJournal.Await("Launcher", "SetStateLocked state=Finished");
    }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    Journal fJournal;
    const ThreadsEnd fThreadsEnd;
};

// Enough time for a thread that isn't blocked. A blocked one needs none.
void LetOthersRun()
{
    const double end = GetWaitClock() + 0.2;
    while (GetWaitClock() < end)
        boost::this_thread::yield();
}

TEST_F(LaunchJoin, OneOfTwoWaitsGivesTheThreadUpAndTheOtherKeepsTheCode)
{
    LaunchAndEnd();
    State otherEnd = State::kUndefined;
    int otherCode = -1;
    boost::thread other;
    // The first wait is blocked where it abandons the thread; the other one proceeds as far as
    // possible.
    fJournal.SetOnLine([&](const std::string& line) {
        if (line != kGivesUp || other.joinable())
            return;
        other = boost::thread([&] {
            fJournal.Enter("other");
            otherEnd = fApp->Wait(&otherCode, 0.0);
        });
        fJournal.AwaitWithoutLogMutex("other", kJoins);
        fJournal.WithoutLogMutex(LetOthersRun);
    });
    EXPECT_EQ(fApp->Wait(nullptr, 0.0), State::kTimeout);
    other.join();
    const Journal::Entries first = fJournal.Take("Client");
    const Journal::Entries second = fJournal.Take("other");
    EXPECT_EQ(std::count(first.begin(), first.end(), kGivesUp), 1);
    EXPECT_EQ(std::count(second.begin(), second.end(), kGivesUp), 0);
    EXPECT_EQ(otherEnd, State::kFinished);
    EXPECT_EQ(otherCode, 3);
}

} // namespace
