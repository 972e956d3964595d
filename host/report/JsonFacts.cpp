#include "report/JsonFacts.h"

#include <utility>

#include "report/JsonBytes.h"
#include "report/Software.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

Json MakeTag(const std::string& tag)
{
    return tag.empty() ? Json() : Json(tag);
}

Json MakeAnswer(const Usable& usable)
{
    return {
        {"answer", GetUsabilityName(usable.fUsability)},
        {"reason", usable.fReason},
        {"device", MakeTag(usable.fTag)},
        {"text", EncodeBytes(usable.fText)},
    };
}

} // namespace

Json MakeFact(const Fact& fact)
{
    if (!fact.IsKnown())
        return {{"known", false}, {"reason", EncodeBytes(fact.fReason)}};
    return {{"known", true}, {"value", EncodeBytes(fact.fValue)}};
}

Json MakeVersions(const RunFacts& facts)
{
    return {
        {"assay-host", MakeFact({facts.fHostVersion, {}})},
        {"assay", MakeFact(facts.fChildVersion)},
    };
}

Json MakeEnvironment(const Environment& environment)
{
    return {
        {"time", environment.fTime},
        {"utcOffset", environment.fOffset},
        {"system", MakeFact(environment.fSystem)},
        {"build", MakeFact(environment.fBuild)},
        {"kernel", MakeFact(environment.fKernel)},
        {"architecture", MakeFact(environment.fArchitecture)},
        {"host", MakeFact(environment.fHost)},
    };
}

Json MakeUsable(const Answers& answers, const RunOutcome& outcome)
{
    return {
        {"opengl", MakeAnswer(JudgeUsable(DeviceKind::kOpenGL, answers, outcome))},
        {"opencl", MakeAnswer(JudgeUsable(DeviceKind::kOpenCL, answers, outcome))},
    };
}

Json MakeWarnings(const std::vector<Warning>& warnings)
{
    Json array = Json::array();
    for (const Warning& warning : warnings)
        array.push_back({
            {"code", warning.fCode},
            {"device", MakeTag(warning.fTag)},
            {"text", EncodeBytes(warning.fText)},
            {"cause", warning.fCause.empty() ? Json() : Json(EncodeBytes(warning.fCause))},
        });
    return array;
}

Json MakeCauses(const RunOutcome& outcome)
{
    Json array = Json::array();
    for (const Cause& cause : outcome.fCauses)
        array.push_back({{"key", EncodeBytes(cause.fKey)}, {"text", EncodeBytes(cause.fText)}});
    return array;
}

Json MakeLowerBounds(const RunOutcome& outcome)
{
    Json array = Json::array();
    for (const LowerBound& bound : outcome.fLowerBounds)
        array.push_back({{"key", bound.fKey}, {"value", bound.fValue}});
    return array;
}

Json MakeDrivers(const LoadedFiles& drivers)
{
    if (!drivers.IsKnown())
        return {{"known", false}, {"reason", EncodeBytes(drivers.fReason)}};
    Json files = Json::array();
    for (const LoadedFile& file : drivers.fFiles)
        files.push_back({
            {"interface", GetKindName(file.fInterface)},
            {"path", EncodeBytes(file.fPath)},
            {"version", MakeFact(file.fVersion)},
            {"buildId", MakeFact(file.fBuildId)},
        });
    return {{"known", true}, {"files", std::move(files)}};
}

Json MakeSoftware(const DeviceAnswers& device)
{
    if (!CanTellSoftware(device))
        return {{"known", false}, {"reason", "no answer names the renderer"}};
    return {{"known", true}, {"flag", !FindSoftwareText(device).empty()}};
}

} // namespace assay_host
