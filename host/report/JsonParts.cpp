#include "report/JsonParts.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "report/JsonBytes.h"
#include "report/JsonFacts.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

constexpr const char* kLineKinds[] = {"value", "comment", "raw"};

} // namespace

const char* GetLineKindName(LineKind kind)
{
    return kLineKinds[static_cast<std::size_t>(kind)];
}

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
    json["lowerBounds"] = MakeLowerBounds(outcome);
    return json;
}

} // namespace assay_host
