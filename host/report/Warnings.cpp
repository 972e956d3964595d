#include "report/Warnings.h"

#include <algorithm>
#include <string_view>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Numbers.h"

namespace assay_host {

namespace {

using Warnings = std::vector<std::string>;

// Parts of the names of software renderers, in lower case.
constexpr std::string_view kSoftwareNames[] = {
    "llvmpipe",
    "softpipe",
    "swiftshader",
    "gdi generic",
    "software rasterizer",
    "basic render driver",
};

// No device is as fast: a larger measurement means that its clock is wrong.
constexpr double kMaxBytesPerSecond = 1e13;
constexpr double kMaxScore = 1e8;

struct Check {
    const char* fKey;
    const char* fText;
};
constexpr Check kReportChecks[] = {
    {"QGFCoreInitialized", "The graphics library could not be initialized."},
    {"QGFOGLInitialized", "OpenGL could not be initialized on any display device."},
    {"OGLContextCreated", "No OpenGL context could be created on the first display device."},
    {"NumGLGPUs", "No OpenGL device was found."},
};
constexpr Check kTrials[] = {
    {"CanCompileProgramGLSL", "a realistic pair of shaders does not compile and link"},
    {"GLFrameBufferOK", "no complete framebuffer object could be created and drawn to"},
};

bool IsSoftware(std::string name)
{
    std::transform(name.begin(), name.end(), name.begin(), [](char character) {
        return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a')
                                                    : character;
    });
    return std::any_of(
        std::begin(kSoftwareNames), std::end(kSoftwareNames),
        [&name](std::string_view part) { return name.find(part) != std::string::npos; });
}

void WarnOfSoftware(Warnings& warnings, const DeviceAnswers& device)
{
    for (const char* key : {"GLRenderer", "GLName", "CLName"}) {
        const std::string name = device.GetValue(key);
        if (IsSoftware(name)) {
            warnings.push_back(fmt::format("{}: software renderer, no graphics hardware: {}",
                                           device.fTag, ShowBytes(name)));
            return;
        }
    }
}

void WarnOfAdapter(Warnings& warnings, const DeviceAnswers& device)
{
    const ReportLine* const name = device.Find("GLName");
    const bool isNameless = name && name->fQuoted && name->fValue.empty();
    const bool isIdless = device.GetValue("GLVendorID") == "0";
    if (!isNameless && !isIdless)
        return;
    warnings.push_back(fmt::format("{}: matches no adapter of the system ({})", device.fTag,
                                   isNameless && isIdless ? "no name and no vendor id"
                                   : isNameless           ? "no name"
                                                          : "no vendor id"));
}

void WarnOfMeasurement(Warnings& warnings, const DeviceAnswers& device, const char* key,
                       const char* what, double max)
{
    const ReportLine* const line = device.Find(key);
    if (!line)
        return;
    const auto value = ReadDouble(line->fValue);
    if (value && *value > 0 && *value <= max)
        return;
    warnings.push_back(value && *value == 0
                           ? fmt::format("{}: {} could not be measured: the device's clock "
                                         "reported no elapsed time",
                                         device.fTag, what)
                           : fmt::format("{}: {} is implausible ({}): the device's clock is "
                                         "unreliable",
                                         device.fTag, what, ShowBytes(line->fValue)));
}

void WarnOfFailure(Warnings& warnings, const DeviceAnswers& device)
{
    if (!device.fFailed)
        return;
    const auto failed =
        std::find_if(device.fAnswers.begin(), device.fAnswers.end(), [](const Answer& answer) {
            return answer.fMissing == Missing::kDeviceFailed;
        });
    warnings.push_back(
        failed == device.fAnswers.end()
            ? fmt::format("{}: a test failed", device.fTag)
            : fmt::format("{}: a test failed: no answer from {} on", device.fTag, failed->fKey));
}

void WarnOfDevice(Warnings& warnings, const DeviceAnswers& device)
{
    WarnOfSoftware(warnings, device);
    for (const Check& trial : kTrials) {
        if (device.GetValue(trial.fKey) == "0")
            warnings.push_back(fmt::format("{}: {}", device.fTag, trial.fText));
    }
    WarnOfAdapter(warnings, device);
    WarnOfFailure(warnings, device);
    WarnOfMeasurement(warnings, device, "CLBandwidth", "the copy bandwidth", kMaxBytesPerSecond);
    WarnOfMeasurement(warnings, device, "CLCompute", "the compute score", kMaxScore);
}

} // namespace

std::vector<std::string> GetWarnings(const Answers& answers, const RunOutcome& outcome)
{
    Warnings warnings;
    if (outcome.fLeftBehind)
        warnings.emplace_back("A process of the child could not be killed and may still run.");
    if (outcome.fLostOutputBytes > 0)
        warnings.push_back(fmt::format("The child wrote too much output: {} bytes were dropped.",
                                       outcome.fLostOutputBytes));
    if (outcome.fLostErrorBytes > 0)
        warnings.push_back(
            fmt::format("The child wrote too much to standard error: {} bytes were dropped.",
                        outcome.fLostErrorBytes));
    for (const Check& check : kReportChecks) {
        const auto answer =
            std::find_if(answers.fReport.begin(), answers.fReport.end(),
                         [&check](const Answer& row) { return row.fKey == check.fKey; });
        if (answer->fLine && answer->fLine->fValue == "0")
            warnings.emplace_back(check.fText);
    }
    if (answers.fDevicesLeftOut > 0)
        warnings.push_back(fmt::format("{} more devices are left out.", answers.fDevicesLeftOut));
    for (const DeviceAnswers& device : answers.fDevices)
        WarnOfDevice(warnings, device);
    return warnings;
}

} // namespace assay_host
