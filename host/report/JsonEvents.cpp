#include "report/JsonEvents.h"

#include <nlohmann/json.hpp>

#include "report/JsonDocument.h"
#include "report/JsonFacts.h"
#include "report/JsonParts.h"
#include "report/NextSteps.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

std::string ToEvent(const Json& event)
{
    return event.dump() + "\n";
}

} // namespace

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
        {"drivers", MakeDrivers(outcome.fDrivers)},
        {"usable", MakeUsable(answers, outcome)},
        {"warnings", MakeWarnings(GetWarnings(answers, outcome))},
        {"nextSteps", MakeTexts(GetNextSteps(answers, outcome))},
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

} // namespace assay_host
