#include "supervise/Judge.h"

#include <algorithm>

#include <fmt/format.h>

#include "pmutil/Options.h"
#include "report/Activity.h"
#include "report/LineForm.h"
#include "report/RunLog.h"
#include "supervise/ExitStatus.h"

namespace assay_host {

namespace {

constexpr int kFailedStatus = 2;
constexpr int kUsageStatus = 3;

bool StartsWith(const std::string& text, const char* start)
{
    return text.rfind(start, 0) == 0;
}

bool IsUsageLine(const std::string& line)
{
    return StartsWith(line, "Usage exception: ") || StartsWith(line, "usage: ");
}

std::string FindErrorLine(const RunOutcome& outcome, bool (*matches)(const std::string&))
{
    const auto line = std::find_if(outcome.fErrorLines.begin(), outcome.fErrorLines.end(), matches);
    return line == outcome.fErrorLines.end() ? std::string() : *line;
}

// An exit status above 255 on Windows counts as a crash, so that its code has to be compared.
bool HasStatus(const Evidence& evidence, std::int64_t status)
{
    if (evidence.fEnd->fResult == pmutil::kEndedNormally)
        return evidence.fEnd->fExitCode == status;
    return evidence.fEnd->fTerminationText == fmt::format("code 0x{:08X}", status);
}

// Returns where the report stopped, as the end of a sentence.
std::string Where(const ReportProgress& report)
{
    if (!report.HasValues())
        return " before its first line";
    const std::string next = report.GetSequence().GetNextKey();
    return next.empty() ? " after the report was whole" : " while " + GetActivityText(next);
}

void JudgeNormalEnd(const Evidence& evidence, RunOutcome& outcome)
{
    const int status = evidence.fEnd->fExitCode;
    const std::string failure = FindErrorLine(outcome, IsFailureLine);
    if (status == kUsageStatus && !evidence.fReport.HasValues() &&
        !FindErrorLine(outcome, IsUsageLine).empty()) {
        outcome.fVerdict = Verdict::kUsageError;
        outcome.fReason = "assay rejected its command line.";
    } else if (!evidence.fReport.IsWhole()) {
        outcome.fVerdict = Verdict::kFailedTests;
        outcome.fReason = fmt::format("The report stopped{}; assay ended with status {}{}.",
                                      Where(evidence.fReport), status,
                                      failure.empty() ? "" : " (" + failure + ")");
    } else {
        outcome.fVerdict = Verdict::kFailedTests;
        outcome.fReason = fmt::format("The report is whole, but assay ended with status {}{}.",
                                      status, failure.empty() ? "" : " (" + failure + ")");
    }
}

// With -exit=2 the status doesn't show whether tests failed; only standard error does.
bool IsComplete(const Evidence& evidence, const RunOutcome& outcome)
{
    if (!evidence.fReport.IsWhole())
        return false;
    const std::vector<std::string> options(outcome.fCommand.begin() + 1, outcome.fCommand.end());
    const std::int64_t requested = GetReportedStatus(GetRequestedStatus(options));
    if (!HasStatus(evidence, requested))
        return false;
    return requested != kFailedStatus || FindErrorLine(outcome, IsFailureLine).empty();
}

} // namespace

void ReportProgress::Add(const ReportLine& line)
{
    fSequence.Add(line);
    fCopies.Add(line);
    if (line.fKind == LineKind::kComment) {
        fLastLogLine = line.fText;
        return;
    }
    if (line.fKind == LineKind::kRaw)
        return;
    fHasValues = true;
    fHasStart = fHasStart || (IsStamp(line) && line.fKey == "assayStart");
    fHasEnd = fHasEnd || (IsStamp(line) && line.fKey == "assayEnd");
    fLastReportLine = line.fText;
    fLastKey = line.fKey;
    fLastLogLine.clear();
}

void Judge(const Evidence& evidence, RunOutcome& outcome)
{
    outcome.fLowerBounds = evidence.fReport.GetLowerBounds();
    outcome.fLastReportLine = evidence.fReport.GetLastReportLine();
    outcome.fLastLogLine = evidence.fReport.GetLastLogLine();
    if (!evidence.fStartFailure.empty()) {
        outcome.fVerdict = Verdict::kNeverStarted;
        outcome.fReason = fmt::format("assay could not be started: {}.", evidence.fStartFailure);
        return;
    }
    const bool endedByItself = evidence.fEnd && evidence.fEnd->fResult == pmutil::kEndedNormally;
    if (endedByItself)
        outcome.fExitStatus = evidence.fEnd->fExitCode;
    else if (evidence.fEnd)
        outcome.fTermination = evidence.fEnd->fTerminationText;

    if (evidence.fEnd && evidence.fEnd->fResult != pmutil::kEndedByKill &&
        IsComplete(evidence, outcome)) {
        outcome.fVerdict = Verdict::kComplete;
        outcome.fReason = "All tests ran, and the report is whole.";
    } else if (evidence.fKillReason == KillReason::kInterrupt) {
        outcome.fVerdict = Verdict::kInterrupted;
        outcome.fReason = fmt::format("The run was interrupted{}.", Where(evidence.fReport));
    } else if (endedByItself) {
        JudgeNormalEnd(evidence, outcome);
    } else if (evidence.fKillReason == KillReason::kTimeout) {
        outcome.fVerdict = Verdict::kHung;
        outcome.fReason = fmt::format(
            "assay did not end within {:g} s and {}{}.", outcome.fTimeoutSeconds,
            evidence.fEnd ? "was killed" : "could not be killed", Where(evidence.fReport));
    } else {
        outcome.fVerdict = Verdict::kCrashed;
        outcome.fReason =
            fmt::format("assay crashed with {}{}.", outcome.fTermination, Where(evidence.fReport));
    }
}

std::int32_t GetRequestedStatus(const std::vector<std::string>& options)
{
    std::int32_t status = 0;
    for (const std::string& word : options) {
        const std::optional<pmutil::Option> option = pmutil::SplitOption(word);
        if (option && option->fName == "exit")
            status = pmutil::ParseInteger(option->fValue);
    }
    return status;
}

} // namespace assay_host
