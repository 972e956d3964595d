#include "memory/Adviser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <stdexcept>

#include "FakeFolder.h"
#include "Samples.h"
#include "memory/Envelope.h"
#include "memory/KnowledgeJson.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr Usability kHardware = Usability::kHardware;
constexpr Usability kBroken = Usability::kBroken;
constexpr Usability kUnknown = Usability::kUnknown;

class AdviserTest : public testing::Test {
protected:
    AdviserTest()
    {
        SetEnd(AttemptEnd::kEnded, kHardware, Usability::kSoftware);
        fPause = [](double) {
            ADD_FAILURE() << "waited";
            return false;
        };
    }

    // How the next attempts end.
    void SetEnd(AttemptEnd end, Usability gl, Usability cl)
    {
        fRun = [this, end, gl, cl](Attempt& attempt) {
            const Attempt closed = MakeAttempt(fMachine.fTime, end, gl, cl);
            const HostMark host = attempt.fHost;
            attempt = closed;
            attempt.fHost = host;
        };
    }

    Advice Advise()
    {
        return Adviser(fFolder, fMachine, fIdentity, fRequest)
            .Advise(
                [this](Attempt& attempt) {
                    ++fAttempts;
                    EXPECT_EQ(attempt.fEnd, AttemptEnd::kOpen);
                    EXPECT_EQ(attempt.fHost, fMachine.GetSelf());
                    fRun(attempt);
                },
                fPause);
    }

    Advice Recall() { return Adviser(fFolder, fMachine, fIdentity, fRequest).Recall(); }

    static std::string Show(const Advice& advice)
    {
        return std::string(GetPlanName(advice.fPlan)) + (advice.fTried ? ", tried" : "") + ": " +
               GetUsabilityName(advice.fOpenGL.GetUsability()) + " " +
               GetUsabilityName(advice.fOpenCL.GetUsability());
    }

    // Ends this process during an attempt, so that the record stays open.
    void Die()
    {
        fRun = [](Attempt&) { throw std::runtime_error("killed"); };
        EXPECT_THROW(Advise(), std::runtime_error);
        fMachine.fAlive.erase(fMachine.fProcess);
        fMachine.fAlive.insert(++fMachine.fProcess);
        SetEnd(AttemptEnd::kEnded, kHardware, Usability::kSoftware);
    }

    void Reboot(const std::string& boot)
    {
        fMachine.fBoot = boot;
        fMachine.fAlive = {fMachine.fProcess};
    }

    FakeFolder fFolder;
    FakeMachine fMachine;
    Identity fIdentity = MakeIdentity();
    AdviceRequest fRequest;
    std::function<void(Attempt&)> fRun;
    PauseFunction fPause;
    int fAttempts = 0;
};

TEST_F(AdviserTest, TriesOnceAndRemembers)
{
    EXPECT_EQ(Show(Recall()), "try: unknown unknown");
    EXPECT_EQ(Show(Advise()), "try, tried: hardware software");
    const Advice second = Advise();
    EXPECT_EQ(Show(second), "answer: hardware software");
    EXPECT_EQ(second.fName, GetIdentityName(MakeIdentityJson(fIdentity)));
    EXPECT_EQ(second.fCount, 1u);
    EXPECT_EQ(second.fOpenGL.fOutlook.fTime, kNow);
    EXPECT_THAT(second.fMessages, IsEmpty());
    EXPECT_EQ(Show(Recall()), "answer: hardware software");
    EXPECT_EQ(fAttempts, 1);
    EXPECT_EQ(fFolder.fWrites, 2);
}

TEST_F(AdviserTest, RecallsWithoutAnyWrite)
{
    EXPECT_EQ(Recall().fDue, Due::kFirst);
    EXPECT_EQ(fFolder.fWrites, 0);
    EXPECT_FALSE(fFolder.fIsLocked);
}

