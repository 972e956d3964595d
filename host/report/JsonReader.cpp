#include "report/JsonReader.h"

#include <algorithm>
#include <cstdint>
#include <functional>
#include <iterator>
#include <stdexcept>
#include <streambuf>
#include <string_view>
#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "report/Bytes.h"
#include "report/JsonBytes.h"
#include "report/JsonDocument.h"
#include "report/JsonMembers.h"
#include "report/JsonParts.h"
#include "report/JsonRun.h"
#include "report/LineForm.h"
#include "report/ReportReader.h"
#include "series/JsonSeries.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

const std::string kDocument = "the document";

// Reads a line of a document or an event.
ReportLine ReadJsonLine(const Json& json, const std::string& where)
{
    if (!json.is_object())
        throw std::runtime_error(where + " is not an object");
    const std::string kind = GetString(json, where, "kind");
    std::string text = DecodeBytes(GetString(json, where, "text"));
    std::string end = GetString(json, where, "end");
    if (!end.empty() && end != "\n" && end != "\r\n")
        throw std::runtime_error(where + ": \"end\" is not a line end");
    const bool cut = json.contains("cut") &&
                     GetMember(json, where, "cut", &Json::is_boolean, "a bool").get<bool>();
    ReportLine line = ReadLine(std::move(text), std::move(end), cut);
    if (kind != GetLineKindName(line.fKind))
        throw std::runtime_error(
            fmt::format("{}: \"text\" is not a line of the kind \"{}\"", where, ShowBytes(kind)));
    return line;
}

void CheckSchema(const Json& json, const std::string& where)
{
    const Json& schema = GetMember(json, where, "schema", &Json::is_number_integer, "an integer");
    constexpr int kReadable[] = {kFirstSchemaVersion, kSchemaVersion};
    if (std::find(std::begin(kReadable), std::end(kReadable), schema) == std::end(kReadable))
        throw std::runtime_error(fmt::format("{}: \"schema\" is {}, and only {} and {} can be read",
                                             where, schema.dump(), kFirstSchemaVersion,
                                             kSchemaVersion));
}

class JsonFailure : public std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Runs the parser. Throws JsonFailure with the parser's text, without the error number before it.
template <typename Action>
Json Parse(Action action)
{
    const auto getText = [](const Json::exception& failure) {
        constexpr std::size_t kMaxBytes = 200;
        const std::string_view text = failure.what();
        const std::size_t mark = text.find("] ");
        return ShowBytes(text.substr(mark == std::string_view::npos ? 0 : mark + 2, kMaxBytes));
    };
    try {
        return action();
    } catch (const Json::parse_error& failure) {
        throw JsonFailure("not valid JSON: " + getText(failure));
    } catch (const Json::exception& failure) {
        throw JsonFailure(getText(failure)); // valid JSON with a number that is out of range
    }
}

// Collects lines up to the limits of a report.
class LineCollector {
public:
    void Add(const Json& json, const std::string& where)
    {
        ReportLine line = ReadJsonLine(json, where);
        fBytes += line.fText.size() + line.fLineEnd.size();
        if (++fCount > fLimits.fMaxLines || fBytes > fLimits.fMaxBytes)
            throw std::runtime_error("too large for a report");
        fReport.Add(std::move(line));
    }

    std::size_t GetCount() const { return fCount; }
    Report TakeReport() { return std::move(fReport); }

private:
    const ReportReader::Limits fLimits{};
    Report fReport;
    std::size_t fCount = 0;
    std::uint64_t fBytes = 0;
};

bool IsLineMember(const Json& name)
{
    return name == "kind" || name == "text" || name == "end" || name == "cut";
}

// How much of a document or of events is kept besides the lines.
enum class Extent { kReport, kRun };

// Whether a run has the member of a document or an event besides its lines.
bool IsRunMember(const std::string& name)
{
    return name == "versions" || name == "environment" || name == "command" || name == "outcome" ||
           name == "drivers" || name == "series";
}

