#include "series/FactLog.h"

#include <algorithm>

#include <fmt/format.h>

#include "series/Series.h"

namespace assay_host {

namespace {

// A driver may return other texts in every run.
constexpr std::size_t kMaxValues = 8;
constexpr std::size_t kMaxBytes = std::size_t{16} << 20;

// How many runs a text names.
constexpr std::size_t kMaxShown = 5;

} // namespace

void RunList::Add(std::size_t run)
{
    ++fCount;
    if (fNamed.size() < kMaxNamedRuns)
        fNamed.push_back(run);
}

void RunList::Add(const RunList& other)
{
    fCount += other.fCount;
    fNamed.insert(fNamed.end(), other.fNamed.begin(), other.fNamed.end());
    std::sort(fNamed.begin(), fNamed.end());
    fNamed.resize(std::min(fNamed.size(), kMaxNamedRuns));
}

std::string RunList::GetText() const
{
    std::string text = fCount == 1 ? "run " : "runs ";
    const std::size_t shown = std::min(fNamed.size(), kMaxShown);
    for (std::size_t index = 0; index < shown; ++index)
        text += fmt::format("{}{}", index == 0 ? "" : ", ", fNamed[index]);
    if (fCount > shown)
        text += fmt::format(" and {} more", fCount - shown);
    return text;
}

bool FactLog::Keep(std::size_t bytes)
{
    constexpr std::size_t kOverhead = 200;
    if (fBytes + bytes + kOverhead > kMaxBytes)
        return false;
    fBytes += bytes + kOverhead;
    return true;
}

void FactLog::Add(std::size_t run, std::size_t subject, const std::string& name, std::string value)
{
    const auto found = fFacts.find({subject, name});
    if (found == fFacts.end()) {
        if (!Keep(name.size() + value.size()))
            return;
        FactValue first{std::move(value), {}};
        first.fRuns.Add(run);
        fFacts[{subject, name}].fValues.push_back(std::move(first));
        return;
    }
    Fact& fact = found->second;
    const auto same = std::find_if(fact.fValues.begin(), fact.fValues.end(),
                                   [&](const FactValue& each) { return each.fText == value; });
    if (same != fact.fValues.end()) {
        same->fRuns.Add(run);
    } else if (fact.fValues.size() < kMaxValues && Keep(value.size())) {
        fact.fValues.push_back({std::move(value), {}});
        fact.fValues.back().fRuns.Add(run);
    } else {
        fact.fOthers.Add(run);
    }
}

std::vector<ChangedFact> FactLog::GetChanged() const
{
    std::vector<ChangedFact> changed;
    for (const auto& [key, fact] : fFacts) {
        if (fact.fValues.size() == 1 && fact.fOthers.GetCount() == 0)
            continue;
        ChangedFact entry{key.first, key.second, fact.fValues, fact.fOthers, fact.fOthers, 0};
        std::stable_sort(entry.fValues.begin(), entry.fValues.end(),
                         [](const FactValue& left, const FactValue& right) {
                             return left.fRuns.GetCount() > right.fRuns.GetCount();
                         });
        for (std::size_t index = 1; index < entry.fValues.size(); ++index)
            entry.fDiffering.Add(entry.fValues[index].fRuns);
        entry.fRuns = entry.fDiffering.GetCount() + entry.fValues.front().fRuns.GetCount();
        changed.push_back(std::move(entry));
    }
    return changed;
}

} // namespace assay_host