TEST_F(AdviserTest, RecordsTheAttemptBeforeItStarts)
{
    fRun = [this](Attempt& attempt) {
        const Knowledge stored = Store(fFolder).Load(fIdentity);
        ASSERT_EQ(stored.fAttempts.size(), 1u);
        EXPECT_EQ(stored.fAttempts[0].fEnd, AttemptEnd::kOpen);
        EXPECT_EQ(stored.fAttempts[0].fHost, fMachine.GetSelf());
        EXPECT_EQ(stored.fAttempts[0].fStarted, kNow);
        EXPECT_TRUE(fFolder.fIsLocked);
        attempt = MakeAttempt(kNow, AttemptEnd::kEnded, kHardware, kHardware);
    };
    EXPECT_EQ(Show(Advise()), "try, tried: hardware hardware");
    EXPECT_FALSE(fFolder.fIsLocked);
}

TEST_F(AdviserTest, EachChangeOfTheIdentityAllowsOneAttempt)
{
    const std::vector<std::function<void(Identity&)>> changes = {
        [](Identity& identity) { identity.fSystem = "Linux 6.1.0-14"; },
        [](Identity& identity) { identity.fFiles[0].fTime += 1; },
        [](Identity& identity) { identity.fFiles.push_back(identity.fFiles[0]); },
        [](Identity& identity) { identity.fAdapters.pop_back(); },
    };
    SetEnd(AttemptEnd::kCrashed, kBroken, kUnknown);
    Advise();
    for (const auto& change : changes) {
        const int before = fAttempts;
        change(fIdentity);
        EXPECT_EQ(Show(Advise()), "try, tried: broken unknown");
        EXPECT_EQ(Show(Advise()), "answer: broken unknown");
        EXPECT_EQ(fAttempts, before + 1);
    }
}

TEST_F(AdviserTest, RetriesACrashTwice)
{
    SetEnd(AttemptEnd::kCrashed, kBroken, kUnknown);
    int calls = 0;
    std::vector<std::int64_t> times;
    for (; calls < 400; ++calls, fMachine.fTime += calls < 80 ? 60 : 1500) {
        const int before = fAttempts;
        EXPECT_EQ(Advise().fOpenGL.GetUsability(), kBroken);
        if (fAttempts > before)
            times.push_back(fMachine.fTime - kNow);
    }
    EXPECT_THAT(times, ElementsAre(0, Policy::kMinute, Policy::kMinute + Policy::kHour));
    fMachine.fTime += 2 * Policy::kDay;
    SetEnd(AttemptEnd::kEnded, kHardware, kHardware);
    EXPECT_EQ(Show(Advise()), "try, tried: hardware hardware");
}

TEST_F(AdviserTest, TriesForTheNeededInterfaceAlone)
{
    SetEnd(AttemptEnd::kCrashed, kHardware, kBroken);
    EXPECT_EQ(Show(Advise()), "try, tried: hardware broken");
    fMachine.fTime += Policy::kHour;
    EXPECT_EQ(Show(Advise()), "answer: hardware broken");
    fRequest.fNeedsOpenCL = true;
    EXPECT_EQ(Show(Advise()), "try, tried: hardware broken");
    fRequest.fNeedsOpenGL = false;
    EXPECT_EQ(Show(Advise()), "answer: hardware broken");
    EXPECT_EQ(fAttempts, 2);
}

TEST_F(AdviserTest, TheUsersChoiceStandsApart)
{
    Choice choice;
    choice.fOpenGL = {Usability::kSoftware, kNow};
    ASSERT_EQ(Store(fFolder).SaveChoice(choice), "");
    EXPECT_EQ(Show(Advise()), "answer: software unknown");
    EXPECT_EQ(fAttempts, 0);
    fRequest.fNeedsOpenCL = true;
    const Advice advice = Advise();
    EXPECT_EQ(Show(advice), "try, tried: software software");
    EXPECT_EQ(advice.fOpenGL.fOutlook.fFinding.fUsability, kHardware);
    fIdentity.fSystem += "x";
    fRequest.fNeedsOpenCL = false;
    EXPECT_EQ(Show(Advise()), "answer: software unknown");
    ASSERT_EQ(Store(fFolder).SaveChoice({}), "");
    EXPECT_EQ(Show(Advise()), "try, tried: hardware software");
}

