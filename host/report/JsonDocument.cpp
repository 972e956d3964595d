#include "report/JsonDocument.h"

#include <variant>
#include <vector>

#include <nlohmann/json.hpp>

#include "report/Answers.h"
#include "report/JsonFacts.h"
#include "report/JsonParts.h"
#include "report/JsonWriter.h"
#include "report/LineForm.h"
#include "report/NextSteps.h"
#include "report/Numbers.h"
#include "series/JsonSeries.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

Json MakeNumber(const Number& number)
{
    return std::visit([](auto value) { return Json(value); }, number);
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

} // namespace

void WriteDocument(std::ostream& out, const Report& report, const RunOutcome& outcome,
                   const RunFacts& facts, const Series* series)
{
    const Answers answers = GetAnswers(report);
    JsonWriter json(out);
    json.Open('{');
    json.Write("schema", kSchemaVersion);
    json.Write("versions", MakeVersions(facts));
    json.Write("environment", MakeEnvironment(facts.fEnvironment));
    json.Write("command", MakeTexts(outcome.fCommand));
    json.Write("outcome", MakeOutcome(outcome));
    json.Write("drivers", MakeDrivers(outcome.fDrivers));
    json.Write("usable", MakeUsable(answers, outcome));
    json.Write("warnings", MakeWarnings(GetWarnings(answers, outcome)));
    json.Write("nextSteps", MakeTexts(GetNextSteps(answers, outcome)));
    WriteReport(json, report, answers, kSchemaVersion);
    if (series != nullptr)
        WriteSeries(json, *series);
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

} // namespace assay_host
