#include "series/SeriesTexts.h"

#include <algorithm>
#include <map>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/LineForm.h"
#include "report/ValueText.h"
#include "series/FactLog.h"

namespace assay_host {

namespace {

// Outliers that are named. A document has all.
constexpr std::size_t kMaxOutliersNamed = 10;

std::string GetRunsText(std::size_t runs)
{
    return runs == 1 ? "1 run" : fmt::format("{} runs", runs);
}

std::string GetOutliersText(const Measurement& measurement,
                            const std::vector<SeriesSample>& outliers)
{
    std::string text;
    const std::size_t named = std::min(outliers.size(), kMaxOutliersNamed);
    for (std::size_t index = 0; index < named; ++index)
        text +=
            fmt::format("{}{} in run {}", index == 0 ? "" : ", ",
                        GetMeasuredText(measurement, outliers[index].fValue), outliers[index].fRun);
    if (outliers.size() > named)
        text += fmt::format(" and {} more", outliers.size() - named);
    return text;
}

std::string GetEndText(const Series& series)
{
    switch (series.fEnd) {
    case SeriesEnd::kDone:
        return {};
    case SeriesEnd::kInterrupted:
        return "it was interrupted before its end";
    case SeriesEnd::kGivenUp:
        return "each further run would have ended the same way";
    case SeriesEnd::kFull:
        return "it has as many samples as a document can have";
    }
    return {};
}

} // namespace

std::string GetSeriesTitle(const Series& series)
{
    return "Series: " + GetRunsText(series.fRuns);
}

SeriesRows GetSeriesRows(const Series& series)
{
    std::string verdicts;
    for (const VerdictCount& count : series.fVerdicts)
        verdicts += fmt::format("{}{} {}", verdicts.empty() ? "" : ", ", count.fRuns,
                                GetVerdictName(count.fVerdict));
    SeriesRows rows = {{"Verdicts", verdicts}};
    if (series.fPlan.fRuns > series.fRuns)
        rows.emplace_back("Asked for", GetRunsText(series.fPlan.fRuns));
    if (const std::string end = GetEndText(series); !end.empty())
        rows.emplace_back("Ended early", end);
    rows.emplace_back("Time", fmt::format("{:.2f} s", series.fSeconds));
    const char* const why = series.fVerdicts.size() > 1 ? ", the first with the worst verdict" : "";
    rows.emplace_back("Facts above",
                      fmt::format("of run {}{}; measurements are medians", series.fShown, why));
    return rows;
}

std::string GetFindingText(const SeriesFinding& finding)
{
    // A tag at the beginning is enough.
    const bool hasTag = finding.fTag.empty() || finding.fText.rfind(finding.fTag, 0) == 0;
    return hasTag ? finding.fText : ShowBytes(finding.fTag) + ": " + finding.fText;
}

std::string GetMeasurementTitle(const Measurement& measurement)
{
    if (measurement.fKey == nullptr)
        return "Time of a run";
    std::string title =
        fmt::format("{} of {}", measurement.fKey->fLabel, ShowBytes(measurement.fTag));
    if (!measurement.fName.empty())
        title += ": " + ShowBytes(measurement.fName);
    return title;
}

std::string GetMeasuredText(const Measurement& measurement, double value)
{
    // As many digits as a report has.
    const std::string number = fmt::format("{:.6g}", value);
    if (measurement.fKey == nullptr)
        return fmt::format("{:.4g} s", value);
    if (measurement.fKey->fForm == ValueForm::kScore)
        return number;
    const ReportLine line = ReadLine(measurement.fKey->fKey + "=" + number, "\n", false);
    return GetValueText({measurement.fKey->fKey, measurement.fKey, &line});
}

SeriesRows GetStatisticsRows(const Measurement& measurement, const SeriesStatistics& statistics)
{
    const auto show = [&](double value) { return GetMeasuredText(measurement, value); };
    SeriesRows rows;
    if (const auto& summary = statistics.fSummary) {
        rows.emplace_back("Median", fmt::format("{} ({})", show(summary->fMedian),
                                                GetRunsText(statistics.fLater.size())));
        rows.emplace_back("Quartiles", fmt::format("{} to {}", show(summary->fLowerQuartile),
                                                   show(summary->fUpperQuartile)));
        rows.emplace_back("Minimum", show(summary->fMinimum));
        rows.emplace_back("Maximum", show(summary->fMaximum));
        rows.emplace_back("Spread", fmt::format("{:.1f} % of the median between the quartiles",
                                                100 * summary->GetRelativeSpread()));
    }
    if (statistics.fFirst)
        rows.emplace_back("First run", show(*statistics.fFirst));
    if (!statistics.fOutliers.empty())
        rows.emplace_back("Outliers", GetOutliersText(measurement, statistics.fOutliers));
    std::map<std::string, RunList> unknown;
    for (const SeriesSample& sample : statistics.fUnknown)
        unknown[sample.fReason].Add(sample.fRun);
    for (const auto& [reason, runs] : unknown)
        rows.emplace_back("Not known", fmt::format("{}: {}", runs.GetText(), ShowBytes(reason)));
    return rows;
}

} // namespace assay_host
