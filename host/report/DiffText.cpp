#include "report/DiffText.h"

#include <string>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/DiffValues.h"

namespace assay_host {

namespace {

std::string GetDeviceLine(const Difference& difference)
{
    if (!difference.fDeviceAfter)
        return GetDeviceText(*difference.fDeviceBefore) + ": only in the first report";
    if (!difference.fDeviceBefore)
        return GetDeviceText(*difference.fDeviceAfter) + ": only in the second report";
    return fmt::format("{}: now {}", GetDeviceText(*difference.fDeviceBefore),
                       difference.fDeviceAfter->fTag);
}

std::string GetRawLine(const Difference& difference)
{
    return fmt::format("other line, only in the {} report: {}",
                       difference.fBefore ? "first" : "second",
                       ShowBytes(difference.fBefore ? *difference.fBefore : *difference.fAfter));
}

std::string GetLine(const Difference& difference)
{
    if (difference.IsOfDevice())
        return GetDeviceLine(difference);
    if (difference.fKey == "line")
        return GetRawLine(difference);
    const std::string tag = GetDiffTag(difference);
    return fmt::format("{}{}{}: {} -> {}{}", tag, tag.empty() ? "" : ".", GetDiffKey(difference),
                       GetValueBefore(difference).fValue, GetValueAfter(difference).fValue,
                       difference.fNote.empty() ? "" : " (" + difference.fNote + ")");
}

std::string GetSameLine(const SameAnswer& same)
{
    return fmt::format("{}{}{}: no change: {} and {} ({})", same.fDevice ? same.fDevice->fTag : "",
                       same.fDevice ? "." : "", same.fBefore->fKey,
                       ShowBytes(same.fBefore->fLine->fValue),
                       ShowBytes(same.fAfter->fLine->fValue), same.fNote);
}

} // namespace

void PrintDiff(std::ostream& out, const Comparison& comparison)
{
    for (const Difference& difference : comparison.fDifferences)
        out << GetLine(difference) << "\n";
    for (const SameAnswer& same : comparison.fSame)
        if (!same.fNote.empty())
            out << GetSameLine(same) << "\n";
}

} // namespace assay_host
