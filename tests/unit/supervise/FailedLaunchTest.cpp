// A launch that fails after something was started.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>

#include <boost/make_shared.hpp>

#include "LongTimes.h"
#include "supervise/ChildRun.h"
#include "supervise/Containment.h"
#include "support/Waits.h"

namespace assay_host {
namespace {

class FailingLauncher : public pmutil::Launcher {
public:
    pmutil::LaunchResult Launch(const std::wstring& /*program*/,
                                const std::deque<std::string>& /*args*/) override
    {
        throw std::runtime_error("no streams");
    }
    pmutil::WaitResult Wait(int* /*exitCode*/) override { return pmutil::kEndedByKill; }
    void Kill() override {}
};

class FakeContainment : public Containment {
public:
    explicit FakeContainment(bool ends) : fEnds(ends) {}

    boost::shared_ptr<pmutil::Launcher> GetLauncher() override { return fLauncher; }
    bool EndAll(double /*seconds*/) override
    {
        ++fCalls;
        return fEnds;
    }

    const bool fEnds;
    int fCalls = 0;
    const boost::shared_ptr<FailingLauncher> fLauncher = boost::make_shared<FailingLauncher>();
};

TEST(FailedLaunch, EndsWhatItStarted)
{
    const pmutil::LongShortWait shortWait;
    for (const bool ends : {true, false}) {
        FakeContainment containment(ends);
        ChildOptions options;
        // Any file that exists: the launcher never starts it.
        options.fProgram = testing::internal::GetArgvs().front();
        RunObserver observer;
        pmutil::StopRequest stop;
        const RunOutcome outcome = RunChild(options, observer, stop, containment, GetLongTimes());
        EXPECT_EQ(outcome.fVerdict, Verdict::kNeverStarted);
        EXPECT_THAT(outcome.fReason, testing::HasSubstr("no streams"));
        EXPECT_EQ(outcome.fLeftBehind, !ends);
        EXPECT_EQ(containment.fCalls, 1);
    }
}

} // namespace
} // namespace assay_host
