#include "report/CompareRuns.h"

#include <algorithm>
#include <optional>
#include <string>
#include <utility>

#include <fmt/format.h>

#include "report/RunText.h"
#include "report/Usable.h"
#include "series/SeriesChange.h"

namespace assay_host {

namespace {

// Returns a text such as "crashed: signal 11 (Segmentation fault)".
std::string GetVerdictText(const RunOutcome& outcome)
{
    const char* const name = GetVerdictName(outcome.fVerdict);
    if (outcome.fVerdict == Verdict::kCrashed && !outcome.fTermination.empty())
        return fmt::format("{}: {}", name, outcome.fTermination);
    if (outcome.fExitStatus.value_or(0) != 0)
        return fmt::format("{}: exit status {}", name, *outcome.fExitStatus);
    return name;
}

// Returns a text such as "broken (crashed)".
std::string GetUsabilityText(const Usable& usable)
{
    const char* const name = GetUsabilityName(usable.fUsability);
    return usable.fUsability == Usability::kHardware ? name
                                                     : fmt::format("{} ({})", name, usable.fReason);
}

std::optional<std::string> GetIfKnown(const std::string& text)
{
    return text.empty() ? std::nullopt : std::optional(text);
}

// Returns the outcome as a file with this extent would have it.
RunOutcome Reduce(const StoredRun& run, OutcomeExtent extent)
{
    if (extent == OutcomeExtent::kNone)
        return MakeOutcomeOfReport(run.fReport);
    RunOutcome outcome = run.fOutcome;
    if (extent == OutcomeExtent::kNoCauses)
        outcome.fCauses.clear();
    return outcome;
}

class RunComparer {
public:
    RunComparer(const StoredRun& before, const StoredRun& after, const ComparisonOptions& options)
        : fBefore(before),
          fAfter(after),
          fExtent(std::min(before.fExtent, after.fExtent)),
          fComparison(CompareReports(before.fReport, after.fReport, options))
    {}

    Comparison Compare(bool comparesIdentity)
    {
        if (fExtent != OutcomeExtent::kNone)
            AddText(DiffGroup::kRun, "verdict", GetVerdictText(fBefore.fOutcome),
                    GetVerdictText(fAfter.fOutcome));
        CompareUsable();
        if (comparesIdentity)
            CompareIdentity();
        std::vector<Difference>& differences = fComparison.fDifferences;
        // What was added last leads its group.
        std::rotate(differences.begin(), differences.end() - static_cast<std::ptrdiff_t>(fAdded),
                    differences.end());
        SortByGroup(differences);
        return std::move(fComparison);
    }

private:
    void CompareUsable()
    {
        const RunOutcome before = Reduce(fBefore, fExtent);
        const RunOutcome after = Reduce(fAfter, fExtent);
        constexpr std::pair<DeviceKind, const char*> kKeys[] = {
            {DeviceKind::kOpenGL, "opengl.usable"}, {DeviceKind::kOpenCL, "opencl.usable"}};
        for (const auto& [kind, key] : kKeys) {
            const Usable first = JudgeUsable(kind, fComparison.fBefore, before);
            const Usable second = JudgeUsable(kind, fComparison.fAfter, after);
            if (!AddText(DiffGroup::kUsable, key, GetUsabilityText(first),
                         GetUsabilityText(second)))
                continue;
            fComparison.fDifferences.back().fTextBefore = GetUsableText(first);
            fComparison.fDifferences.back().fTextAfter = GetUsableText(second);
        }
    }

    void CompareIdentity()
    {
        const Environment& before = fBefore.fFacts.fEnvironment;
        const Environment& after = fAfter.fFacts.fEnvironment;
        AddText(DiffGroup::kIdentity, "host", GetIfKnown(before.fHost.fValue),
                GetIfKnown(after.fHost.fValue));
        AddText(DiffGroup::kIdentity, "time", GetIfKnown(before.fTime), GetIfKnown(after.fTime));
    }

    // Returns whether there is a difference.
    bool AddText(DiffGroup group, const char* key, std::optional<std::string> before,
                 std::optional<std::string> after)
    {
        if (before == after)
            return false;
        Difference difference;
        difference.fGroup = group;
        difference.fKey = key;
        difference.fBefore = std::move(before);
        difference.fAfter = std::move(after);
        fComparison.fDifferences.push_back(std::move(difference));
        ++fAdded;
        return true;
    }

    const StoredRun& fBefore;
    const StoredRun& fAfter;
    const OutcomeExtent fExtent;
    Comparison fComparison;
    std::size_t fAdded = 0;
};

} // namespace

Comparison CompareRuns(const StoredRun& before, const StoredRun& after,
                       const ComparisonOptions& options)
{
    ComparisonOptions tested = options;
    if (before.fSeries && after.fSeries)
        tested.fMeasurements.fTest = [&](const DeviceAnswers& left, const DeviceAnswers& right,
                                         const std::string& key) {
            return CompareSeries(*before.fSeries, *after.fSeries, left, right, key,
                                 options.fMeasurements.fSeriesTolerance);
        };
    return RunComparer(before, after, tested).Compare(options.fIdentity);
}

} // namespace assay_host
