#include "report/DiffSummary.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <utility>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/DiffValues.h"
#include "report/NextSteps.h"
#include "report/Numbers.h"
#include "report/Usable.h"

namespace assay_host {

namespace {

using Differences = std::vector<Difference>;

// What the differences of a group are called, one and several.
constexpr struct {
    DiffGroup fGroup;
    const char* fOne;
    const char* fSeveral;
} kNames[] = {
    {DiffGroup::kRun, "end of the run", "ends of the run"},
    {DiffGroup::kTrials, "trial", "trials"},
    {DiffGroup::kDevices, "entry of the device list", "entries of the device list"},
    {DiffGroup::kFacts, "fact", "facts"},
    {DiffGroup::kMeasurements, "measurement", "measurements"},
    {DiffGroup::kIdentity, "name or time", "names or times"},
    {DiffGroup::kOthers, "other line", "other lines"},
};

std::size_t Count(const Differences& differences, DiffGroup group)
{
    return static_cast<std::size_t>(
        std::count_if(differences.begin(), differences.end(),
                      [group](const Difference& each) { return each.fGroup == group; }));
}

// Returns "broken" for "broken (crashed)".
std::string GetAnswer(const std::string& usability)
{
    return usability.substr(0, usability.find(' '));
}

std::string GetSides(const Difference& difference)
{
    std::string before = GetValueBefore(difference).fValue;
    std::string after = GetValueAfter(difference).fValue;
    if (difference.fGroup == DiffGroup::kUsable && GetAnswer(before) != GetAnswer(after)) {
        before = GetAnswer(before);
        after = GetAnswer(after);
    }
    return fmt::format("{}: {} in the first report, {} in the second", GetDiffLabel(difference),
                       before, after);
}

// Returns what differs in a group, or an empty text.
std::string GetGroupSentence(const Differences& differences, DiffGroup group)
{
    std::string text;
    for (const Difference& difference : differences)
        if (difference.fGroup == group)
            text += (text.empty() ? "" : "; ") + GetSides(difference);
    return text.empty() ? text : text + ".";
}

std::string GetCounts(const Differences& differences)
{
    std::vector<std::string> parts;
    for (const auto& name : kNames)
        if (const std::size_t count = Count(differences, name.fGroup))
            parts.push_back(fmt::format("{} {}", count, count == 1 ? name.fOne : name.fSeveral));
    std::string text;
    for (std::size_t part = 0; part < parts.size(); ++part)
        text += (part == 0 ? "" : part + 1 == parts.size() ? " and " : ", ") + parts[part];
    return fmt::format("{} differ{}.", text, differences.size() == 1 ? "s" : "");
}

// Whether the second side of a difference of kUsable is the worse one.
bool IsWorse(const Difference& difference)
{
    const auto rank = [](const std::string& text) {
        constexpr Usability kFromWorst[] = {Usability::kBroken, Usability::kAbsent,
                                            Usability::kUnknown, Usability::kSoftware,
                                            Usability::kHardware};
        const std::string name = GetAnswer(text);
        return std::find_if(std::begin(kFromWorst), std::end(kFromWorst),
                            [&name](Usability each) { return name == GetUsabilityName(each); }) -
               std::begin(kFromWorst);
    };
    return rank(*difference.fAfter) < rank(*difference.fBefore);
}

// A measurement is a known key of a device, for which both devices have an answer.
bool IsSlower(const Difference& difference)
{
    if (difference.fGroup != DiffGroup::kMeasurements || !difference.fAnswerBefore->IsKnown() ||
        !difference.fAnswerAfter->IsKnown())
        return false;
    const auto before = ReadDouble(difference.fAnswerBefore->fLine->fValue);
    const auto after = ReadDouble(difference.fAnswerAfter->fLine->fValue);
    return before && after && *after < *before;
}

bool IsLostDevice(const Difference& difference)
{
    return difference.IsOfDevice() && !difference.fDeviceAfter;
}

bool IsOtherDriver(const Difference& difference, DeviceKind kind)
{
    return difference.fAnswerBefore && difference.fAnswerAfter &&
           difference.fAnswerBefore->fKey ==
               (kind == DeviceKind::kOpenGL ? "GLDriverVersion" : "CLDriverVersion") &&
           difference.fAnswerBefore->IsKnown() && difference.fAnswerAfter->IsKnown();
}

// Whether the trial worked in the first report and doesn't in the second.
bool IsLostTrial(const Difference& difference)
{
    if (difference.fGroup != DiffGroup::kTrials)
        return false;
    if (!difference.IsOfAnswer())
        return difference.fAfter && difference.fAfter->compare(0, 6, "failed") == 0;
    return GetValueBefore(difference).fText == "yes" && GetValueAfter(difference).fText == "no";
}

// Whether the interface can be used less in the second report, or a device of it fails there.
bool IsWorse(const Difference& difference, DeviceKind kind)
{
    if (difference.fGroup == DiffGroup::kUsable)
        return difference.fKey ==
                   (kind == DeviceKind::kOpenGL ? "opengl.usable" : "opencl.usable") &&
               IsWorse(difference);
    return difference.fDeviceBefore && difference.fDeviceBefore->fKind == kind &&
           IsLostTrial(difference);
}
} // namespace

std::string GetDiffHeadline(const Comparison& comparison)
{
    const Differences& differences = comparison.fDifferences;
    if (differences.empty())
        return "The reports do not differ.";
    std::string usable = GetGroupSentence(differences, DiffGroup::kUsable);
    if (!usable.empty())
        return usable;
    if (differences.front().fKey == "verdict")
        return GetSides(differences.front()) + ".";
    return GetCounts(differences);
}

std::vector<std::string> GetDiffSteps(const Comparison& comparison, const StoredRun& after)
{
    const Differences& differences = comparison.fDifferences;
    const auto find = [&differences](auto test) {
        const auto found = std::find_if(differences.begin(), differences.end(), test);
        return found == differences.end() ? nullptr : &*found;
    };
    std::vector<std::string> steps;
    bool isWorse = false;
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        if (!find([kind](const Difference& each) { return IsWorse(each, kind); }))
            continue;
        isWorse = true;
        if (const auto driver =
                find([kind](const Difference& each) { return IsOtherDriver(each, kind); }))
            steps.push_back(fmt::format(
                "The {} driver is another one ({} instead of {}). Install that of the first report "
                "again, and compare once more: this shows whether it is the cause.",
                GetKindName(kind), GetValueAfter(*driver).fText, GetValueBefore(*driver).fText));
    }
    if (isWorse)
        for (std::string& step : GetNextSteps(comparison.fAfter, after.fOutcome))
            steps.push_back(std::move(step));
    if (const Difference* const lost = find(IsLostDevice))
        steps.push_back(
            fmt::format("Check that {} is still in the machine, that its driver is installed, and "
                        "that this user may open it.",
                        GetDeviceText(*lost->fDeviceBefore)));
    if (find(IsSlower))
        steps.push_back(
            "One run can be slow by chance: end other programs, and run and compare again "
            "before you call a device slower.");
    return steps;
}

} // namespace assay_host
