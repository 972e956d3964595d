#include "pmutil/TrackingLauncher.h"

#include <gmock/gmock.h>
#include <limits>

#include "FakeLauncher.h"
#include "TestChild.h"
#include "Throws.h"

using namespace pmutil;

namespace {

constexpr double kEndless = std::numeric_limits<double>::infinity();

class TrackedLaunch : public testing::Test {
protected:
    void Launch() { fLauncher.Launch(L"program", {"argument"}); }

    boost::shared_ptr<FakeLauncher> fFake = boost::make_shared<FakeLauncher>();
    int fEnds = 0;
    TrackingLauncher fLauncher{fFake, [this] { ++fEnds; }};
};

TEST_F(TrackedLaunch, PassesEverythingOn)
{
    EXPECT_FALSE(fLauncher.HasLaunched());
    const LaunchResult ends = fLauncher.Launch(L"program", {"argument"});
    EXPECT_TRUE(fLauncher.HasLaunched());
    EXPECT_EQ(fFake->fProgram, L"program");
    EXPECT_THAT(fFake->fArgs, testing::ElementsAre("argument"));
    EXPECT_EQ(ends.fAppInput, fFake->fInput);
    EXPECT_EQ(ends.fAppOutput[1], fFake->fOutput[1]);
    EXPECT_EQ(ends.fAppOutput[2], fFake->fOutput[2]);
}

TEST_F(TrackedLaunch, KeepsACode)
{
    Launch();
    EXPECT_FALSE(fLauncher.GetEnd());
    EXPECT_FALSE(fLauncher.AwaitEnd(0.0));
    fFake->End(kEndedNormally, 7);
    int exitCode = -1;
    EXPECT_EQ(fLauncher.Wait(&exitCode), kEndedNormally);
    EXPECT_EQ(exitCode, 7);
    EXPECT_EQ(fEnds, 1);
    EXPECT_TRUE(fLauncher.AwaitEnd(kEndless));
    ASSERT_TRUE(fLauncher.GetEnd());
    EXPECT_EQ(fLauncher.GetEnd()->fResult, kEndedNormally);
    EXPECT_EQ(fLauncher.GetEnd()->fExitCode, 7);
    EXPECT_EQ(fLauncher.GetEnd()->fTerminationText, "");
}

TEST_F(TrackedLaunch, LeavesTheCodeOfACrashAlone)
{
    Launch();
    fFake->End(kEndedByCrash, 7);
    int exitCode = -1;
    EXPECT_EQ(fLauncher.Wait(&exitCode), kEndedByCrash);
    EXPECT_EQ(exitCode, -1);
    EXPECT_EQ(fLauncher.GetEnd()->fResult, kEndedByCrash);
    EXPECT_EQ(fLauncher.GetEnd()->fExitCode, 0);
}

TEST_F(TrackedLaunch, AWaitThatFailsLeavesNoEndToWaitFor)
{
    Launch();
    fFake->fWaitFailure = "lost";
    fFake->End(kEndedNormally);
    int exitCode = -1;
    EXPECT_TRUE(ThrowsRuntimeError("lost", [&] { fLauncher.Wait(&exitCode); }));
    EXPECT_TRUE(fLauncher.AwaitEnd(kEndless));
    EXPECT_FALSE(fLauncher.GetEnd());
    EXPECT_EQ(fEnds, 0);
}

TEST_F(TrackedLaunch, AKillBeforeTheChildIsRemembered)
{
    fLauncher.Kill();
    EXPECT_EQ(fFake->fKills, 0);
    EXPECT_TRUE(fLauncher.IsKilled());
    Launch();
    EXPECT_EQ(fFake->fKills, 1);
    int exitCode = -1;
    EXPECT_EQ(fLauncher.Wait(&exitCode), kEndedByKill);
}

TEST_F(TrackedLaunch, AKillWhileTheChildIsMadeIsNotLost)
{
    fFake->fOnLaunch = [this] { fLauncher.Kill(); };
    Launch();
    EXPECT_EQ(fFake->fKills, 1);
}

TEST_F(TrackedLaunch, AKillBeforeTheChildThatFailsLeavesTheLaunchAlone)
{
    fFake->fOnKill = [] { throw std::runtime_error("no right"); };
    fLauncher.Kill();
    Launch();
    EXPECT_TRUE(fLauncher.HasLaunched());
    EXPECT_TRUE(ThrowsRuntimeError("no right", [&] { fLauncher.Kill(); }));
}

TEST_F(TrackedLaunch, AKillEndsTheWaitsThatAskForIt)
{
    Launch();
    fFake->fMortal = false;
    bool ended = true;
    boost::thread waiter([&] { ended = fLauncher.AwaitEndOrKill(kEndless); });
    fLauncher.Kill();
    waiter.join();
    EXPECT_FALSE(ended);
    EXPECT_FALSE(fLauncher.AwaitEndOrKill(kEndless)) << "later too";
    EXPECT_FALSE(fLauncher.AwaitEnd(0.0)) << "others wait for the end";
    fFake->End(kEndedNormally);
    int exitCode = -1;
    fLauncher.Wait(&exitCode);
    EXPECT_TRUE(fLauncher.AwaitEndOrKill(0.0));
}

TEST(TrackingLauncher, KeepsWhatEndedTheChild)
{
    TrackingLauncher launcher(MakeLauncher());
    const LaunchResult ends = launcher.Launch(TEST_CHILD, {"abort"});
    int exitCode = -1;
    EXPECT_EQ(launcher.Wait(&exitCode), kEndedByCrash);
    EXPECT_THAT(launcher.GetEnd()->fTerminationText,
                testing::AnyOf("signal 6 (Aborted)", "code 0xC0000005"));
}

} // namespace
