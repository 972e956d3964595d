// Any bytes as a report: checks that the documents built from it are valid and that reading them
// back returns the same report. Any bytes as a document: checks that they are read or rejected with
// a text.
#include <cstdint>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>

#include <nlohmann/json.hpp>

#include "Require.h"
#include "report/CompareReports.h"
#include "report/DiffText.h"
#include "report/JsonBytes.h"
#include "report/JsonDocument.h"
#include "report/JsonEvents.h"
#include "report/JsonReader.h"
#include "report/ReportReader.h"
#include "report/TextView.h"

namespace {

using namespace assay_host;
using Json = nlohmann::ordered_json;

Report ReadReport(std::string_view text)
{
    ReportReader reader;
    Report report;
    report.Add(reader.Feed(text));
    report.Add(reader.Finish());
    return report;
}

std::string GetDocument(const Report& report, const RunOutcome& outcome)
{
    std::ostringstream out;
    WriteDocument(out, report, outcome, {});
    return out.str();
}

Report Read(Report (*read)(std::istream&), const std::string& text)
{
    std::istringstream in(text);
    return read(in);
}

// Every text of the outcome is escaped several times, so that long ones would take most of the
// time.
constexpr std::size_t kMaxOutcomeText = 100;

RunOutcome MakeOutcome(const std::string& all)
{
    const std::string bytes = all.substr(0, kMaxOutcomeText);
    RunOutcome outcome;
    outcome.fCommand = {bytes};
    outcome.fTermination = bytes;
    outcome.fReason = bytes;
    outcome.fLastReportLine = bytes;
    outcome.fErrorLines = {bytes};
    outcome.fCauses = {{bytes, bytes}};
    return outcome;
}

void CheckReport(const std::string& bytes)
{
    const Report report = ReadReport(bytes);
    const RunOutcome outcome = MakeOutcome(bytes);
    const std::string document = GetDocument(report, outcome);
    Require(Json::parse(document).dump(2) + "\n" == document);
    const Report back = Read(ReadDocument, document);
    Require(back.ToText() == report.ToText());
    Require(GetDocument(back, outcome) == document);

    std::string events = MakeStartEvent({bytes}, {});
    for (const ReportLine& line : report.GetLines())
        events += MakeLineEvent(line, 1);
    events += MakeErrorLineEvent(bytes, 1) + MakeEndEvent(GetAnswers(report), outcome);
    Require(Read(ReadEvents, events).ToText() == report.ToText());

    Require(DecodeBytes(EncodeBytes(bytes)) == bytes);
    Require(CompareReports(report, back, ComparisonOptions()).IsSame());

    std::ostringstream out;
    PrintText(out, report, outcome, 60);
    for (const char character : out.str())
        Require(character == '\n' || static_cast<unsigned char>(character) >= ' ');

    const std::size_t half = bytes.size() / 2;
    const Report first = ReadReport(bytes.substr(0, half));
    const Report second = ReadReport(bytes.substr(half));
    std::ostringstream lines;
    PrintDiff(lines, CompareReports(first, second, ComparisonOptions()));
    for (const char character : lines.str())
        Require(character == '\n' || static_cast<unsigned char>(character) >= ' ');
}

template <typename Read>
void CheckRead(Read read)
{
    try {
        read();
    } catch (const std::runtime_error& failure) {
        Require(*failure.what() != '\0');
    }
}

void CheckJson(const std::string& bytes)
{
    CheckRead([&bytes] { Read(ReadDocument, bytes); });
    CheckRead([&bytes] { Read(ReadEvents, bytes); });
    CheckRead([&bytes] { Read(ReadEvents, MakeFirstStartEvent({}) + bytes); });
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string bytes(data, data + size);
    CheckReport(bytes);
    CheckJson(bytes);
    return 0;
}