TEST_F(AdviserTest, FreshAsksForOneAttempt)
{
    Advise();
    fRequest.fFresh = true;
    EXPECT_EQ(Recall().fDue, Due::kRequested);
    EXPECT_EQ(Show(Advise()), "try, tried: hardware software");
    EXPECT_EQ(fAttempts, 2);
}

TEST_F(AdviserTest, AHostThatEndedIsNoProof)
{
    Die();
    const Advice recalled = Recall();
    EXPECT_EQ(recalled.fDue, Due::kUnclear);
    EXPECT_TRUE(recalled.fIsOpen);
    EXPECT_EQ(recalled.fOpenGL.fOutlook.fFinding.fReason, "host-ended");
    EXPECT_EQ(Show(Advise()), "try, tried: hardware software");
    EXPECT_EQ(fAttempts, 2);
}

// After the next boot, the open attempt would be taken for one that ended the system.
TEST_F(AdviserTest, ClosesAnAttemptBeforeItIsMistakenForAFreeze)
{
    for (int count = 0; count < 3; ++count)
        Die();
    EXPECT_TRUE(Recall().fIsOpen);
    EXPECT_EQ(Show(Advise()), "answer: unknown unknown");
    EXPECT_FALSE(Recall().fIsOpen);
    Reboot("boot-2");
    EXPECT_EQ(Advise().fOpenGL.fOutlook.fFinding.fReason, "host-ended");
    EXPECT_EQ(fAttempts, 3);
}

TEST_F(AdviserTest, ASecondFreezeIsBroken)
{
    Die();
    Reboot("boot-2");
    EXPECT_EQ(Recall().fDue, Due::kAfterFreeze);
    EXPECT_EQ(Show(Recall()), "try: unknown unknown");
    Die();
    Reboot("boot-3");
    EXPECT_EQ(Show(Advise()), "answer: broken broken");
    EXPECT_EQ(fAttempts, 2);
    fMachine.fTime += 31 * Policy::kDay;
    EXPECT_EQ(Show(Advise()), "try, tried: hardware software");
}

TEST_F(AdviserTest, ASuccessAfterAFreezeHasAWarning)
{
    Die();
    Reboot("boot-2");
    const Advice advice = Advise();
    EXPECT_EQ(Show(advice), "try, tried: hardware software");
    EXPECT_EQ(advice.fOpenGL.fOutlook.fWarning, "An earlier attempt with OpenGL failed.");
}

TEST_F(AdviserTest, AStoppedHostBlamesNobody)
{
    SetEnd(AttemptEnd::kStopped, kUnknown, kUnknown);
    for (int count = 0; count < 10; ++count) {
        const Advice advice = Advise();
        EXPECT_EQ(Show(advice), "try, tried: unknown unknown");
        EXPECT_TRUE(advice.fStopped);
        EXPECT_EQ(advice.fOpenGL.fOutlook.fFailures, 0u);
    }
    SetEnd(AttemptEnd::kEnded, kHardware, kHardware);
    const Advice advice = Advise();
    EXPECT_EQ(Show(advice), "try, tried: hardware hardware");
    EXPECT_EQ(advice.fOpenGL.fOutlook.fWarning, "");
}

TEST_F(AdviserTest, WaitsForAnotherProcess)
{
    fFolder.fIsLocked = true;
    int waits = 0;
    fPause = [&](double seconds) {
        EXPECT_GT(seconds, 0);
        if (++waits < 5)
            return true;
        Store(fFolder).Save(MakeKnowledge(), kNow);
        fFolder.fIsLocked = false;
        return true;
    };
    EXPECT_EQ(Show(Advise()), "answer: hardware software");
    EXPECT_EQ(waits, 5);
    EXPECT_EQ(fAttempts, 0);
}

