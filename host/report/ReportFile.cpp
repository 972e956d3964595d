#include "report/ReportFile.h"

#include <algorithm>
#include <cstddef>
#include <istream>
#include <stdexcept>
#include <string>
#include <vector>

#include "report/JsonReader.h"
#include "report/JsonRun.h"
#include "report/ReportInput.h"
#include "report/ReportReader.h"

namespace assay_host {

namespace {

// The longest first line of a file of events: the "start" event has the child's command line.
constexpr std::size_t kMaxStartBytes = std::size_t{4} << 20;

Report ReadJson(ReportInput& input, const std::string& line)
{
    input.ExpectJson();
    std::istream stream(&input);
    return IsEvent(line) ? ReadEvents(stream) : ReadDocument(stream);
}

StoredRun ReadJsonRun(ReportInput& input, const std::string& line)
{
    input.ExpectJson();
    std::istream stream(&input);
    return IsEvent(line) ? ReadEventsRun(stream) : ReadDocumentRun(stream);
}

Report ReadText(ReportInput& input)
{
    ReportReader reader;
    Report report;
    std::vector<char> block(std::size_t{1} << 16);
    while (true) {
        const std::streamsize count =
            input.sgetn(block.data(), static_cast<std::streamsize>(block.size()));
        if (count == 0)
            break;
        report.Add(reader.Feed({block.data(), static_cast<std::size_t>(count)}));
        if (reader.GetLostByteCount() > 0)
            throw std::runtime_error("lines too long, or too many, for a report");
    }
    report.Add(reader.Finish());
    const std::vector<ReportLine>& lines = report.GetLines();
    if (std::none_of(lines.begin(), lines.end(),
                     [](const ReportLine& line) { return line.fKind == LineKind::kValue; }))
        throw std::runtime_error("neither a JSON document nor a report");
    return report;
}

StoredRun ReadTextRun(ReportInput& input)
{
    StoredRun run;
    run.fReport = ReadText(input);
    run.fOutcome = MakeOutcomeOfReport(run.fReport);
    run.fExtent = OutcomeExtent::kNone;
    run.fFacts = MakeUnknownFacts("the file has only the report");
    return run;
}

// Opens the file and reads it by its form. Adds the path to what is thrown.
template <typename FromText, typename FromJson>
auto Load(const std::string& path, FromText fromText, FromJson fromJson)
{
    try {
        ReportInput input(path);
        const std::string line = input.PeekJsonLine(kMaxStartBytes);
        return line.empty() ? fromText(input) : fromJson(input, line);
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(path + ": " + failure.what());
    }
}

} // namespace

Report LoadReport(const std::string& path)
{
    return Load(path, ReadText, ReadJson);
}

StoredRun LoadRun(const std::string& path)
{
    return Load(path, ReadTextRun, ReadJsonRun);
}

} // namespace assay_host
