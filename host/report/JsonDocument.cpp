#include "report/JsonDocument.h"

#include <algorithm>
#include <cmath>
#include <functional>
#include <iterator>
#include <stdexcept>
#include <streambuf>
#include <string_view>
#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/JsonFacts.h"
#include "report/JsonWriter.h"
#include "report/LineForm.h"
#include "report/Numbers.h"
#include "report/ReportReader.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

constexpr char32_t kByteBase = 0xF700;

bool IsByteCharacter(char32_t code)
{
    return code >= kByteBase + 0x80 && code <= kByteBase + 0xFF;
}

const std::string kDocument = "the document";

constexpr const char* kLineKinds[] = {"value", "comment", "raw"};

const char* GetLineKindName(LineKind kind)
{
    return kLineKinds[static_cast<std::size_t>(kind)];
}

Json MakeNumber(const Number& number)
{
    return std::visit([](auto value) { return Json(value); }, number);
}

// Makes any number a valid JSON number of seconds: JSON has no infinity.
double MakeSeconds(double seconds)
{
    return std::isfinite(seconds) ? std::max(seconds, 0.0) : 0;
}

Json MakeText(const std::string& bytes)
{
    return EncodeBytes(bytes);
}

Json MakeTextOrNull(const std::string& bytes)
{
    return bytes.empty() ? Json() : MakeText(bytes);
}

Json MakeTexts(const std::vector<std::string>& texts)
{
    Json array = Json::array();
    for (const std::string& text : texts)
        array.push_back(MakeText(text));
    return array;
}

bool IsFlag(const Answer& answer)
{
    return answer.fKnown && answer.fKnown->fForm == ValueForm::kFlag &&
           (answer.fLine->fValue == "0" || answer.fLine->fValue == "1");
}

// The members of a value that isn't a text.
void AddNumbers(Json& json, const ReportLine& line)
{
    if (line.fQuoted || !IsWholeValue(line))
        return;
    if (const auto number = ReadNumber(line.fValue))
        json["number"] = MakeNumber(*number);
    if (const auto numbers = ReadNumberList(line.fValue)) {
        json["numbers"] = Json::array();
        for (const Number& number : *numbers)
            json["numbers"].push_back(MakeNumber(number));
    }
}

Json MakeFirstAnswer(const Answer& answer)
{
    if (!answer.fLine)
        return {{"value", nullptr}, {"reason", GetMissingText(answer.fMissing)}};
    Json json = {{"value", MakeText(answer.fLine->fValue)}};
    AddNumbers(json, *answer.fLine);
    return json;
}

Json MakeAnswer(const Answer& answer)
{
    if (!answer.fLine)
        return {{"known", false}, {"value", nullptr}, {"reason", GetMissingText(answer.fMissing)}};
    const Json value = MakeText(answer.fLine->fValue);
    if (!answer.IsKnown())
        return {{"known", false}, {"value", value}, {"reason", GetUnknownText(answer.fUnknown)}};
    Json json = {{"known", true}, {"value", value}};
    AddNumbers(json, *answer.fLine);
    if (IsFlag(answer))
        json["flag"] = answer.fLine->fValue == "1";
    return json;
}

void WriteAnswers(JsonWriter& json, const std::vector<Answer>& answers, int schema)
{
    json.Open('{', "keys");
    for (const Answer& answer : answers)
        json.Write(answer.fKey,
                   schema == kFirstSchemaVersion ? MakeFirstAnswer(answer) : MakeAnswer(answer));
    json.Close('}');
}

void WriteDevice(JsonWriter& json, const DeviceAnswers& device, int schema)
{
    json.Open('{');
    json.Write("tag", device.fTag);
    json.Write("kind", GetKindName(device.fKind));
    json.Write("index", device.fIndex);
    json.Write("complete", device.fComplete);
    json.Write("failed", device.fFailed);
    if (schema != kFirstSchemaVersion)
        json.Write("software", MakeSoftware(device));
    WriteAnswers(json, device.fAnswers, schema);
    json.Close('}');
}

Json MakeLine(const ReportLine& line)
{
    Json json = {
        {"kind", GetLineKindName(line.fKind)},
        {"text", MakeText(line.fText)},
        {"end", line.fLineEnd},
    };
    if (line.fCut)
        json["cut"] = true;
    return json;
}

// The parts that both schemas have.
void WriteReport(JsonWriter& json, const Report& report, const Answers& answers, int schema)
{
    json.Open('{', "report");
    json.Write("whole", report.IsWhole());
    json.Write("next", MakeTextOrNull(answers.fNext));
    WriteAnswers(json, answers.fReport, schema);
    json.Close('}');
    json.Open('[', "devices");
    for (const DeviceAnswers& device : answers.fDevices)
        WriteDevice(json, device, schema);
    json.Close(']');
    json.Write("devicesLeftOut", answers.fDevicesLeftOut);
    json.Open('[', "lines");
    for (const ReportLine& line : report.GetLines())
        json.Write(MakeLine(line));
    json.Close(']');
}

