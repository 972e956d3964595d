#include "report/Warnings.h"

#include <algorithm>
#include <cctype>
#include <string_view>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Numbers.h"

namespace assay_host {

namespace {

using Warnings = std::vector<std::string>;

// Parts of the names that software renderers give themselves, in small letters.
constexpr std::string_view kSoftwareNames[] = {
    "llvmpipe",
    "softpipe",
    "swiftshader",
    "gdi generic",
    "software rasterizer",
    "basic render driver",
};

// No device copies or computes so fast: its clock can't be right.
constexpr double kMostBytesPerSecond = 1e13;
constexpr double kMostScore = 1e8;

struct Check {
    const char* fKey;
    const char* fText;
};
constexpr Check kReportChecks[] = {
    {"QGFCoreInitialized", "The graphics library doesn't start."},
    {"QGFOGLInitialized", "There is no OpenGL binding with a display device."},
    {"OGLContextCreated", "No OpenGL context can be made on the first display device."},
    {"NumGLGPUs", "No OpenGL device was found."},
};
constexpr Check kTrials[] = {
    {"CanCompileProgramGLSL", "a realistic pair of shaders doesn't compile and link"},
    {"GLFrameBufferOK", "a framebuffer object can't be made, drawn to and found complete"},
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
    warnings.push_back(fmt::format("{}: no adapter of the system matches it ({})", device.fTag,
                                   isNameless && isIdless ? "no name and no vendor id"
                                   : isNameless           ? "no name"
                                                          : "no vendor id"));
}

void WarnOfMeasurement(Warnings& warnings, const DeviceAnswers& device, const char* key,
                       const char* what, double most)
{
    const ReportLine* const line = device.Find(key);
    if (!line)
        return;
    const auto value = ReadDouble(line->fValue);
    if (value && *value > 0 && *value <= most)
        return;
    warnings.push_back(value && *value == 0
                           ? fmt::format("{}: {} could not be measured: the device's clock shows "
                                         "no time",
                                         device.fTag, what)
                           : fmt::format("{}: {} is implausible ({}): the device's clock can't be "
                                         "trusted",
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
    WarnOfMeasurement(warnings, device, "CLBandwidth", "the copy bandwidth", kMostBytesPerSecond);
    WarnOfMeasurement(warnings, device, "CLCompute", "the compute score", kMostScore);
}

} // namespace

std::vector<std::string> GetWarnings(const Answers& answers, const RunOutcome& outcome)
{
    Warnings warnings;
    if (outcome.fLeftBehind)
        warnings.emplace_back("A process of the child couldn't be ended and may still run.");
    if (outcome.fLostOutputBytes > 0)
        warnings.push_back(fmt::format("The child's output was too much: {} bytes of it were cut.",
                                       outcome.fLostOutputBytes));
    if (outcome.fLostErrorBytes > 0)
        warnings.push_back(
            fmt::format("The child's standard error was too much: {} bytes of it were cut.",
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
