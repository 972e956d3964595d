#include "html/DeviceCard.h"

#include <algorithm>
#include <map>
#include <string>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/LostAnswers.h"
#include "report/Trials.h"
#include "report/ValueText.h"

namespace assay_host {

namespace {

bool IsTrial(const Answer& answer)
{
    return std::any_of(std::begin(kTrials), std::end(kTrials),
                       [&answer](const Trial& trial) { return answer.fKey == trial.fKey; });
}

void AddFact(Markup& page, const Answer& answer)
{
    page.Add("dt", GetLabel(answer));
    page.Add("dd", GetValueText(answer));
}

void AddFacts(Markup& page, const DeviceAnswers& device)
{
    std::multimap<int, const Answer*> rows;
    for (const Answer& answer : device.fAnswers)
        if (answer.fKnown && answer.fKnown->fGroup == KeyGroup::kMain && !IsLost(answer) &&
            !IsTrial(answer))
            rows.emplace(answer.fKnown->fRow, &answer);
    if (rows.empty())
        return;
    const Element list(page, "dl");
    for (const auto& [row, answer] : rows)
        AddFact(page, *answer);
}

void AddTrials(Markup& page, const DeviceAnswers& device)
{
    std::vector<const Answer*> trials;
    for (const Answer& answer : device.fAnswers)
        if (IsTrial(answer) && answer.fLine)
            trials.push_back(&answer);
    if (trials.empty())
        return;
    page.Add("h3", "Trials");
    const Element list(page, "dl");
    for (const Answer* const trial : trials) {
        const std::string text = GetValueText(*trial);
        page.Add("dt", GetLabel(*trial));
        page.Add("dd", text, {{"class", text == "yes" || text == "no" ? text : "unknown"}});
    }
}

void AddLost(Markup& page, const DeviceAnswers& device)
{
    const std::vector<LostAnswers> lost = ListLost(device);
    if (lost.empty())
        return;
    page.Add("h3", "No answer");
    const Element list(page, "dl");
    for (const LostAnswers& answers : lost) {
        page.Add("dt", GetMissingText(answers.fMissing));
        page.Add("dd", answers.fLabels);
    }
}

// Adds a folded list of the answers that the test selects; nothing if there are none.
template <typename Test>
void AddFolded(Markup& page, const DeviceAnswers& device, const char* title, Test isChosen)
{
    const auto count = std::count_if(device.fAnswers.begin(), device.fAnswers.end(), isChosen);
    if (count == 0)
        return;
    const Element fold(page, "details");
    page.Add("summary", fmt::format("{} ({})", title, count));
    const Element list(page, "dl");
    for (const Answer& answer : device.fAnswers)
        if (isChosen(answer))
            AddFact(page, answer);
}

auto IsIn(KeyGroup group)
{
    return [group](const Answer& answer) {
        return answer.fLine && answer.fKnown && answer.fKnown->fGroup == group;
    };
}

} // namespace

void AddDeviceCard(Markup& page, const DeviceAnswers& device)
{
    const Element card(page, "article", {{"class", "card"}, {"id", device.fTag}});
    const std::string name = GetDeviceName(device);
    page.Add("h2", fmt::format("{} device {}{}", GetKindName(device.fKind), device.fTag,
                               name.empty() ? "" : ": " + ShowBytes(name)));
    AddTrials(page, device);
    AddFacts(page, device);
    AddLost(page, device);
    AddFolded(page, device, "Limits", IsIn(KeyGroup::kLimit));
    AddFolded(page, device, "Extensions", IsIn(KeyGroup::kExtension));
    AddFolded(page, device, "Others", [](const Answer& answer) { return !answer.fKnown; });
}

} // namespace assay_host
