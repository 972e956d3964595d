#include "series/Findings.h"

#include <algorithm>
#include <utility>

#include <fmt/format.h>

#include "report/Bytes.h"

namespace assay_host {

namespace {

// Values of a fact that a text names, and the characters of each.
constexpr std::size_t kMaxValuesShown = 4;
constexpr std::size_t kMaxValueBytes = 60;

SeriesFinding MakeFinding(const char* code, std::string tag, std::string text, const RunList& runs)
{
    return {code, std::move(tag), std::move(text), runs.GetCount(), runs.GetNamed()};
}

std::string ShowValue(const std::string& value)
{
    if (value.size() <= kMaxValueBytes)
        return ShowBytes(value);
    // A character is cut at its first byte.
    std::size_t end = kMaxValueBytes;
    while (end > 0 && (static_cast<unsigned char>(value[end]) & 0xC0) == 0x80)
        --end;
    return ShowBytes(value.substr(0, end)) + "...";
}

std::string GetRunsText(const RunList& runs)
{
    // The runs of what is common need no list.
    constexpr std::size_t kMaxListed = 5;
    return runs.GetCount() <= kMaxListed ? runs.GetText() : fmt::format("{} runs", runs.GetCount());
}

// Returns a text such as "4096 (8 runs), 4095 (runs 3, 7)".
std::string GetValuesText(const ChangedFact& fact)
{
    std::string text;
    const std::size_t shown = std::min(fact.fValues.size(), kMaxValuesShown);
    for (std::size_t index = 0; index < shown; ++index) {
        const FactValue& value = fact.fValues[index];
        text += fmt::format("{}{} ({})", index == 0 ? "" : ", ", ShowValue(value.fText),
                            GetRunsText(value.fRuns));
    }
    if (fact.fValues.size() > shown || fact.fOthers.GetCount() > 0)
        text += " and others";
    return text;
}

std::string GetShareText(const ChangedFact& fact)
{
    return fmt::format("{} of {} runs", fact.fDiffering.GetCount(), fact.fRuns);
}

std::string GetLabel(const KnownDevice& device)
{
    return device.fName.empty() ? device.fTag
                                : fmt::format("{} \"{}\"", device.fTag, ShowValue(device.fName));
}

} // namespace

SeriesFinding MakeVerdictFinding(Verdict verdict, const std::string& reason, const RunList& runs,
                                 std::size_t total)
{
    return MakeFinding("verdict", "",
                       fmt::format("{} in {} of {} runs ({}){}", GetVerdictName(verdict),
                                   runs.GetCount(), total, runs.GetText(),
                                   reason.empty() ? "" : ": " + ShowBytes(reason)),
                       runs);
}

SeriesFinding MakeFactFinding(const ChangedFact& fact, const KnownDevice* device)
{
    return MakeFinding("fact-changed", device != nullptr ? device->fTag : "",
                       fmt::format("{} differed in {}: {}", ShowValue(fact.fName),
                                   GetShareText(fact), GetValuesText(fact)),
                       fact.fDiffering);
}

SeriesFinding MakeTagFinding(const ChangedFact& fact, const KnownDevice& device)
{
    return MakeFinding("device-moved", device.fTag,
                       fmt::format("the place of {} differed in {}: {}", GetLabel(device),
                                   GetShareText(fact), GetValuesText(fact)),
                       fact.fDiffering);
}

SeriesFinding MakeUsableFinding(const ChangedFact& fact, DeviceKind kind)
{
    return MakeFinding("usable-changed", "",
                       fmt::format("the answer for {} differed in {}: {}", GetKindName(kind),
                                   GetShareText(fact), GetValuesText(fact)),
                       fact.fDiffering);
}

SeriesFinding MakeAbsenceFinding(const KnownDevice& device, const RunList& absent,
                                 std::size_t total)
{
    return MakeFinding("device-absent", device.fTag,
                       fmt::format("{} was missing in {} of {} runs ({})", GetLabel(device),
                                   absent.GetCount(), total, absent.GetText()),
                       absent);
}

SeriesFinding MakeUnknownFinding(const Measurement& measurement, const std::string& reason,
                                 const RunList& runs, std::size_t total)
{
    return MakeFinding("not-measured", measurement.fTag,
                       fmt::format("{} is not known in {} of {} runs ({}): {}",
                                   measurement.GetKeyName(), runs.GetCount(), total, runs.GetText(),
                                   reason),
                       runs);
}

} // namespace assay_host
