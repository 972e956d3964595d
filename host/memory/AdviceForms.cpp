#include "memory/AdviceForms.h"

#include <algorithm>
#include <optional>
#include <string_view>
#include <utility>
#include <vector>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "facts/TimeText.h"
#include "report/Bytes.h"
#include "report/JsonBytes.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

struct Interface {
    DeviceKind fKind;
    const char* fName; // of a member, and of an argument of `state set`
    const char* fVariable;
};
constexpr Interface kInterfaces[] = {{DeviceKind::kOpenGL, "opengl", "OPENGL"},
                                     {DeviceKind::kOpenCL, "opencl", "OPENCL"}};

const char* GetName(DeviceKind kind)
{
    return kInterfaces[kind == DeviceKind::kOpenGL ? 0 : 1].fName;
}

std::optional<std::int64_t> GetTime(const InterfaceAdvice& part)
{
    return part.fChosen ? std::optional(part.fChosen->fTime) : part.fOutlook.fTime;
}

std::string ShowAge(std::int64_t seconds)
{
    struct Unit {
        std::int64_t fSeconds;
        const char* fName;
    };
    constexpr Unit kUnits[] = {
        {Policy::kDay, "day"}, {Policy::kHour, "hour"}, {Policy::kMinute, "minute"}, {1, "second"}};
    for (const Unit& unit : kUnits)
        if (const std::int64_t count = seconds / unit.fSeconds; count > 0)
            return fmt::format("{} {}{} ago", count, unit.fName, count == 1 ? "" : "s");
    return "now";
}

const char* GetEnd(const InterfaceAdvice& part)
{
    return part.fEnd == AttemptEnd::kOpen ? "" : GetAttemptEndName(part.fEnd);
}

std::string GetPlanText(const Advice& advice)
{
    if (advice.fPlan == Plan::kWait)
        return "another process makes an attempt";
    const bool isTry = advice.fPlan == Plan::kTry;
    switch (advice.fDue) {
    case Due::kFirst:
        return "one attempt: nothing is known of this state of the machine";
    case Due::kOld:
        return "one attempt: what is known is too old";
    case Due::kRequested:
        return "one attempt: a fresh one is requested";
    case Due::kAfterFailure:
        return "one attempt: the pause after the last failure is over";
    case Due::kForgiven:
        return "one attempt: the last failures are too old to count";
    case Due::kAfterFreeze:
        return "one attempt: the system ended during the last one";
    case Due::kUnclear:
        return "one attempt: the last one showed nothing";
    case Due::kNot:
        break;
    }
    return isTry ? "one attempt" : "no attempt: memory has the answer";
}

// The lines of a table with two columns.
class Lines {
public:
    void Add(const char* label, const std::string& value)
    {
        if (!value.empty())
            fText += fmt::format("  {:<9}{}\n", label, value);
    }

    std::string fText;
};

std::string GetDeviceText(const Finding& finding)
{
    std::string text = ShowBytes(finding.fTag);
    if (!finding.fDevice.empty())
        text += (text.empty() ? "" : ", ") + ShowBytes(finding.fDevice);
    if (!finding.fDriver.empty())
        text += ", driver " + ShowBytes(finding.fDriver);
    return text;
}

void AddInterface(Lines& lines, const Advice& advice, DeviceKind kind)
{
    const InterfaceAdvice& part = advice.Get(kind);
    const Outlook& outlook = part.fOutlook;
    lines.fText +=
        fmt::format("{}: {}\n", GetKindName(kind), GetUsabilityName(part.GetUsability()));
    lines.Add("why", GetAdviceText(part, kind));
    if (part.fChosen)
        lines.Add("learnt", fmt::format("{}: {}", GetUsabilityName(outlook.fFinding.fUsability),
                                        ShowBytes(outlook.fFinding.fText)));
    lines.Add("device", GetDeviceText(outlook.fFinding));
    if (outlook.fFinding.fUsability == Usability::kBroken ||
        outlook.fFinding.fUsability == Usability::kUnknown)
        lines.Add("end", ShowBytes(part.fEndReason));
    lines.Add("line", ShowBytes(part.fLastLine));
    if (const auto time = GetTime(part))
        lines.Add("since",
                  fmt::format("{} ({})", MakeUtcText(*time), ShowAge(*GetAdviceAge(advice, part))));
    if (outlook.fFailures > 0)
        lines.Add("failures", std::to_string(outlook.fFailures));
    lines.Add("warning", ShowBytes(outlook.fWarning));
    lines.Add("change", GetChangeText(advice, kind));
}

