#include "supervise/Judge.h"

#include <cstdio>
#include <limits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "supervise/ExitStatus.h"
#include "support/Reports.h"

namespace assay_host {
namespace {

using testing::HasSubstr;

struct Case {
    std::string fReport;
    std::vector<std::string> fErrors;
    std::vector<std::string> fArgs;
    std::optional<pmutil::ChildEnd> fEnd;
    KillReason fKillReason = KillReason::kNone;
    std::string fTermination{};

    RunOutcome Judge() const
    {
        Evidence evidence;
        const Report report = ReadReport(fReport);
        for (const ReportLine& line : report.GetLines())
            evidence.fReport.Add(line);
        evidence.fEnd = fEnd;
        evidence.fKillReason = fKillReason;
        if (evidence.fEnd)
            evidence.fEnd->fTerminationText = fTermination;
        RunOutcome outcome;
        outcome.fCommand = {"assay"};
        outcome.fCommand.insert(outcome.fCommand.end(), fArgs.begin(), fArgs.end());
        outcome.fErrorLines = fErrors;
        outcome.fTimeoutSeconds = 5;
        assay_host::Judge(evidence, outcome);
        return outcome;
    }
};

pmutil::ChildEnd Ended(int status)
{
    return {pmutil::kEndedNormally, status, {}};
}

const std::string kWhole = "assayStart=\"x\"\nassayEnd=\"y\"\n";
const std::string kBroken = "assayStart=\"x\"\nQGFCoreInitialized=1\n";

TEST(Judge, CallsAWholeReportWithTheRequestedStatusComplete)
{
    EXPECT_EQ((Case{kWhole, {}, {}, Ended(0)}.Judge().fVerdict), Verdict::kComplete);
    EXPECT_EQ((Case{kWhole, {}, {"-exit=7"}, Ended(7)}.Judge().fVerdict), Verdict::kComplete);
    EXPECT_EQ((Case{kWhole, {}, {"-exit=0x7"}, Ended(7)}.Judge().fVerdict), Verdict::kComplete);
    EXPECT_EQ((Case{kWhole, {}, {"-exit=7", "-exit=\"3\""}, Ended(3)}.Judge().fVerdict),
              Verdict::kComplete);
    EXPECT_EQ((Case{kWhole, {"a driver's words"}, {"-exit=2"}, Ended(2)}.Judge().fVerdict),
              Verdict::kComplete);
}

TEST(Judge, AcceptsALargeRequestedStatus)
{
    Case large{kWhole, {}, {"-exit=300"}, pmutil::ChildEnd{pmutil::kEndedByCrash, 0, {}}};
    char code[sizeof "code 0x00000000"];
    std::snprintf(code, sizeof code, "code 0x%08X", static_cast<unsigned>(GetReportedStatus(300)));
    large.fTermination = code;
    EXPECT_EQ(large.Judge().fVerdict, Verdict::kComplete);
    large.fTermination = "code 0xC0000005";
    EXPECT_EQ(large.Judge().fVerdict, Verdict::kCrashed);
}

TEST(Judge, CallsAnyOtherEndFailed)
{
    EXPECT_EQ((Case{kWhole, {}, {}, Ended(2)}.Judge().fVerdict), Verdict::kFailedTests);
    EXPECT_EQ((Case{kWhole, {}, {"-exit=7"}, Ended(0)}.Judge().fVerdict), Verdict::kFailedTests);
    EXPECT_EQ((Case{kBroken, {}, {}, Ended(0)}.Judge().fVerdict), Verdict::kFailedTests);
    EXPECT_EQ((Case{"", {}, {}, Ended(0)}.Judge().fVerdict), Verdict::kFailedTests);
    for (const char* start : {"", "Tester=\"x\"\n", "assayStart=1\n"})
        EXPECT_EQ(
            (Case{start + std::string("assayEnd=\"y\"\n"), {}, {}, Ended(0)}.Judge().fVerdict),
            Verdict::kFailedTests)
            << start;
    const RunOutcome failed = Case{kWhole, {"exception: x"}, {"-exit=2"}, Ended(2)}.Judge();
    EXPECT_EQ(failed.fVerdict, Verdict::kFailedTests);
    EXPECT_THAT(failed.fReason, HasSubstr("exception: x"));
    EXPECT_EQ(failed.fExitStatus, 2);
    EXPECT_THAT(
        (Case{kBroken, {}, {}, Ended(2)}.Judge().fReason),
        HasSubstr("The report stopped while loading OpenGL (QGFOGLInitialized); assay ended"));
    EXPECT_THAT((Case{"", {}, {}, Ended(0)}.Judge().fReason), HasSubstr("before its first line"));
}

TEST(Judge, CallsAReportWithAnIncompleteStampStopped)
{
    for (const char* end : {"", "=", "=\n", "=\"2026-11", "=\"x\""}) {
        const RunOutcome outcome =
            Case{"assayStart=\"x\"\nassayEnd" + std::string(end), {}, {}, Ended(0)}.Judge();
        EXPECT_EQ(outcome.fVerdict, Verdict::kFailedTests) << end;
        EXPECT_THAT(outcome.fReason, HasSubstr("The report stopped")) << end;
    }
}

TEST(Judge, SaysHowAChildThatEndedByItselfFailed)
{
    const auto tell = [](const std::string& report, const std::vector<std::string>& errors,
                         int status) {
        return Case{report, errors, {}, Ended(status)}.Judge().fReason;
    };
    EXPECT_EQ(tell("", {"usage: x"}, 3), "assay rejected its command line.");
    EXPECT_EQ(tell(kWhole, {}, 2), "The report is whole, but assay ended with status 2.");
    EXPECT_EQ(tell(kWhole, {"exception: x"}, 2),
              "The report is whole, but assay ended with status 2 (exception: x).");
    EXPECT_EQ(tell("", {}, 1),
              "The report stopped before its first line; assay ended with status 1.");
    EXPECT_EQ(tell("", {"a text", "unknown exception"}, 1),
              "The report stopped before its first line; assay ended with status 1 (unknown "
              "exception).");
}

TEST(Judge, SaysHowARunEnded)
{
    const pmutil::ChildEnd killed{pmutil::kEndedByKill, 0, {}};
    const pmutil::ChildEnd crashed{pmutil::kEndedByCrash, 0, {}};
    EXPECT_EQ((Case{kWhole, {}, {}, Ended(0)}.Judge().fReason),
              "All tests ran, and the report is whole.");
    EXPECT_EQ((Case{"", {}, {}, killed, KillReason::kTimeout}.Judge().fReason),
              "assay did not end within 5 s and was killed before its first line.");
    EXPECT_EQ((Case{"", {}, {}, {}, KillReason::kTimeout}.Judge().fReason),
              "assay did not end within 5 s and could not be killed before its first line.");
    EXPECT_EQ((Case{"", {}, {}, killed, KillReason::kInterrupt}.Judge().fReason),
              "The run was interrupted before its first line.");
    EXPECT_EQ((Case{"", {}, {}, crashed, KillReason::kNone, "signal 11"}.Judge().fReason),
              "assay crashed with signal 11 before its first line.");
}

TEST(Judge, DetectsAUsageErrorByStatusAndText)
{
    const std::vector<std::string> usage = {"Usage exception: usage", "usage: "};
    EXPECT_EQ((Case{"# text\n", usage, {}, Ended(3)}.Judge().fVerdict), Verdict::kUsageError);
    for (const std::string& line : usage)
        EXPECT_EQ((Case{"", {"text", line}, {}, Ended(3)}.Judge().fVerdict), Verdict::kUsageError);
    EXPECT_EQ((Case{"", {"no usage: "}, {}, Ended(3)}.Judge().fVerdict), Verdict::kFailedTests);
    EXPECT_EQ((Case{"", {}, {}, Ended(3)}.Judge().fVerdict), Verdict::kFailedTests);
    EXPECT_EQ((Case{"", usage, {}, Ended(4)}.Judge().fVerdict), Verdict::kFailedTests);
    EXPECT_EQ((Case{kWhole, usage, {"-exit=3"}, Ended(3)}.Judge().fVerdict), Verdict::kComplete);
}

TEST(Judge, DistinguishesCrashHangAndInterrupt)
{
    Case died{kBroken, {}, {}, pmutil::ChildEnd{pmutil::kEndedByCrash, 0, {}}};
    died.fTermination = "signal 11 (Segmentation fault)";
    EXPECT_EQ(died.Judge().fVerdict, Verdict::kCrashed);
    EXPECT_EQ(died.Judge().fTermination, died.fTermination);
    EXPECT_THAT(died.Judge().fReason, HasSubstr(died.fTermination));
    EXPECT_EQ(died.Judge().fExitStatus, std::nullopt);
    EXPECT_EQ(died.Judge().fLastReportLine, "QGFCoreInitialized=1");

    died.fKillReason = KillReason::kInterrupt; // Ctrl-C reaches the child too
    EXPECT_EQ(died.Judge().fVerdict, Verdict::kInterrupted);
    EXPECT_THAT(died.Judge().fReason, testing::StartsWith("The run was interrupted"));
    EXPECT_THAT(died.Judge().fReason, HasSubstr("while loading OpenGL (QGFOGLInitialized)"));
    died.fEnd->fResult = pmutil::kEndedByKill;
    EXPECT_EQ(died.Judge().fVerdict, Verdict::kInterrupted);
    died.fKillReason = KillReason::kTimeout;
    EXPECT_EQ(died.Judge().fVerdict, Verdict::kHung);
    EXPECT_THAT(died.Judge().fReason, HasSubstr("within 5 s and was killed"));

    // A child that doesn't end is hung even if its report is whole.
    died.fReport = kWhole;
    EXPECT_EQ(died.Judge().fVerdict, Verdict::kHung);
}

TEST(Judge, TakesTheBoundsOfMeasurementsFromTheLog)
{
    const std::string prefix = "# 00001.2026.11.22_10:00:00.";
    const std::string name = "(+00.000)[tid=1] GPUImplHardware::checkBandwidthCL: ";
    const RunOutcome outcome = Case{prefix + "000" + name + "0 of 100, totalSeconds=0\n" + prefix +
                                        "099" + name + "seconds=0.1\nclgpu[0].CLBandwidth=1\n",
                                    {},
                                    {},
                                    Ended(0)}
                                   .Judge();
    EXPECT_DOUBLE_EQ(outcome.FindLowerBound("clgpu[0].CLBandwidth"), 3355443200);
    EXPECT_EQ(outcome.FindLowerBound("clgpu[1].CLBandwidth"), 0);
}

TEST(Judge, KeepsAnEndJustBeforeTheKill)
{
    Case ended{kWhole, {}, {}, Ended(0)};
    for (const KillReason reason : {KillReason::kTimeout, KillReason::kInterrupt}) {
        ended.fKillReason = reason;
        EXPECT_EQ(ended.Judge().fVerdict, Verdict::kComplete);
    }
}

TEST(ReportProgress, KeepsALogLineOnlyAfterTheLastReportLine)
{
    ReportProgress progress;
    const Report first = ReadReport("# one\na=1\n");
    for (const ReportLine& line : first.GetLines())
        progress.Add(line);
    EXPECT_EQ(progress.GetLastLogLine(), "");
    const Report second = ReadReport("# two\nraw\n");
    for (const ReportLine& line : second.GetLines())
        progress.Add(line);
    EXPECT_EQ(progress.GetLastLogLine(), "# two");
    EXPECT_EQ(progress.GetLastReportLine(), "a=1");
}

TEST(GetRequestedStatus, ParsesAsTheChildDoes)
{
    EXPECT_EQ(GetRequestedStatus({}), 0);
    EXPECT_EQ(GetRequestedStatus({"-exit=010"}), 8);
    EXPECT_EQ(GetRequestedStatus({"-exit=7x"}), 7);
    EXPECT_EQ(GetRequestedStatus({"-exit="}), 0);
    EXPECT_EQ(GetRequestedStatus({"exit=7", "-exit"}), 0);
    EXPECT_EQ(GetRequestedStatus({"-exit=7", "-exitt=8", "-Exit=9"}), 7);
    EXPECT_EQ(GetRequestedStatus({"-exit=\"9\""}), 9);
    using Limits = std::numeric_limits<std::int32_t>;
    for (const char* text :
         {"2147483648", "4294967296", "99999999999", "0x100000000", "99999999999999999999999"})
        EXPECT_EQ(GetRequestedStatus({std::string("-exit=") + text}), Limits::max()) << text;
    for (const char* text : {"-2147483649", "-4294967296", "-99999999999999999999999"})
        EXPECT_EQ(GetRequestedStatus({std::string("-exit=") + text}), Limits::min()) << text;
}

} // namespace
} // namespace assay_host