// A parser callback that collects the lines of a document, checks its schema version, and discards
// everything else but, if asked, the members of the run.
class DocumentFilter {
public:
    explicit DocumentFilter(Extent extent) : fExtent(extent) {}

    bool operator()(int depth, Json::parse_event_t event, Json& parsed)
    {
        constexpr int kMember = 1;
        constexpr int kLine = 2;
        switch (event) {
        case Json::parse_event_t::key:
            if (depth == kMember)
                fMember = parsed.get<std::string>();
            if (fExtent == Extent::kRun && IsRunMember(fMember))
                return true;
            return depth == kMember ? fMember == "schema" || fMember == "lines"
                                    : fIsInLines && IsLineMember(parsed);
        case Json::parse_event_t::array_start:
            if (depth == kMember && fMember == "lines")
                fIsInLines = true;
            [[fallthrough]];
        case Json::parse_event_t::object_start:
            return depth < kMember || (fMember == "lines" && depth <= kLine) ||
                   (fExtent == Extent::kRun && IsRunMember(fMember));
        case Json::parse_event_t::array_end:
            if (depth == kMember)
                fIsInLines = false;
            [[fallthrough]];
        case Json::parse_event_t::object_end:
        case Json::parse_event_t::value:
            break;
        }
        if (depth == kMember && fMember == "schema")
            CheckSchema({{"schema", parsed}}, kDocument);
        if (!fIsInLines || depth != kLine)
            return true;
        fLines.Add(parsed, fmt::format("lines[{}]", fLines.GetCount()));
        return false;
    }

    Report TakeReport() { return fLines.TakeReport(); }

private:
    const Extent fExtent;
    std::string fMember;
    bool fIsInLines = false;
    LineCollector fLines;
};

// A parser callback that keeps only the members of an event that are needed.
class EventFilter {
public:
    explicit EventFilter(Extent extent) : fExtent(extent) {}

    bool operator()(int depth, Json::parse_event_t event, Json& parsed)
    {
        switch (event) {
        case Json::parse_event_t::key:
            if (depth == 1)
                fMember = parsed.get<std::string>();
            return IsKept() || parsed == "event" || parsed == "schema" || IsLineMember(parsed);
        case Json::parse_event_t::object_start:
        case Json::parse_event_t::array_start:
            return depth == 0 || IsKept();
        default:
            return true;
        }
    }

private:
    bool IsKept() const { return fExtent == Extent::kRun && IsRunMember(fMember); }

    const Extent fExtent;
    std::string fMember;
};

// Iterates over the bytes up to the next line end.
class LineIterator {
public:
    using iterator_category = std::input_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = const char*;
    using reference = char;

    LineIterator() = default;
    explicit LineIterator(std::streambuf& bytes) : fBytes(&bytes) {}

    char operator*() const { return std::char_traits<char>::to_char_type(fBytes->sgetc()); }
    LineIterator& operator++()
    {
        fBytes->sbumpc();
        return *this;
    }
    bool operator==(const LineIterator& other) const { return IsAtEnd() == other.IsAtEnd(); }
    bool operator!=(const LineIterator& other) const { return !(*this == other); }

private:
    bool IsAtEnd() const
    {
        const auto next = fBytes ? fBytes->sgetc() : std::char_traits<char>::eof();
        return next == std::char_traits<char>::eof() || next == '\n';
    }

    std::streambuf* fBytes = nullptr;
};

// Skips the rest of the line and its end. Returns false if it has no end.
bool SkipLine(std::streambuf& bytes)
{
    auto next = bytes.sbumpc();
    while (next != std::char_traits<char>::eof() && next != '\n')
        next = bytes.sbumpc();
    return next == '\n';
}

// Parses a document. Stores its report, and returns the rest that was asked for.
Json ParseDocument(std::istream& text, Extent extent, Report& report)
{
    DocumentFilter filter(extent);
    Json document = Parse([&] { return Json::parse(text, std::ref(filter)); });
    if (!document.is_object())
        throw std::runtime_error(kDocument + " is not an object");
    CheckSchema(document, kDocument);
    GetMember(document, kDocument, "lines", &Json::is_array, "an array");
    report = filter.TakeReport();
    return document;
}

