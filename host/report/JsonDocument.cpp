#include "report/JsonDocument.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>
#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/LineForm.h"
#include "report/Numbers.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

constexpr char32_t kByteBase = 0xF700;

bool IsByteCharacter(char32_t code)
{
    return code >= kByteBase + 0x80 && code <= kByteBase + 0xFF;
}

constexpr const char* kLineKinds[] = {"value", "comment", "raw"};

const char* GetLineKindName(LineKind kind)
{
    return kLineKinds[static_cast<std::size_t>(kind)];
}

Json MakeNumber(const Number& number)
{
    return std::visit([](auto value) { return Json(value); }, number);
}

// JSON has no infinity.
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

Json MakeAnswer(const Answer& answer)
{
    if (!answer.fLine)
        return {{"value", nullptr}, {"reason", GetMissingText(answer.fMissing)}};
    const ReportLine& line = *answer.fLine;
    Json json = {{"value", MakeText(line.fValue)}};
    if (line.fQuoted)
        return json;
    if (const auto number = ReadNumber(line.fValue))
        json["number"] = MakeNumber(*number);
    if (const auto numbers = ReadNumberList(line.fValue)) {
        json["numbers"] = Json::array();
        for (const Number& number : *numbers)
            json["numbers"].push_back(MakeNumber(number));
    }
    return json;
}

// An object is searched from its start for each key that is set, so a flood of keys is put together
// the other way.
Json MakeAnswers(const std::vector<Answer>& answers)
{
    Json::object_t object;
    object.reserve(answers.size());
    for (const Answer& answer : answers)
        object.Container::emplace_back(answer.fKey, MakeAnswer(answer));
    return object;
}

Json MakeDevice(const DeviceAnswers& device)
{
    return {
        {"tag", device.fTag},       {"kind", GetKindName(device.fKind)},
        {"index", device.fIndex},   {"complete", device.fComplete},
        {"failed", device.fFailed}, {"keys", MakeAnswers(device.fAnswers)},
    };
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

Json MakeOutcome(const RunOutcome& outcome)
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

// The member of an object that a document must have, of the type that it must have.
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

// A line of the document, or the same in an event.
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
    if (schema != kSchemaVersion)
        throw std::runtime_error(fmt::format("{}: \"schema\" is {}, and only {} can be read", where,
                                             schema.dump(), kSchemaVersion));
}

} // namespace

nlohmann::ordered_json MakeDocument(const Report& report, const RunOutcome& outcome)
{
    const Answers answers = GetAnswers(report);
    Json devices = Json::array();
    for (const DeviceAnswers& device : answers.fDevices)
        devices.push_back(MakeDevice(device));
    Json lines = Json::array();
    for (const ReportLine& line : report.GetLines())
        lines.push_back(MakeLine(line));
    return {
        {"schema", kSchemaVersion},
        {"command", MakeTexts(outcome.fCommand)},
        {"outcome", MakeOutcome(outcome)},
        {"report",
         {{"whole", report.IsWhole()},
          {"next", MakeTextOrNull(answers.fNext)},
          {"keys", MakeAnswers(answers.fReport)}}},
        {"devices", std::move(devices)},
        {"devicesLeftOut", answers.fDevicesLeftOut},
        {"lines", std::move(lines)},
    };
}

nlohmann::ordered_json MakeStartEvent(const std::vector<std::string>& command)
{
    return {
        {"event", "start"},
        {"seconds", 0.0},
        {"schema", kSchemaVersion},
        {"command", MakeTexts(command)},
    };
}

nlohmann::ordered_json MakeLineEvent(const ReportLine& line, double seconds)
{
    Json event = {{"event", "line"}, {"seconds", MakeSeconds(seconds)}};
    event.update(MakeLine(line));
    if (line.fKind == LineKind::kValue) {
        event["key"] = MakeText(line.fKey);
        event["value"] = MakeText(line.fValue);
    }
    return event;
}

nlohmann::ordered_json MakeErrorLineEvent(const std::string& line, double seconds)
{
    return {{"event", "error"}, {"seconds", MakeSeconds(seconds)}, {"text", MakeText(line)}};
}

nlohmann::ordered_json MakeEndEvent(const RunOutcome& outcome)
{
    return {
        {"event", "end"},
        {"seconds", MakeSeconds(outcome.fSeconds)},
        {"outcome", MakeOutcome(outcome)},
    };
}

Report ReadDocument(const nlohmann::ordered_json& document)
{
    const std::string where = "the document";
    if (!document.is_object())
        throw std::runtime_error(where + " is not an object");
    CheckSchema(document, where);
    Report report;
    std::size_t index = 0;
    for (const Json& line : Get(document, where, "lines", &Json::is_array, "an array"))
        report.Add(ReadJsonLine(line, fmt::format("lines[{}]", index++)));
    return report;
}

Report ReadEvents(std::string_view text)
{
    Report report;
    std::size_t number = 0;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        const std::string_view line = text.substr(0, end);
        const bool isBroken = end == std::string_view::npos;
        text.remove_prefix(isBroken ? text.size() : end + 1);
        const std::string where = fmt::format("line {}", ++number);
        const Json event = Json::parse(line, nullptr, false);
        if (event.is_discarded() && isBroken && number > 1)
            break;
        if (!event.is_object())
            throw std::runtime_error(where + " is not a JSON object");
        const std::string name = GetString(event, where, "event");
        if ((number == 1) != (name == "start"))
            throw std::runtime_error(where + (number == 1 ? " is not the event \"start\""
                                                          : " is a second event \"start\""));
        if (name == "start")
            CheckSchema(event, where);
        if (name == "line")
            report.Add(ReadJsonLine(event, where));
    }
    return report;
}

std::string EncodeBytes(const std::string& bytes)
{
    std::string text;
    text.reserve(bytes.size());
    std::string_view rest = bytes;
    while (!rest.empty()) {
        const Character character = ReadCharacter(rest);
        const std::size_t size = std::max<std::size_t>(character.fSize, 1);
        if (character.fSize > 0 && !IsByteCharacter(character.fCode)) {
            text += rest.substr(0, size);
        } else {
            for (const char byte : rest.substr(0, size))
                AppendCharacter(text, kByteBase + static_cast<unsigned char>(byte));
        }
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