TEST_F(AdviserTest, AnswersUnknownIfAnotherProcessTakesTooLong)
{
    fFolder.fIsLocked = true;
    fRequest.fWaitSeconds = 0;
    const Advice advice = Advise();
    EXPECT_EQ(Show(advice), "wait: unknown unknown");
    EXPECT_EQ(advice.fOpenGL.fOutlook.fFinding.fReason, "other-instance");
    EXPECT_EQ(advice.fOpenGL.fOutlook.fFinding.fText,
              "Another process is trying the drivers at this moment.");
    double waited = 0;
    fRequest.fWaitSeconds = 3;
    fFolder.fReads = 0;
    fPause = [&waited](double seconds) {
        EXPECT_EQ(seconds, 0.02);
        waited += seconds;
        return true;
    };
    EXPECT_EQ(Show(Advise()), "wait: unknown unknown");
    EXPECT_NEAR(waited, 3, 0.021);
    EXPECT_LT(fFolder.fReads, 5); // a lock that is held needs no look at the files
    fPause = [](double) { return false; };
    EXPECT_TRUE(Advise().fStopped);
    EXPECT_EQ(fAttempts, 0);
}

// What was found before is left out, whether it worked or not.
TEST_F(AdviserTest, SaysNothingElseWhileAnotherProcessTries)
{
    const auto expectNothing = [this] {
        fFolder.fIsLocked = true;
        const Advice advice = Advise();
        fFolder.fIsLocked = false;
        EXPECT_EQ(Show(advice), "wait: unknown unknown");
        for (const InterfaceAdvice* part : {&advice.fOpenGL, &advice.fOpenCL}) {
            EXPECT_EQ(part->fOutlook.fFinding.fReason, "other-instance");
            EXPECT_EQ(part->fOutlook.fTime, std::nullopt);
            EXPECT_EQ(part->fOutlook.fNextTime, std::nullopt);
            EXPECT_EQ(part->fOutlook.fWarning, "");
            EXPECT_FALSE(part->fIsLast);
            EXPECT_EQ(part->fEnd, AttemptEnd::kOpen);
            EXPECT_EQ(part->fEndReason, "");
            EXPECT_EQ(part->fLastLine, "");
        }
    };
    fRequest.fWaitSeconds = 0;
    SetEnd(AttemptEnd::kCrashed, kBroken, kBroken);
    Advise();
    fMachine.fTime += Policy::kMinute;
    for (const InterfaceAdvice& part : {Recall().fOpenGL, Recall().fOpenCL}) {
        EXPECT_NE(part.fOutlook.fTime, std::nullopt);
        EXPECT_TRUE(part.fIsLast);
        EXPECT_EQ(part.fEnd, AttemptEnd::kCrashed);
        EXPECT_NE(part.fEndReason, "");
        EXPECT_NE(part.fLastLine, "");
    }
    expectNothing();
    SetEnd(AttemptEnd::kEnded, kHardware, kHardware);
    Advise();
    fRequest.fFresh = true;
    for (const InterfaceAdvice& part : {Recall().fOpenGL, Recall().fOpenCL}) {
        EXPECT_NE(part.fOutlook.fNextTime, std::nullopt);
        EXPECT_NE(part.fOutlook.fWarning, "");
    }
    expectNothing();
}

TEST_F(AdviserTest, ThoseThatWaitForAFreshAttemptShareIt)
{
    Advise();
    fRequest.fFresh = true;
    fFolder.fIsLocked = true;
    fPause = [this](double) {
        fFolder.fIsLocked = false;
        Knowledge knowledge = Store(fFolder).Load(fIdentity);
        AddAttempt(knowledge, MakeAttempt(kNow, AttemptEnd::kEnded, kHardware, kHardware));
        Store(fFolder).Save(knowledge, kNow);
        return true;
    };
    EXPECT_EQ(Show(Advise()), "answer: hardware hardware");
    EXPECT_EQ(fAttempts, 1);
}