// Calls `take` with each event and the text "line N".
template <typename Take>
void ForEachEvent(std::istream& text, Extent extent, Take take)
{
    std::streambuf& bytes = *text.rdbuf();
    const auto end = std::char_traits<char>::eof();
    for (std::size_t number = 1; bytes.sgetc() != end; ++number) {
        const std::string where = fmt::format("line {}", number);
        Json event;
        try {
            EventFilter filter(extent);
            event = Parse(
                [&] { return Json::parse(LineIterator(bytes), LineIterator(), std::ref(filter)); });
        } catch (const JsonFailure& failure) {
            if (!SkipLine(bytes) && number > 1)
                break;
            throw std::runtime_error(fmt::format("{}: {}", where, failure.what()));
        }
        SkipLine(bytes);
        if (!event.is_object())
            throw std::runtime_error(where + " is not a JSON object");
        const std::string name = GetString(event, where, "event");
        if ((number == 1) != (name == "start"))
            throw std::runtime_error(where + (number == 1 ? " is not the event \"start\""
                                                          : " is a second event \"start\""));
        if (name == "start")
            CheckSchema(event, where);
        take(name, event, where);
    }
}

RunFacts ReadFactsOf(const Json& object, const std::string& where)
{
    return object["schema"] == kFirstSchemaVersion ? MakeUnknownFacts("the first schema has none")
                                                   : ReadFacts(object, where);
}

OutcomeExtent GetExtent(const Json& object)
{
    return object["schema"] == kFirstSchemaVersion ? OutcomeExtent::kNoCauses : OutcomeExtent::kAll;
}

} // namespace

Report ReadDocument(std::istream& text)
{
    Report report;
    ParseDocument(text, Extent::kReport, report);
    return report;
}

Report ReadEvents(std::istream& text)
{
    LineCollector lines;
    ForEachEvent(text, Extent::kReport,
                 [&](const std::string& name, const Json& event, const std::string& where) {
                     if (name == "line")
                         lines.Add(event, where);
                 });
    return lines.TakeReport();
}

StoredRun ReadDocumentRun(std::istream& text)
{
    StoredRun run;
    const Json document = ParseDocument(text, Extent::kRun, run.fReport);
    run.fOutcome = ReadOutcome(document, kDocument);
    run.fOutcome.fCommand = ReadCommand(document, kDocument);
    run.fFacts = ReadFactsOf(document, kDocument);
    if (document.contains("series"))
        run.fSeries = ReadSeries(document["series"], "series");
    run.fExtent = GetExtent(document);
    return run;
}

StoredRun ReadEventsRun(std::istream& text)
{
    StoredRun run;
    LineCollector lines;
    std::vector<std::string> command;
    bool hasEnd = false;
    ForEachEvent(text, Extent::kRun,
                 [&](const std::string& name, const Json& event, const std::string& where) {
                     if (name == "line")
                         lines.Add(event, where);
                     if (name == "start") {
                         command = ReadCommand(event, where);
                         run.fFacts = ReadFactsOf(event, where);
                         run.fExtent = GetExtent(event);
                     }
                     if (name == "end") {
                         run.fOutcome = ReadOutcome(event, where);
                         hasEnd = true;
                     }
                 });
    run.fReport = lines.TakeReport();
    if (!hasEnd) {
        run.fOutcome = MakeOutcomeOfReport(run.fReport);
        run.fExtent = OutcomeExtent::kNone;
    }
    run.fOutcome.fCommand = std::move(command);
    return run;
}

bool IsEvent(const std::string& line)
{
    EventFilter filter(Extent::kReport);
    const Json json = Json::parse(line, std::ref(filter), false);
    return json.is_object() && json.contains("event");
}

} // namespace assay_host