std::string Quote(const std::string& value)
{
    std::string quoted = "'";
    for (const char letter : ShowBytes(value))
        quoted += letter == '\'' ? std::string("'\\''") : std::string(1, letter);
    return quoted + "'";
}

std::string ShowNumber(const std::optional<std::int64_t>& number)
{
    return number ? std::to_string(*number) : std::string();
}

Json MakeTime(const std::optional<std::int64_t>& time)
{
    return time ? Json(MakeUtcText(*time)) : Json();
}

Json MakeTextOrNull(const std::string& bytes)
{
    return bytes.empty() ? Json() : Json(EncodeBytes(bytes));
}

Json MakeDevice(const Finding& finding)
{
    if (finding.fTag.empty())
        return nullptr;
    return {{"tag", EncodeBytes(finding.fTag)},
            {"name", MakeTextOrNull(finding.fDevice)},
            {"driver", MakeTextOrNull(finding.fDriver)}};
}

Json MakePart(const Advice& advice, DeviceKind kind)
{
    const InterfaceAdvice& part = advice.Get(kind);
    const Outlook& outlook = part.fOutlook;
    const auto age = GetAdviceAge(advice, part);
    return {{"answer", GetUsabilityName(part.GetUsability())},
            {"reason", EncodeBytes(GetAdviceReason(part))},
            {"text", EncodeBytes(GetAdviceText(part, kind))},
            {"source", GetSourceName(advice, kind)},
            {"learnt", GetUsabilityName(outlook.fFinding.fUsability)},
            {"device", MakeDevice(outlook.fFinding)},
            {"end", part.fEnd == AttemptEnd::kOpen ? Json() : Json(GetEnd(part))},
            {"endReason", MakeTextOrNull(part.fEndReason)},
            {"lastLine", MakeTextOrNull(part.fLastLine)},
            {"time", MakeTime(GetTime(part))},
            {"age", age ? Json(*age) : Json()},
            {"failures", outlook.fFailures},
            {"nextAttempt", MakeTime(outlook.fNextTime)},
            {"warning", MakeTextOrNull(outlook.fWarning)},
            {"change", EncodeBytes(GetChangeText(advice, kind))}};
}

} // namespace

std::string GetAdviceReason(const InterfaceAdvice& part)
{
    return part.fChosen ? "chosen" : part.fOutlook.fFinding.fReason;
}

std::string GetAdviceText(const InterfaceAdvice& part, DeviceKind kind)
{
    return part.fChosen ? fmt::format("The user chose this for {}.", GetKindName(kind))
                        : ShowBytes(part.fOutlook.fFinding.fText);
}

std::optional<std::int64_t> GetAdviceAge(const Advice& advice, const InterfaceAdvice& part)
{
    const auto time = GetTime(part);
    return time ? std::optional(std::max<std::int64_t>(advice.fTime - *time, 0)) : std::nullopt;
}

int GetAdviceStatus(const AdviceRequest& request, const Advice& advice)
{
    if (advice.fStopped)
        return GetVerdictStatus(Verdict::kInterrupted);
    const Usability opengl = advice.fOpenGL.GetUsability();
    const Usability opencl = advice.fOpenCL.GetUsability();
    return GetUsabilityStatus(!request.fNeedsOpenCL   ? opengl
                              : !request.fNeedsOpenGL ? opencl
                                                      : GetLesser(opengl, opencl));
}

const char* GetSourceName(const Advice& advice, DeviceKind kind)
{
    const InterfaceAdvice& part = advice.Get(kind);
    if (part.fChosen)
        return "choice";
    if (!part.fOutlook.fTime)
        return "none";
    return advice.fTried && part.fIsLast ? "attempt" : "memory";
}