// On a file system without locks, the record shows that another process is at work.
TEST_F(AdviserTest, TheRecordTakesThePlaceOfALock)
{
    fFolder.fCanLock = false;
    Knowledge knowledge;
    knowledge.fIdentity = fIdentity;
    Attempt open;
    open.fStarted = open.fEnded = kNow;
    open.fHost = {8, 1008, "boot-1", "machine"};
    AddAttempt(knowledge, open);
    Store(fFolder).Save(knowledge, kNow);
    fMachine.fAlive.insert(8);
    fRequest.fWaitSeconds = 0;
    EXPECT_EQ(Show(Recall()), "wait: unknown unknown");
    const Advice advice = Advise();
    EXPECT_EQ(Show(advice), "wait: unknown unknown");
    EXPECT_THAT(advice.fMessages, ElementsAre("The state can't be locked: No locks available."));
    fMachine.fAlive.erase(8);
    const Advice tried = Advise();
    EXPECT_EQ(Show(tried), "try, tried: hardware software");
    EXPECT_THAT(tried.fMessages, ElementsAre("The state can't be locked: No locks available."));
}

TEST_F(AdviserTest, AnswersFromMemoryWhileAnotherProcessRefreshes)
{
    Advise();
    fRequest.fFresh = true;
    fRun = [this](Attempt& attempt) {
        const int before = fAttempts;
        fRequest.fFresh = false;
        EXPECT_EQ(Show(Recall()), "answer: hardware software");
        EXPECT_EQ(Show(Advise()), "answer: hardware software");
        EXPECT_EQ(fAttempts, before);
        attempt = MakeAttempt(kNow, AttemptEnd::kCrashed, kBroken, kUnknown);
    };
    EXPECT_EQ(Show(Advise()), "try, tried: broken software");
}

TEST_F(AdviserTest, WithoutWritesEachCallTriesAtMostOnce)
{
    fFolder.fGoodWrites = 0;
    fFolder.fCanRemove = false;
    fFolder.fCanLock = false;
    for (int count = 1; count < 4; ++count) {
        const Advice advice = Advise();
        EXPECT_EQ(Show(advice), "try, tried: hardware software");
        EXPECT_THAT(advice.fMessages,
                    ElementsAre("The state can't be kept: No space left on device."));
        EXPECT_EQ(fAttempts, count);
    }
}

// A disk that is full from any write on, while a driver breaks: the next call must not read that it
// works.
TEST_F(AdviserTest, AFullDiskLeavesNoAnswerThatIsNotTrueAnyMore)
{
    for (int writes = 0; writes < 3; ++writes) {
        fFolder.fFiles.clear();
        fFolder.fWrites = 0;
        fFolder.fGoodWrites = 2 + writes;
        fRequest.fFresh = false;
        SetEnd(AttemptEnd::kEnded, kHardware, kHardware);
        EXPECT_EQ(Show(Advise()), "try, tried: hardware hardware");
        fRequest.fFresh = true;
        SetEnd(AttemptEnd::kCrashed, kBroken, kBroken);
        EXPECT_EQ(Show(Advise()), "try, tried: broken broken");
        fRequest.fFresh = false;
        fMachine.fAlive.erase(fMachine.fProcess);
        fMachine.fAlive.insert(++fMachine.fProcess);
        EXPECT_NE(Recall().fOpenGL.GetUsability(), kHardware) << writes;
    }
}

TEST_F(AdviserTest, AFullDiskLeavesNoAnswerThatIsHalfTrue)
{
    SetEnd(AttemptEnd::kEnded, kHardware, kHardware);
    Advise();
    fFolder.fGoodWrites = 0;
    fRequest.fFresh = true;
    SetEnd(AttemptEnd::kCrashed, kHardware, kBroken);
    EXPECT_EQ(Show(Advise()), "try, tried: hardware broken");
    fRequest.fFresh = false;
    EXPECT_NE(Recall().fOpenCL.GetUsability(), kHardware);
}

