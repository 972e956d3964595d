#include "report/RunText.h"

#include <algorithm>

#include <fmt/format.h>

#include "report/Bytes.h"

namespace assay_host {

std::string GetRunText(const Report& report, const RunOutcome& outcome)
{
    switch (outcome.fVerdict) {
    case Verdict::kComplete:
        return "all tests ran";
    case Verdict::kFailedTests:
        return report.IsWhole() ? "ended with a failure" : "ended early";
    case Verdict::kUsageError:
        return "options rejected";
    case Verdict::kCrashed:
        return "crashed";
    case Verdict::kHung:
        return "did not end";
    case Verdict::kNeverStarted:
        return "did not start";
    case Verdict::kInterrupted:
        return "interrupted";
    }
    return {};
}

std::string GetEndText(const RunOutcome& outcome)
{
    if (outcome.fTermination.empty())
        return {};
    if (outcome.fVerdict == Verdict::kHung)
        return "assay-host, at the time limit";
    if (outcome.fVerdict == Verdict::kInterrupted)
        return "the interruption of the run";
    return ShowBytes(outcome.fTermination);
}

std::string GetCommandText(const RunOutcome& outcome)
{
    std::string text;
    for (const std::string& word : outcome.fCommand)
        text += (text.empty() ? "" : " ") + ShowBytes(word);
    return text;
}

std::string GetUsableText(const Usable& usable)
{
    return fmt::format("{}{}: {}", GetUsabilityName(usable.fUsability),
                       usable.fTag.empty() ? "" : " (" + usable.fTag + ")", usable.fText);
}

std::string GetTimeText(const RunOutcome& outcome)
{
    std::string text = fmt::format("{:.2f} s", outcome.fSeconds);
    if (outcome.fTimeoutSeconds > 0)
        text += fmt::format(" (limit {:g} s)", outcome.fTimeoutSeconds);
    return text;
}

std::string GetCountText(const Answers& answers)
{
    std::string text;
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        const auto count =
            std::count_if(answers.fDevices.begin(), answers.fDevices.end(),
                          [kind](const DeviceAnswers& device) { return device.fKind == kind; });
        const auto answer =
            std::find_if(answers.fReport.begin(), answers.fReport.end(),
                         [kind](const Answer& row) { return row.fKey == GetCountKey(kind); });
        const char* const name = GetKindName(kind);
        text += text.empty() ? "" : ", ";
        if (answer->fMissing == Missing::kNoOpenCL)
            text += fmt::format("no {}", name);
        else if (answer->fMissing == Missing::kRunEnded && count == 0)
            text += fmt::format("{} not reached", name);
        else if (answer->fMissing == Missing::kUnreadable && count == 0)
            text += fmt::format("{} not known", name);
        else if (count == 0)
            text += fmt::format(
                kind == DeviceKind::kOpenCL ? "no {} graphics device" : "no {} device", name);
        else
            text += fmt::format("{} {}", count, name);
    }
    return text;
}

std::vector<std::string> GetRawLines(const Report& report)
{
    std::vector<std::string> texts;
    for (const ReportLine& line : report.GetLines())
        if (line.fKind == LineKind::kRaw && !line.fText.empty())
            texts.push_back(line.fText);
    return texts;
}

} // namespace assay_host
