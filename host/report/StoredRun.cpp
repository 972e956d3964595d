#include "report/StoredRun.h"

#include <fmt/format.h>

#include "report/Activity.h"
#include "report/Answers.h"
#include "report/CopyClock.h"
#include "report/LogFilter.h"
#include "report/RunLog.h"
#include "report/SequenceReader.h"

namespace assay_host {

RunOutcome MakeOutcomeOfReport(const Report& report)
{
    RunOutcome outcome;
    outcome.fVerdict = report.IsWhole() ? Verdict::kComplete : Verdict::kFailedTests;
    const std::string next = GetAnswers(report).fNext;
    outcome.fReason = report.IsWhole()
                          ? "The report is whole; how assay ended was not stored."
                          : fmt::format("The report stopped{}; how assay ended was not stored.",
                                        next.empty() ? "" : " while " + GetActivityText(next));
    outcome.fDrivers.fReason = "they were not stored";
    CopyClock copies;
    RunLog log;
    SequenceReader sequence;
    for (const ReportLine& line : report.GetLines()) {
        if (line.fKind == LineKind::kComment && IsLogLine(line.fText))
            log.Add(GetLogText(line.fText), sequence, outcome);
        sequence.Add(line);
        copies.Add(line);
        if (line.fKind == LineKind::kValue)
            outcome.fLastReportLine = line.fText;
    }
    outcome.fLowerBounds = copies.GetBounds();
    return outcome;
}

} // namespace assay_host