std::string GetChangeText(const Advice& advice, DeviceKind kind)
{
    const InterfaceAdvice& part = advice.Get(kind);
    const Finding& finding = part.fOutlook.fFinding;
    if (part.fChosen)
        return fmt::format("\"assay-host state set {}=auto\" takes the choice back.",
                           GetName(kind));
    if (finding.fReason == "other-instance")
        return "Call again, or wait longer.";
    const char* const hint =
        finding.fReason == "never-started" ? "Check the installation of assay. " : "";
    if (!part.fOutlook.fNextTime)
        return fmt::format("{}The next call makes an attempt.", hint);
    const std::string next =
        fmt::format("{}The next attempt is due at {}", hint, MakeUtcText(*part.fOutlook.fNextTime));
    switch (finding.fUsability) {
    case Usability::kHardware:
    case Usability::kSoftware:
        return next + ", or if a fresh one is requested.";
    case Usability::kBroken:
        return next + ", or after a change of a driver or of the system, or after \"assay-host "
                      "state forget\".";
    case Usability::kAbsent:
        return next + ", or after the installation of a driver.";
    case Usability::kUnknown:
        break;
    }
    return next + ", or after \"assay-host state forget\".";
}

std::string MakeAdviceText(const Advice& advice)
{
    Lines lines;
    for (const Interface& each : kInterfaces)
        AddInterface(lines, advice, each.fKind);
    lines.fText += fmt::format("Attempts: {}\n", advice.fCount);
    lines.fText += fmt::format("{}: {}\n", advice.fTried ? "Made" : "Plan", GetPlanText(advice));
    return std::move(lines.fText);
}

std::string MakeAdviceVariables(const Advice& advice)
{
    std::string text;
    const auto add = [&text](const std::string& name, const std::string& value) {
        text += "ASSAY_" + name + "=" + Quote(value) + "\n";
    };
    for (const Interface& each : kInterfaces) {
        const InterfaceAdvice& part = advice.Get(each.fKind);
        const Outlook& outlook = part.fOutlook;
        const std::string name = each.fVariable;
        add(name, GetUsabilityName(part.GetUsability()));
        add(name + "_REASON", GetAdviceReason(part));
        add(name + "_TEXT", GetAdviceText(part, each.fKind));
        add(name + "_SOURCE", GetSourceName(advice, each.fKind));
        add(name + "_LEARNT", GetUsabilityName(outlook.fFinding.fUsability));
        add(name + "_DEVICE", outlook.fFinding.fDevice);
        add(name + "_DRIVER", outlook.fFinding.fDriver);
        add(name + "_END", GetEnd(part));
        add(name + "_LAST_LINE", part.fLastLine);
        add(name + "_AGE", ShowNumber(GetAdviceAge(advice, part)));
        add(name + "_FAILURES", std::to_string(outlook.fFailures));
        add(name + "_NEXT", outlook.fNextTime ? MakeUtcText(*outlook.fNextTime) : "");
        add(name + "_WARNING", outlook.fWarning);
        add(name + "_CHANGE", GetChangeText(advice, each.fKind));
    }
    add("ATTEMPTS", std::to_string(advice.fCount));
    add("PLAN", GetPlanName(advice.fPlan));
    add("TRIED", advice.fTried ? "1" : "0");
    return text;
}

std::string MakeAdviceDocument(const Advice& advice, const std::string& hostVersion, int status)
{
    Json messages = Json::array();
    for (const std::string& message : advice.fMessages)
        messages.push_back(EncodeBytes(message));
    Json document = {{"schema", kAdviceSchemaVersion},    {"version", hostVersion},
                     {"time", MakeUtcText(advice.fTime)}, {"status", status},
                     {"identity", advice.fName},          {"plan", GetPlanName(advice.fPlan)},
                     {"due", GetDueName(advice.fDue)},    {"tried", advice.fTried},
                     {"attempts", advice.fCount}};
    for (const Interface& each : kInterfaces)
        document[each.fName] = MakePart(advice, each.fKind);
    document["messages"] = messages;
    return document.dump(2) + "\n";
}

} // namespace assay_host