Json MakeFirstOutcome(const RunOutcome& outcome)
{
    return {
        {"verdict", GetVerdictName(outcome.fVerdict)},
        {"status", GetVerdictStatus(outcome.fVerdict)},
        {"exitStatus", outcome.fExitStatus ? Json(*outcome.fExitStatus) : Json()},
        {"termination", MakeTextOrNull(outcome.fTermination)},
        {"reason", MakeText(outcome.fReason)},
        {"seconds", MakeSeconds(outcome.fSeconds)},
        {"timeoutSeconds",
         outcome.fTimeoutSeconds > 0 ? Json(MakeSeconds(outcome.fTimeoutSeconds)) : Json()},
        {"lastReportLine", MakeTextOrNull(outcome.fLastReportLine)},
        {"lastLogLine", MakeTextOrNull(outcome.fLastLogLine)},
        {"errorLines", MakeTexts(outcome.fErrorLines)},
        {"lostOutputBytes", outcome.fLostOutputBytes},
        {"lostErrorBytes", outcome.fLostErrorBytes},
        {"leftBehind", outcome.fLeftBehind},
    };
}

Json MakeOutcome(const RunOutcome& outcome)
{
    Json json = MakeFirstOutcome(outcome);
    json["causes"] = MakeCauses(outcome);
    return json;
}

// Returns a required member of an object. Throws if it is missing or of another type.
const Json& Get(const Json& object, const std::string& where, const char* name,
                bool (Json::*isType)() const noexcept, const char* type)
{
    const auto member = object.find(name);
    if (member == object.end())
        throw std::runtime_error(fmt::format("{}: \"{}\" is missing", where, name));
    if (!((*member).*isType)())
        throw std::runtime_error(fmt::format("{}: \"{}\" is not {}", where, name, type));
    return *member;
}

std::string GetString(const Json& object, const std::string& where, const char* name)
{
    return Get(object, where, name, &Json::is_string, "a string").get<std::string>();
}

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
    const bool cut =
        json.contains("cut") && Get(json, where, "cut", &Json::is_boolean, "a bool").get<bool>();
    ReportLine line = ReadLine(std::move(text), std::move(end), cut);
    if (kind != GetLineKindName(line.fKind))
        throw std::runtime_error(
            fmt::format("{}: \"text\" is not a line of the kind \"{}\"", where, ShowBytes(kind)));
    return line;
}

