#include "report/DiffJson.h"

#include <nlohmann/json.hpp>

#include "report/DiffSummary.h"
#include "report/DiffValues.h"
#include "report/JsonParts.h"
#include "report/JsonWriter.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

Json MakeSide(const DiffValue& value)
{
    return {{"value", value.fIsThere ? MakeText(value.fBytes) : Json()}, {"text", value.fText}};
}

Json MakeDifference(const Difference& difference)
{
    const std::string& key = difference.IsOfAnswer()
                                 ? (difference.fAnswerBefore ? difference.fAnswerBefore->fKey
                                                             : difference.fAnswerAfter->fKey)
                                 : difference.fKey;
    const auto makeTag = [](const DeviceAnswers* device) {
        return device ? Json(device->fTag) : Json();
    };
    return {{"group", GetDiffGroupName(difference.fGroup)},
            {"deviceBefore", makeTag(difference.fDeviceBefore)},
            {"deviceAfter", makeTag(difference.fDeviceAfter)},
            {"key", MakeTextOrNull(key)},
            {"label", GetDiffLabel(difference)},
            {"before", MakeSide(GetValueBefore(difference))},
            {"after", MakeSide(GetValueAfter(difference))},
            {"note", difference.fNote.empty() ? Json() : Json(difference.fNote)}};
}

void WriteComparison(JsonWriter& json, const ComparedRun& other)
{
    json.Open('{');
    json.Write("after", MakeText(other.fFile));
    json.Write("same", other.fComparison.IsSame());
    json.Write("headline", GetDiffHeadline(other.fComparison));
    json.Write("steps", GetDiffSteps(other.fComparison, other.fRun));
    json.Open('[', "differences");
    for (const Difference& difference : other.fComparison.fDifferences)
        json.Write(MakeDifference(difference));
    json.Close(']');
    json.Close('}');
}

} // namespace

void WriteDiffDocument(std::ostream& out, const ComparedRuns& runs, const std::string& hostVersion)
{
    JsonWriter json(out);
    json.Open('{');
    json.Write("schema", kDiffSchemaVersion);
    json.Write("version", hostVersion);
    json.Write("before", MakeText(runs.GetFile()));
    json.Open('[', "comparisons");
    for (const ComparedRun& other : runs.GetOthers())
        WriteComparison(json, other);
    json.Close(']');
    json.Close('}');
    out << "\n";
}

} // namespace assay_host
