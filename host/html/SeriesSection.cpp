#include "html/SeriesSection.h"

#include <algorithm>
#include <string>
#include <vector>

#include <fmt/format.h>

#include "html/BoxPlot.h"
#include "html/Page.h"
#include "series/SeriesStatistics.h"
#include "series/SeriesTexts.h"

namespace assay_host {

namespace {

void AddRows(Markup& page, const SeriesRows& rows)
{
    const Element list(page, "dl");
    for (const auto& [label, value] : rows) {
        page.Add("dt", label);
        page.Add("dd", value);
    }
}

std::string JoinRows(const SeriesRows& rows)
{
    std::string text;
    for (const auto& [label, value] : rows)
        text += fmt::format("{}{}: {}", text.empty() ? "" : "; ", label, value);
    return text;
}

void AddPlot(Markup& page, const Measurement& measurement, const SeriesStatistics& statistics,
             const std::string& id)
{
    if (!statistics.fSummary)
        return;
    const Summary& summary = *statistics.fSummary;
    BoxPlot plot;
    plot.fId = id;
    plot.fTitle = "Box plot: " + GetMeasurementTitle(measurement);
    plot.fText = JoinRows(GetStatisticsRows(measurement, statistics));
    plot.fSamples = statistics.fLater;
    plot.fFirst = statistics.fFirst;
    const double first = statistics.fFirst.value_or(summary.fMinimum);
    plot.fMinText = GetMeasuredText(measurement, std::min(summary.fMinimum, first));
    plot.fMaxText = GetMeasuredText(measurement, std::max(summary.fMaximum, first));
    AddBoxPlot(page, plot);
}

} // namespace

void AddSeriesSection(Markup& page, const Series& series)
{
    page.Add("h2", GetSeriesTitle(series));
    AddRows(page, GetSeriesRows(series));
    std::vector<std::string> findings;
    for (const SeriesFinding& finding : series.fFindings)
        findings.push_back(GetFindingText(finding));
    AddList(page, "h3", "What changed between the runs", findings);
    std::size_t number = 0;
    for (const Measurement& measurement : series.fMeasurements) {
        const SeriesStatistics statistics = GetStatistics(measurement);
        page.Add("h3", GetMeasurementTitle(measurement));
        AddPlot(page, measurement, statistics, fmt::format("plot-{}", ++number));
        AddRows(page, GetStatisticsRows(measurement, statistics));
    }
    page.Add(
        "p",
        "A box has the quartiles and the median of all runs but the first. Its lines end at the "
        "farthest samples that are no outliers. Full dots are runs, hollow ones are outliers, "
        "and the diamond is the first run.",
        {{"class", "soft"}});
}

} // namespace assay_host
