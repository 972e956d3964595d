#include "fleet/AnsibleFacts.h"

#include <string>

#include <nlohmann/json.hpp>

#include "fleet/DeviceFacts.h"
#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/Usable.h"
#include "report/Warnings.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

struct ValueJson {
    Json operator()(const std::string& text) const { return text; }
    Json operator()(double number) const { return Json::parse(MakeNumberText(number)); }
    Json operator()(bool flag) const { return flag; }
};

Json MakeDevice(const DeviceAnswers& device)
{
    Json json = {{"device", device.fTag}};
    for (const DeviceFact& fact : GetDeviceFacts(device))
        json[fact.fKey->fName] = std::visit(ValueJson(), fact.fValue);
    return json;
}

Json MakeInterface(DeviceKind kind, const Answers& answers, const RunOutcome& outcome)
{
    const Usable usable = JudgeUsable(kind, answers, outcome);
    Json json = {{"usable", GetUsabilityName(usable.fUsability)}, {"text", usable.fText}};
    json["devices"] = Json::array();
    for (const DeviceAnswers& device : answers.fDevices)
        if (device.fKind == kind)
            json["devices"].push_back(MakeDevice(device));
    return json;
}

} // namespace

void WriteAnsibleFacts(std::ostream& out, const Report& report, const RunOutcome& outcome,
                       const RunFacts& facts)
{
    const Answers answers = GetAnswers(report);
    Json json = {{"verdict", GetVerdictName(outcome.fVerdict)},
                 {"reason", ShowBytes(outcome.fReason)}};
    // A report that assay printed has neither.
    if (!facts.fEnvironment.fTime.empty())
        json["time"] = facts.fEnvironment.fTime;
    if (!facts.fHostVersion.empty())
        json["version"] = facts.fHostVersion;
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL})
        json[GetApiName(kind)] = MakeInterface(kind, answers, outcome);
    json["warnings"] = Json::array();
    for (const Warning& warning : GetWarnings(answers, outcome))
        json["warnings"].push_back(GetWarningText(warning));
    out << json.dump() << '\n';
}

} // namespace assay_host
