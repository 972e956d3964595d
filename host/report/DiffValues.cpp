#include "report/DiffValues.h"

#include <algorithm>
#include <iterator>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/LostAnswers.h"
#include "report/ValueText.h"

namespace assay_host {

namespace {

constexpr struct {
    const char* fKey;
    const char* fLabel;
} kLabels[] = {{"verdict", "Verdict"},
               {"report", "Report"},
               {"opengl.usable", "OpenGL"},
               {"opencl.usable", "OpenCL"},
               {"tests", "Tests"},
               {"host", "Machine"},
               {"time", "Time"},
               {"line", "Other line"}};

DiffValue GetAnswerValue(const Answer* answer)
{
    if (!answer)
        return {false, "", "missing", "not in the report"};
    if (!answer->fLine) {
        const char* const reason = GetMissingText(answer->fMissing);
        return {false, "", fmt::format("missing ({})", reason), reason};
    }
    const ReportLine& line = *answer->fLine;
    const std::string value = ShowBytes(line.fValue);
    return {true, line.fValue, line.fQuoted ? "\"" + value + "\"" : value, GetValueText(*answer)};
}

DiffValue GetDeviceValue(const DeviceAnswers* device)
{
    if (!device)
        return {false, "", "missing", "not in the report"};
    const std::string text = GetDeviceText(*device);
    return {true, device->fTag, text, text};
}

DiffValue GetTextValue(const std::optional<std::string>& text, const std::string& forPeople)
{
    if (!text)
        return {false, "", "not known", "not known"};
    const std::string shown = ShowBytes(*text);
    return {true, *text, shown, forPeople.empty() ? shown : forPeople};
}

} // namespace

DiffValue GetValueBefore(const Difference& difference)
{
    return difference.IsOfAnswer()   ? GetAnswerValue(difference.fAnswerBefore)
           : difference.IsOfDevice() ? GetDeviceValue(difference.fDeviceBefore)
                                     : GetTextValue(difference.fBefore, difference.fTextBefore);
}

DiffValue GetValueAfter(const Difference& difference)
{
    return difference.IsOfAnswer()   ? GetAnswerValue(difference.fAnswerAfter)
           : difference.IsOfDevice() ? GetDeviceValue(difference.fDeviceAfter)
                                     : GetTextValue(difference.fAfter, difference.fTextAfter);
}

std::string GetDiffTag(const Difference& difference)
{
    const DeviceAnswers* const device =
        difference.fDeviceBefore ? difference.fDeviceBefore : difference.fDeviceAfter;
    return device ? device->fTag : std::string();
}

std::string GetDiffKey(const Difference& difference)
{
    if (!difference.IsOfAnswer())
        return difference.fKey;
    return ShowBytes(difference.fAnswerBefore ? difference.fAnswerBefore->fKey
                                              : difference.fAnswerAfter->fKey);
}

std::string GetDiffLabel(const Difference& difference)
{
    if (difference.IsOfAnswer()) {
        const std::string label = GetLabel(difference.fAnswerBefore ? *difference.fAnswerBefore
                                                                    : *difference.fAnswerAfter);
        return label.empty() ? GetDiffKey(difference) : label;
    }
    const auto found =
        std::find_if(std::begin(kLabels), std::end(kLabels),
                     [&difference](const auto& label) { return difference.fKey == label.fKey; });
    return found == std::end(kLabels) ? "Device" : found->fLabel;
}

std::string GetDeviceText(const DeviceAnswers& device)
{
    const std::string name = GetDeviceName(device);
    return name.empty() ? device.fTag : fmt::format("{} \"{}\"", device.fTag, ShowBytes(name));
}

const char* GetDiffGroupName(DiffGroup group)
{
    switch (group) {
    case DiffGroup::kRun:
        return "run";
    case DiffGroup::kUsable:
        return "usable";
    case DiffGroup::kTrials:
        return "trials";
    case DiffGroup::kDevices:
        return "devices";
    case DiffGroup::kFacts:
        return "facts";
    case DiffGroup::kMeasurements:
        return "measurements";
    case DiffGroup::kIdentity:
        return "identity";
    case DiffGroup::kOthers:
        break;
    }
    return "others";
}

} // namespace assay_host
