#include "memory/Closing.h"

#include <gtest/gtest.h>

#include "Samples.h"
#include "support/Reports.h"

namespace assay_host {
namespace {

// Returns the report of a machine with one device of each kind, up to the line with this text.
Report MakeReport(const std::string& last = "assayEnd")
{
    std::vector<std::string> lines;
    for (const auto& group : MakeWholeRun(1, 1))
        for (const std::string& line : group) {
            lines.push_back(line);
            if (line.find(last) != std::string::npos)
                return ReadReport(lines);
        }
    ADD_FAILURE() << "no line with " << last;
    return ReadReport(lines);
}

Attempt Close(Verdict verdict, const std::string& last = "assayEnd",
              const std::string& termination = {})
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    outcome.fTermination = termination;
    outcome.fReason = "The reason.";
    outcome.fLastReportLine = "line";
    Attempt attempt;
    attempt.fStarted = attempt.fEnded = kNow;
    CloseAttempt(attempt, MakeReport(last), outcome, kNow + 5);
    return attempt;
}

std::string Show(const Attempt& attempt)
{
    const auto show = [](const Finding& finding) {
        return std::string(" ") + GetUsabilityName(finding.fUsability) + ":" + finding.fReason;
    };
    return GetAttemptEndName(attempt.fEnd) + show(attempt.fOpenGL) + show(attempt.fOpenCL);
}

TEST(ClosingTest, KeepsHowTheChildEnded)
{
    const Attempt attempt = Close(Verdict::kComplete);
    EXPECT_EQ(Show(attempt), "ended hardware:trials-passed hardware:trials-passed");
    EXPECT_EQ(attempt.fStarted, kNow);
    EXPECT_EQ(attempt.fEnded, kNow + 5);
    EXPECT_EQ(attempt.fReason, "The reason.");
    EXPECT_EQ(attempt.fLastLine, "line");
    EXPECT_EQ(attempt.fOpenGL.fTag, "glgpu[0]");
    EXPECT_EQ(attempt.fOpenGL.fDevice, "A card");
    EXPECT_EQ(attempt.fOpenGL.fDriver, "1.2");
    EXPECT_EQ(attempt.fOpenCL.fTag, "clgpu[0]");
    EXPECT_EQ(attempt.fOpenCL.fDevice, "A device");
    EXPECT_EQ(attempt.fOpenCL.fDriver, "390");
    EXPECT_EQ(attempt.fOpenGL.fText, "OpenGL works on graphics hardware.");
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kFailedTests;
    outcome.fExitStatus = 2;
    outcome.fLastReportLine = "a report line";
    outcome.fLastLogLine = "# a log line";
    outcome.fReason = std::string(5000, 'x');
    outcome.fTermination = "signal 6 (Aborted)";
    Attempt failed;
    CloseAttempt(failed, MakeReport(), outcome, kNow);
    EXPECT_EQ(failed.fExitStatus, 2);
    EXPECT_EQ(failed.fTermination, "signal 6 (Aborted)");
    EXPECT_EQ(failed.fLastLine, "# a log line");
    EXPECT_EQ(failed.fReason.size(), 1000u);
}

TEST(ClosingTest, KeepsWhatIsKnownOfTheDevice)
{
    const auto close = [](const std::string& name) {
        Attempt attempt;
        RunOutcome outcome;
        outcome.fVerdict = Verdict::kComplete;
        std::vector<std::string> lines;
        for (std::string line : Join(MakeWholeRun(1, -1))) {
            if (line == GL(0, "GLName=\"A card\""))
                line = GL(0, "GLName=\"" + name + "\"");
            if (line == GL(0, "GLDriverVersion=\"1.2\""))
                line = GL(0, "GLDriverVersion=\"?\"");
            lines.push_back(line);
        }
        CloseAttempt(attempt, ReadReport(lines), outcome, kNow);
        return attempt.fOpenGL;
    };
    EXPECT_EQ(close("").fDevice, "A renderer") << "the list of adapters has no name";
    EXPECT_EQ(close("B").fDevice, "B");
    EXPECT_EQ(close("B").fDriver, "") << "the list of adapters has no version";
    EXPECT_EQ(close(std::string(1001, 'x')).fDevice, std::string(1000, 'x'));
}

TEST(ClosingTest, BlamesTheDriverThatEndedTheChild)
{
    const std::string kSegv = "signal 11 (Segmentation fault)";
    EXPECT_EQ(Show(Close(Verdict::kCrashed, "NumGLGPUs", kSegv)),
              "crashed broken:crashed unknown:ended-before");
    EXPECT_EQ(Show(Close(Verdict::kCrashed, "NumCLGPUs", kSegv)),
              "crashed hardware:trials-passed broken:crashed");
    EXPECT_EQ(Show(Close(Verdict::kHung, "NumCLGPUs", "signal 9 (Killed)")),
              "hung hardware:trials-passed broken:hung");
    EXPECT_EQ(Show(Close(Verdict::kFailedTests, "NumGLGPUs")),
              "ended broken:ended unknown:ended-before");
    EXPECT_EQ(Show(Close(Verdict::kCrashed, "assayEnd", kSegv)),
              "crashed hardware:trials-passed hardware:trials-passed");
    EXPECT_EQ(Show(Close(Verdict::kCrashed, "NumGLGPUs", "code 0xC0000005")),
              "crashed broken:crashed unknown:ended-before");
}

TEST(ClosingTest, BlamesNobodyForTheRest)
{
    EXPECT_EQ(Show(Close(Verdict::kNeverStarted, "Tester")),
              "not-started unknown:never-started unknown:never-started");
    EXPECT_EQ(Show(Close(Verdict::kUsageError, "Tester")),
              "ended unknown:usage-error unknown:usage-error");
    EXPECT_EQ(Show(Close(Verdict::kInterrupted, "NumGLGPUs", "signal 9 (Killed)")),
              "host-stopped unknown:interrupted unknown:interrupted");
    EXPECT_EQ(Show(Close(Verdict::kInterrupted, "NumCLGPUs", "signal 9 (Killed)")),
              "host-stopped hardware:trials-passed unknown:interrupted");
    for (const char* const order :
         {"signal 1 (Hangup)", "signal 2 (Interrupt)", "signal 3 (Quit)", "signal 9 (Killed)",
          "signal 15 (Terminated)", "code 0xC000013A", "code 0x40010004", "code 0xC0000142"}) {
        EXPECT_EQ(Show(Close(Verdict::kCrashed, "NumGLGPUs", order)),
                  "killed unknown:killed unknown:killed");
        EXPECT_EQ(Show(Close(Verdict::kCrashed, "NumCLGPUs", order)),
                  "killed hardware:trials-passed unknown:killed");
    }
    EXPECT_EQ(Close(Verdict::kCrashed, "NumCLGPUs", "signal 9 (Killed)").fOpenCL.fText,
              "Another process killed the child while OpenCL was tried.");
    EXPECT_EQ(Show(Close(Verdict::kCrashed, "NumGLGPUs", "signal 10 (Bus error)")),
              "crashed broken:crashed unknown:ended-before");
}

class SettleTest : public testing::Test {
protected:
    // Returns the state, and how the attempt ended.
    std::string Settle(std::uint64_t process, const std::string& boot,
                       const std::string& machine = "machine")
    {
        Attempt attempt;
        attempt.fHost = {process, 1000 + process, boot, machine};
        std::vector<Attempt> attempts = {
            MakeAttempt(kNow, AttemptEnd::kCrashed, Usability::kBroken, Usability::kUnknown),
            attempt};
        const OpenState state = SettleOpen(attempts, fMachine);
        EXPECT_EQ(attempts[0].fEnd, AttemptEnd::kCrashed);
        EXPECT_EQ(attempts[1].fReason, state == OpenState::kAlive ? ""
                                       : attempts[1].fEnd == AttemptEnd::kSystemEnded
                                           ? "The system ended during the attempt."
                                           : "The host ended during the attempt.");
        return std::string(state == OpenState::kAlive ? "alive " : "settled ") +
               GetAttemptEndName(attempts[1].fEnd);
    }

