#include "html/DiffTables.h"

#include <algorithm>
#include <string>
#include <vector>

#include <fmt/format.h>

#include "html/BarChart.h"
#include "report/Bytes.h"
#include "report/DiffValues.h"
#include "report/LostAnswers.h"
#include "report/Numbers.h"
#include "report/ValueText.h"

namespace assay_host {

namespace {

struct Group {
    DiffGroup fGroup;
    const char* fTitle;
};
constexpr Group kGroups[] = {
    {DiffGroup::kRun, "The run"},
    {DiffGroup::kUsable, "What can be used"},
    {DiffGroup::kTrials, "Trials"},
    {DiffGroup::kDevices, "Devices"},
    {DiffGroup::kFacts, "Facts"},
    {DiffGroup::kMeasurements, "Measurements"},
    {DiffGroup::kIdentity, "Name and time"},
    {DiffGroup::kOthers, "Other lines"},
};

// Returns the class of a value by its first word; a missing value has one of its own.
std::string GetClass(const Difference& difference, const DiffValue& value)
{
    if (!value.fIsThere)
        return "soft";
    if (difference.fGroup == DiffGroup::kUsable)
        return value.fBytes.substr(0, value.fBytes.find(' '));
    const bool isFlag =
        difference.fGroup == DiffGroup::kTrials && (value.fText == "yes" || value.fText == "no");
    return isFlag ? value.fText : "value";
}

void AddHeadRow(Markup& page)
{
    const Element head(page, "thead");
    const Element row(page, "tr");
    for (const char* const title : {"What", "First report", "Second report"})
        page.Add("th", title, {{"scope", "col"}});
}

void AddValue(Markup& page, const Difference& difference, const DiffValue& value,
              const std::string& note)
{
    const Element cell(page, "td");
    page.Add("span", value.fText, {{"class", GetClass(difference, value)}});
    if (!note.empty())
        page.AddText(fmt::format(" ({})", note));
}

void AddDifference(Markup& page, const Difference& difference)
{
    const Element row(page, "tr");
    {
        const Element label(page, "th", {{"scope", "row"}});
        page.AddText(GetDiffLabel(difference));
        const std::string tag = GetDiffTag(difference);
        if (!tag.empty()) {
            page.AddText(" ");
            page.Add("span", tag, {{"class", "soft"}});
        }
    }
    AddValue(page, difference, GetValueBefore(difference), "");
    AddValue(page, difference, GetValueAfter(difference), difference.fNote);
}

// Adds a chart of two bars, if both measurements can be trusted.
void AddChart(Markup& page, const Difference& difference)
{
    const auto getBar = [](const char* label, const Answer* answer) {
        const bool isKnown = answer && answer->IsKnown();
        const double value = isKnown ? ReadDouble(answer->fLine->fValue).value_or(0) : 0;
        return Bar{label, value, isKnown ? GetValueText(*answer) : ""};
    };
    const std::vector<Bar> bars = {getBar("First report", difference.fAnswerBefore),
                                   getBar("Second report", difference.fAnswerAfter)};
    if (bars[0].fValue > 0 && bars[1].fValue > 0)
        AddBarChart(
            page,
            fmt::format("{} {} (more is better)", GetDiffTag(difference), GetDiffLabel(difference)),
            bars);
}

void AddGroup(Markup& page, const std::vector<Difference>& differences, const Group& group,
              const char* heading)
{
    const auto isIn = [&group](const Difference& each) { return each.fGroup == group.fGroup; };
    if (std::none_of(differences.begin(), differences.end(), isIn))
        return;
    page.Add(heading, group.fTitle);
    {
        const Element table(page, "table", {{"class", "diff"}});
        AddHeadRow(page);
        const Element body(page, "tbody");
        for (const Difference& difference : differences)
            if (isIn(difference))
                AddDifference(page, difference);
    }
    for (const Difference& difference : differences)
        if (isIn(difference) && group.fGroup == DiffGroup::kMeasurements)
            AddChart(page, difference);
}

void AddSame(Markup& page, const Comparison& comparison)
{
    if (comparison.fSame.empty())
        return;
    const Element fold(page, "details");
    page.Add("summary", fmt::format("The same in both reports ({})", comparison.fSame.size()));
    const Element list(page, "dl");
    for (const SameAnswer& same : comparison.fSame) {
        const std::string label = GetLabel(*same.fBefore);
        const std::string& name = label.empty() ? ShowBytes(same.fBefore->fKey) : label;
        page.Add("dt", same.fDevice ? fmt::format("{} {}", same.fDevice->fTag, name) : name);
        const std::string before = GetValueText(*same.fBefore);
        const std::string after = GetValueText(*same.fAfter);
        const std::string values = before == after ? before : fmt::format("{}, {}", before, after);
        page.Add("dd", same.fNote.empty() ? values : fmt::format("{} ({})", values, same.fNote));
    }
}

} // namespace

void AddDiffTables(Markup& page, const Comparison& comparison, const char* heading)
{
    for (const Group& group : kGroups)
        AddGroup(page, comparison.fDifferences, group, heading);
    AddSame(page, comparison);
}

} // namespace assay_host