// The last line is of interest where something went wrong.
TEST_F(AdviserTest, HasTheLastLineOfWhatDoesNotWork)
{
    SetEnd(AttemptEnd::kCrashed, kHardware, kBroken);
    const Advice advice = Advise();
    EXPECT_EQ(advice.fOpenGL.fLastLine, "");
    EXPECT_EQ(advice.fOpenCL.fLastLine, "The last line.");
    EXPECT_EQ(advice.fOpenCL.fEndReason, "How it ended.");
}

TEST_F(AdviserTest, AFullDiskLeavesAnAnswerThatIsStillTrue)
{
    Advise();
    fFolder.fGoodWrites = 0;
    fRequest.fFresh = true;
    Advise();
    fRequest.fFresh = false;
    EXPECT_EQ(Show(Recall()), "answer: hardware software");
}

// Returns what the next call answers with this state, where no attempt can succeed.
class DamageTest : public AdviserTest {
protected:
    DamageTest()
    {
        SetEnd(AttemptEnd::kCrashed, kBroken, kUnknown);
        Advise();
        fName = fFolder.fFiles.begin()->first;
        fBroken = fFolder.GetState();
        fFolder.fFiles.clear();
        SetEnd(AttemptEnd::kEnded, kHardware, kHardware);
        Advise();
        fGood = fFolder.GetState();
    }

    void Check(const std::string& text, bool isOfBroken)
    {
        fFolder.fFiles = {{fName, text}};
        const Advice recalled = Recall();
        if (isOfBroken)
            EXPECT_NE(recalled.fOpenGL.GetUsability(), kHardware) << text;
        else if (recalled.fOpenGL.GetUsability() != kHardware)
            EXPECT_THAT(recalled.fMessages, testing::SizeIs(1)) << text;
        if (++fChecks % 16 != 0)
            return;
        SetEnd(AttemptEnd::kCrashed, kBroken, kBroken);
        const Advice advice = Advise();
        EXPECT_EQ(advice.fTried, recalled.fPlan == Plan::kTry);
        EXPECT_EQ(advice.fOpenGL.GetUsability() == kHardware,
                  recalled.fOpenGL.GetUsability() == kHardware);
    }

    int fChecks = 0;
    std::string fName;
    std::string fGood;
    std::string fBroken;
};

TEST_F(DamageTest, AStateThatIsCutAtAnyByteIsNeverAWrongHardware)
{
    for (std::size_t size = 0; size <= fBroken.size(); ++size)
        Check(fBroken.substr(0, size), true);
    for (std::size_t size = 0; size <= fGood.size(); ++size)
        Check(fGood.substr(0, size), false);
}

TEST_F(DamageTest, AStateWithAnyByteFlippedIsNeverAWrongHardware)
{
    for (std::size_t byte = 0; byte < fBroken.size(); ++byte)
        for (const int flip : {1, 0xFF}) {
            std::string text = fBroken;
            text[byte] = static_cast<char>(text[byte] ^ flip);
            Check(text, true);
        }
    for (std::size_t byte = 0; byte < fGood.size(); ++byte) {
        std::string text = fGood;
        text[byte] = static_cast<char>(~text[byte]);
        Check(text, false);
    }
}

TEST_F(AdviserTest, AClockThatIsSetByYearsCostsOneAttemptEach)
{
    Advise();
    for (const std::int64_t years : {-20, 5, 30, -3}) {
        fMachine.fTime = kNow + years * 365 * Policy::kDay;
        const int before = fAttempts;
        SetEnd(AttemptEnd::kCrashed, kBroken, kBroken);
        EXPECT_EQ(Show(Advise()), "try, tried: broken broken") << years;
        EXPECT_EQ(Show(Advise()), "answer: broken broken") << years;
        EXPECT_EQ(fAttempts, before + 1);
    }
}

} // namespace
} // namespace assay_host
