#include "series/SeriesView.h"

#include <algorithm>
#include <string>

#include "report/Bytes.h"
#include "report/TextTable.h"
#include "series/SeriesStatistics.h"
#include "series/SeriesTexts.h"
#include "series/TextPlot.h"

namespace assay_host {

namespace {

constexpr std::size_t kIndent = 2;
constexpr std::size_t kMinWidth = 40;
constexpr std::size_t kMaxPlotWidth = 72;

void PrintTitle(std::ostream& out, const std::string& title, std::size_t width)
{
    out << "\n";
    for (const std::string& line : WrapText(title, width))
        out << line << "\n";
    out << std::string(std::min(CountColumns(title), width), '-') << "\n";
}

void PrintRows(std::ostream& out, const SeriesRows& rows, std::size_t width)
{
    TextTable table;
    for (const auto& [label, value] : rows)
        table.Add(label, value);
    table.Print(out, width);
}

} // namespace

void PrintSeries(std::ostream& out, const Series& series, int width)
{
    const std::size_t columns = std::max(kMinWidth, static_cast<std::size_t>(std::max(width, 0)));
    PrintTitle(out, GetSeriesTitle(series), columns);
    SeriesRows rows = GetSeriesRows(series);
    for (const SeriesFinding& finding : series.fFindings)
        rows.emplace_back("!", GetFindingText(finding));
    PrintRows(out, rows, columns);
    for (const Measurement& measurement : series.fMeasurements) {
        const SeriesStatistics statistics = GetStatistics(measurement);
        PrintTitle(out, GetMeasurementTitle(measurement), columns);
        if (!statistics.fLater.empty())
            out << std::string(kIndent, ' ')
                << MakeTextPlot(statistics.fLater, std::min(columns - kIndent, kMaxPlotWidth))
                << "\n";
        PrintRows(out, GetStatisticsRows(measurement, statistics), columns);
    }
}

} // namespace assay_host
