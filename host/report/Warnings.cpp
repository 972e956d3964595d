#include "report/Warnings.h"

#include <algorithm>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Software.h"
#include "report/Trials.h"
#include "report/Unknown.h"

namespace assay_host {

namespace {

using Warnings = std::vector<Warning>;

struct Check {
    const char* fKey;
    const char* fCode;
    const char* fText;
};
constexpr Check kReportChecks[] = {
    {"QGFCoreInitialized", "no-core-library", "The graphics library could not be initialized."},
    {"QGFOGLInitialized", "no-opengl", "OpenGL could not be initialized on any display device."},
    {"OGLContextCreated", "no-default-context",
     "No OpenGL context could be created on the first display device."},
    {"NumGLGPUs", "no-opengl-device",
     "There is no OpenGL device on which a context can be created."},
};

std::string FindCause(const RunOutcome& outcome, const std::string& key)
{
    return ShowBytes(outcome.FindCause(key));
}

void WarnOfSoftware(Warnings& warnings, const DeviceAnswers& device)
{
    const std::string text = FindSoftwareText(device);
    if (!text.empty())
        warnings.push_back(
            {"software", device.fTag,
             fmt::format("software renderer, no graphics hardware: {}", ShowBytes(text))});
}

void WarnOfAdapter(Warnings& warnings, const DeviceAnswers& device)
{
    const ReportLine* const name = device.Find("GLName");
    const bool isNameless = name && name->fQuoted && name->fValue.empty();
    const bool isIdless = device.GetValue("GLVendorID") == "0";
    if (!isNameless && !isIdless)
        return;
    warnings.push_back({"no-adapter", device.fTag,
                        fmt::format("matches no adapter of the system ({})",
                                    isNameless && isIdless ? "no name and no vendor id"
                                    : isNameless           ? "no name"
                                                           : "no vendor id")});
}

void WarnOfMeasurement(Warnings& warnings, const DeviceAnswers& device, const char* key,
                       const char* what)
{
    const auto answer =
        std::find_if(device.fAnswers.begin(), device.fAnswers.end(),
                     [key](const Answer& candidate) { return candidate.fKey == key; });
    if (answer == device.fAnswers.end())
        return;
    const Unknown unknown = answer->fUnknown;
    if (unknown == Unknown::kNoTime)
        warnings.push_back(
            {"no-measurement", device.fTag,
             fmt::format("{} could not be measured: {}", what, GetUnknownText(unknown))});
    if (unknown == Unknown::kImplausible)
        warnings.push_back(
            {"implausible-measurement", device.fTag,
             fmt::format("{} is implausible ({}): {}", what, ShowBytes(answer->fLine->fValue),
                         GetUnknownText(unknown))});
}

void WarnOfFailure(Warnings& warnings, const DeviceAnswers& device, const RunOutcome& outcome)
{
    if (!device.fFailed)
        return;
    const Answer* const failed = device.FindFailed();
    if (!failed)
        warnings.push_back({"device-failed", device.fTag, "a test failed"});
    else
        warnings.push_back({"device-failed", device.fTag,
                            fmt::format("a test failed: no answer from {} on", failed->fKey),
                            FindCause(outcome, failed->fKnown->GetKey(device.fTag))});
}

void WarnOfDevice(Warnings& warnings, const DeviceAnswers& device, const RunOutcome& outcome)
{
    WarnOfSoftware(warnings, device);
    for (const Trial& trial : kTrials)
        if (device.GetValue(trial.fKey) == "0")
            warnings.push_back({trial.fCode, device.fTag, trial.fText,
                                FindCause(outcome, device.fTag + "." + trial.fKey)});
    WarnOfAdapter(warnings, device);
    WarnOfFailure(warnings, device, outcome);
    WarnOfMeasurement(warnings, device, "CLBandwidth", "the copy bandwidth");
    WarnOfMeasurement(warnings, device, "CLCompute", "the compute score");
}

} // namespace

std::string GetWarningText(const Warning& warning)
{
    std::string text = warning.fTag.empty() ? warning.fText : warning.fTag + ": " + warning.fText;
    if (warning.fCause.empty())
        return text;
    if (text.back() == '.')
        text.pop_back();
    return text + ": " + warning.fCause;
}

std::vector<Warning> GetWarnings(const Answers& answers, const RunOutcome& outcome)
{
    Warnings warnings;
    if (outcome.fLeftBehind)
        warnings.push_back(
            {"left-behind", "", "A process of assay could not be killed and may still run."});
    if (outcome.fLostOutputBytes > 0)
        warnings.push_back({"output-lost", "",
                            fmt::format("assay wrote too much output: {} bytes were dropped.",
                                        outcome.fLostOutputBytes)});
    if (outcome.fLostErrorBytes > 0)
        warnings.push_back(
            {"error-output-lost", "",
             fmt::format("assay wrote too much to standard error: {} bytes were dropped.",
                         outcome.fLostErrorBytes)});
    for (const Check& check : kReportChecks) {
        const auto answer =
            std::find_if(answers.fReport.begin(), answers.fReport.end(),
                         [&check](const Answer& row) { return row.fKey == check.fKey; });
        if (answer->fLine && answer->fLine->fValue == "0")
            warnings.push_back({check.fCode, "", check.fText, FindCause(outcome, check.fKey)});
    }
    if (answers.fDevicesLeftOut > 0)
        warnings.push_back({"devices-left-out", "",
                            fmt::format("{} more devices are left out.", answers.fDevicesLeftOut)});
    for (const DeviceAnswers& device : answers.fDevices)
        WarnOfDevice(warnings, device, outcome);
    return warnings;
}

} // namespace assay_host