    FakeMachine fMachine;
};

TEST_F(SettleTest, TellsWhatBecameOfTheHost)
{
    fMachine.fAlive.insert(8);
    EXPECT_EQ(Settle(8, "boot-1"), "alive open");
    EXPECT_EQ(Settle(7, "boot-1"), "alive open"); // a thread of this process
    EXPECT_EQ(Settle(9, "boot-1"), "settled host-ended");
    EXPECT_EQ(Settle(9, "boot-2"), "settled system-ended");
    EXPECT_EQ(Settle(8, "boot-2"), "settled system-ended"); // the id is used again
}

TEST_F(SettleTest, SuspectsNoFreezeThatItCannotKnow)
{
    EXPECT_EQ(Settle(9, ""), "settled host-ended");
    EXPECT_EQ(Settle(8, "boot-2", "another machine"), "settled host-ended");
    EXPECT_EQ(Settle(8, "boot-2", ""), "settled host-ended");
    fMachine.fBoot.clear();
    EXPECT_EQ(Settle(9, "boot-1"), "settled host-ended");
}

TEST_F(SettleTest, LeavesWhatIsClosed)
{
    std::vector<Attempt> attempts;
    EXPECT_EQ(SettleOpen(attempts, fMachine), OpenState::kNone);
    attempts = {MakeAttempt(kNow, AttemptEnd::kEnded, Usability::kHardware, Usability::kAbsent)};
    EXPECT_EQ(SettleOpen(attempts, fMachine), OpenState::kNone);
    EXPECT_EQ(attempts[0].fEnd, AttemptEnd::kEnded);
}

} // namespace
} // namespace assay_host