void CheckSchema(const Json& json, const std::string& where)
{
    const Json& schema = Get(json, where, "schema", &Json::is_number_integer, "an integer");
    if (schema != kSchemaVersion && schema != kFirstSchemaVersion)
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

// A parser callback that collects the lines of a document, checks its schema version, and discards
// everything else.
class DocumentFilter {
public:
    bool operator()(int depth, Json::parse_event_t event, Json& parsed)
    {
        constexpr int kMember = 1;
        constexpr int kLine = 2;
        switch (event) {
        case Json::parse_event_t::key:
            if (depth == kMember)
                fMember = parsed.get<std::string>();
            return depth == kMember ? fMember == "schema" || fMember == "lines"
                                    : fIsInLines && IsLineMember(parsed);
        case Json::parse_event_t::array_start:
            if (depth == kMember && fMember == "lines")
                fIsInLines = true;
            [[fallthrough]];
        case Json::parse_event_t::object_start:
            return depth < kMember || (fMember == "lines" && depth <= kLine);
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
    std::string fMember;
    bool fIsInLines = false;
    LineCollector fLines;
};

// A parser callback that keeps only the members of an event that ReadEvents needs.
bool KeepEventMembers(int depth, Json::parse_event_t event, Json& parsed)
{
    switch (event) {
    case Json::parse_event_t::key:
        return parsed == "event" || parsed == "schema" || IsLineMember(parsed);
    case Json::parse_event_t::object_start:
    case Json::parse_event_t::array_start:
        return depth == 0;
    default:
        return true;
    }
}

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

std::string ToEvent(const Json& event)
{
    return event.dump() + "\n";
}

} // namespace

void WriteDocument(std::ostream& out, const Report& report, const RunOutcome& outcome,
                   const RunFacts& facts)
{
    const Answers answers = GetAnswers(report);
    JsonWriter json(out);
    json.Open('{');
    json.Write("schema", kSchemaVersion);
    json.Write("versions", MakeVersions(facts));
    json.Write("environment", MakeEnvironment(facts.fEnvironment));
    json.Write("command", MakeTexts(outcome.fCommand));
    json.Write("outcome", MakeOutcome(outcome));
    json.Write("usable", MakeUsable(answers, outcome));
    json.Write("warnings", MakeWarnings(GetWarnings(answers, outcome)));
    WriteReport(json, report, answers, kSchemaVersion);
    json.Close('}');
    out << '\n';
}

void WriteFirstDocument(std::ostream& out, const Report& report, const RunOutcome& outcome)
{
    JsonWriter json(out);
    json.Open('{');
    json.Write("schema", kFirstSchemaVersion);
    json.Write("command", MakeTexts(outcome.fCommand));
    json.Write("outcome", MakeFirstOutcome(outcome));
    WriteReport(json, report, GetAnswers(report), kFirstSchemaVersion);
    json.Close('}');
    out << '\n';
}

std::string MakeStartEvent(const std::vector<std::string>& command, const RunFacts& facts)
{
    return ToEvent({
        {"event", "start"},
        {"seconds", 0.0},
        {"schema", kSchemaVersion},
        {"versions", MakeVersions(facts)},
        {"environment", MakeEnvironment(facts.fEnvironment)},
        {"command", MakeTexts(command)},
    });
}

std::string MakeFirstStartEvent(const std::vector<std::string>& command)
{
    return ToEvent({
        {"event", "start"},
        {"seconds", 0.0},
        {"schema", kFirstSchemaVersion},
        {"command", MakeTexts(command)},
    });
}

std::string MakeLineEvent(const ReportLine& line, double seconds)
{
    Json event = {{"event", "line"}, {"seconds", MakeSeconds(seconds)}};
    event.update(MakeLine(line));
    if (line.fKind == LineKind::kValue) {
        event["key"] = MakeText(line.fKey);
        event["value"] = MakeText(line.fValue);
    }
    return ToEvent(event);
}

std::string MakeErrorLineEvent(const std::string& line, double seconds)
{
    return ToEvent(
        {{"event", "error"}, {"seconds", MakeSeconds(seconds)}, {"text", MakeText(line)}});
}

std::string MakeEndEvent(const Answers& answers, const RunOutcome& outcome)
{
    return ToEvent({
        {"event", "end"},
        {"seconds", MakeSeconds(outcome.fSeconds)},
        {"outcome", MakeOutcome(outcome)},
        {"usable", MakeUsable(answers, outcome)},
        {"warnings", MakeWarnings(GetWarnings(answers, outcome))},
    });
}

std::string MakeFirstEndEvent(const RunOutcome& outcome)
{
    return ToEvent({
        {"event", "end"},
        {"seconds", MakeSeconds(outcome.fSeconds)},
        {"outcome", MakeFirstOutcome(outcome)},
    });
}

Report ReadDocument(std::istream& text)
{
    DocumentFilter filter;
    const Json document = Parse([&] { return Json::parse(text, std::ref(filter)); });
    if (!document.is_object())
        throw std::runtime_error(kDocument + " is not an object");
    CheckSchema(document, kDocument);
    Get(document, kDocument, "lines", &Json::is_array, "an array");
    return filter.TakeReport();
}

Report ReadEvents(std::istream& text)
{
    std::streambuf& bytes = *text.rdbuf();
    const auto end = std::char_traits<char>::eof();
    LineCollector lines;
    for (std::size_t number = 1; bytes.sgetc() != end; ++number) {
        const std::string where = fmt::format("line {}", number);
        Json event;
        try {
            event = Parse(
                [&] { return Json::parse(LineIterator(bytes), LineIterator(), KeepEventMembers); });
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
        if (name == "line")
            lines.Add(event, where);
    }
    return lines.TakeReport();
}

bool IsEvent(const std::string& line)
{
    const Json json = Json::parse(line, KeepEventMembers, false);
    return json.is_object() && json.contains("event");
}

std::string EncodeBytes(const std::string& bytes)
{
    std::string text;
    text.reserve(bytes.size());
    std::string_view rest = bytes;
    while (!rest.empty()) {
        const Character character = ReadCharacter(rest);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (character.fSize > 0 && !IsByteCharacter(character.fCode))
            text += rest.substr(0, size);
        else
            for (const char byte : rest.substr(0, size))
                AppendCharacter(text, kByteBase + static_cast<unsigned char>(byte));
        rest.remove_prefix(size);
    }
    return text;
}

std::string DecodeBytes(const std::string& text)
{
    std::string bytes;
    bytes.reserve(text.size());
    std::string_view rest = text;
    while (!rest.empty()) {
        const Character character = ReadCharacter(rest);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (character.fSize > 0 && IsByteCharacter(character.fCode))
            bytes += static_cast<char>(character.fCode - kByteBase);
        else
            bytes += rest.substr(0, size);
        rest.remove_prefix(size);
    }
    return bytes;
}

} // namespace assay_host
