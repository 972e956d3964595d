#include "report/CompareReports.h"

#include <algorithm>
#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>

#include <fmt/format.h>

#include "report/DevicePairs.h"
#include "report/Trials.h"

namespace assay_host {

namespace {

constexpr std::string_view kTagPrefix = "gputag.";

// Answers that are in one report, and that the other one doesn't have for one reason.
struct Unanswered {
    std::size_t fOnlyBefore = 0;
    std::size_t fOnlyAfter = 0;

    bool HasAny() const { return fOnlyBefore > 0 || fOnlyAfter > 0; }
    std::string GetText() const;
};

std::string CountAnswers(std::size_t count)
{
    return fmt::format("{} answer{}", count, count == 1 ? "" : "s");
}

std::string Unanswered::GetText() const
{
    std::string text;
    if (fOnlyBefore > 0)
        text = CountAnswers(fOnlyBefore) + " only in the first report";
    if (fOnlyAfter > 0)
        text +=
            (text.empty() ? "" : ", ") + CountAnswers(fOnlyAfter) + " only in the second report";
    return text;
}

DiffGroup GetGroup(const Answer& answer)
{
    const KnownKey* const known = answer.fKnown;
    if (!known)
        return answer.fKey.compare(0, kTagPrefix.size(), kTagPrefix) == 0 ? DiffGroup::kOthers
                                                                          : DiffGroup::kFacts;
    if (known->fMatch == Match::kStamp)
        return DiffGroup::kIdentity;
    if (known->fMatch == Match::kNumber)
        return DiffGroup::kMeasurements;
    if (known->fKind)
        return IsTrial(known->fKey) ? DiffGroup::kTrials : DiffGroup::kFacts;
    if (known->fForm == ValueForm::kFlag)
        return DiffGroup::kTrials;
    const bool isCount = known->fKey == GetCountKey(DeviceKind::kOpenGL) ||
                         known->fKey == GetCountKey(DeviceKind::kOpenCL);
    return isCount ? DiffGroup::kDevices : DiffGroup::kFacts;
}

std::string GetEndText(const Report& report, const Answers& answers)
{
    if (report.IsWhole())
        return "whole";
    const std::vector<ReportLine>& lines = report.GetLines();
    if (std::none_of(lines.begin(), lines.end(),
                     [](const ReportLine& line) { return line.fKind == LineKind::kValue; }))
        return "empty";
    return answers.fNext.empty() ? "broken off" : "broken off before " + answers.fNext;
}

std::string GetTestsText(const DeviceAnswers& device)
{
    if (!device.fFailed)
        return device.fComplete ? "passed" : "not finished";
    const auto failed =
        std::find_if(device.fAnswers.begin(), device.fAnswers.end(), [](const Answer& answer) {
            return answer.fMissing == Missing::kDeviceFailed;
        });
    return failed == device.fAnswers.end() ? "failed" : "failed at " + failed->fKey;
}

// Whether the run ended before it counted the devices of the kind.
bool IsNotReached(DeviceKind kind, const Answers& answers)
{
    return std::any_of(answers.fReport.begin(), answers.fReport.end(), [kind](const Answer& row) {
        return row.fKey == GetCountKey(kind) && row.fMissing == Missing::kRunEnded;
    });
}

std::size_t CountLines(const DeviceAnswers& device)
{
    return static_cast<std::size_t>(
        std::count_if(device.fAnswers.begin(), device.fAnswers.end(),
                      [](const Answer& answer) { return answer.fLine != nullptr; }));
}

class Comparer {
public:
    Comparer(const Report& before, const Report& after, const ComparisonOptions& options)
        : fReportBefore(before), fReportAfter(after), fOptions(options)
    {
        fComparison.fBefore = GetAnswers(before);
        fComparison.fAfter = GetAnswers(after);
        fEndBefore = GetEndText(before, fComparison.fBefore);
        fEndAfter = GetEndText(after, fComparison.fAfter);
    }

    Comparison Compare()
    {
        Unanswered none;
        CompareAnswers({nullptr, nullptr}, fComparison.fBefore.fReport, fComparison.fAfter.fReport,
                       none);
        CompareDevices();
        CompareEnds();
        CompareRawLines();
        SortByGroup(fComparison.fDifferences);
        return std::move(fComparison);
    }

private:
    void CompareEnds();
    void CompareDevices();
    void AddDevice(const DeviceAnswers* before, const DeviceAnswers* after);
    bool CountUnreached(const DeviceAnswers* before, const DeviceAnswers* after);
    void CompareTests(const DevicePair& pair, const Unanswered& unanswered);
    void CompareAnswers(const DevicePair& pair, const std::vector<Answer>& before,
                        const std::vector<Answer>& after, Unanswered& afterFailure);
    void CompareAnswer(const DevicePair& pair, const Answer* before, const Answer* after,
                       Unanswered& afterFailure);
    MeasurementChange Measure(const DevicePair& pair, const Answer& before,
                              const Answer& after) const;
    bool CountUnanswered(const Answer* before, const Answer* after, Unanswered& afterFailure);
    void CompareRawLines();

    void AddText(DiffGroup group, const char* key, std::optional<std::string> before,
                 std::optional<std::string> after, std::string note,
                 const DevicePair& pair = {nullptr, nullptr})
    {
        fComparison.fDifferences.push_back({group,
                                            pair.fBefore,
                                            pair.fAfter,
                                            nullptr,
                                            nullptr,
                                            key,
                                            std::move(before),
                                            std::move(after),
                                            {},
                                            {},
                                            std::move(note)});
    }

    const Report& fReportBefore;
    const Report& fReportAfter;
    const ComparisonOptions& fOptions;
    Comparison fComparison;
    std::string fEndBefore;
    std::string fEndAfter;
    Unanswered fAfterEnd;
};

void Comparer::CompareEnds()
{
    if (fEndBefore != fEndAfter || fAfterEnd.HasAny())
        AddText(DiffGroup::kRun, "report", fEndBefore, fEndAfter, fAfterEnd.GetText());
}

void Comparer::CompareDevices()
{
    const DevicePairs pairs =
        PairDevices(fComparison.fBefore.fDevices, fComparison.fAfter.fDevices);
    for (const DeviceAnswers* const device : pairs.fOnlyBefore)
        AddDevice(device, nullptr);
    for (const DeviceAnswers* const device : pairs.fOnlyAfter)
        AddDevice(nullptr, device);
    for (const DevicePair& pair : pairs.fPairs) {
        if (pair.fBefore->fTag != pair.fAfter->fTag)
            AddDevice(pair.fBefore, pair.fAfter);
        Unanswered afterFailure;
        CompareAnswers(pair, pair.fBefore->fAnswers, pair.fAfter->fAnswers, afterFailure);
        CompareTests(pair, afterFailure);
    }
}

void Comparer::AddDevice(const DeviceAnswers* before, const DeviceAnswers* after)
{
    if ((!before || !after) && CountUnreached(before, after) && !fOptions.fAll)
        return;
    Difference difference;
    difference.fGroup = DiffGroup::kDevices;
    difference.fDeviceBefore = before;
    difference.fDeviceAfter = after;
    fComparison.fDifferences.push_back(std::move(difference));
}

// Counts the answers of a device that only one run reached. Returns whether the other run ended
// before it.
bool Comparer::CountUnreached(const DeviceAnswers* before, const DeviceAnswers* after)
{
    const DeviceAnswers& device = before ? *before : *after;
    const Answers& other = before ? fComparison.fAfter : fComparison.fBefore;
    if (fEndBefore == fEndAfter || !IsNotReached(device.fKind, other))
        return false;
    (before ? fAfterEnd.fOnlyBefore : fAfterEnd.fOnlyAfter) += CountLines(device);
    return true;
}

void Comparer::CompareTests(const DevicePair& pair, const Unanswered& unanswered)
{
    if (!pair.fBefore->fFailed && !pair.fAfter->fFailed)
        return;
    std::string before = GetTestsText(*pair.fBefore);
    std::string after = GetTestsText(*pair.fAfter);
    if (before != after)
        AddText(DiffGroup::kTrials, "tests", std::move(before), std::move(after),
                unanswered.GetText(), pair);
}

void Comparer::CompareAnswers(const DevicePair& pair, const std::vector<Answer>& before,
                              const std::vector<Answer>& after, Unanswered& afterFailure)
{
    std::unordered_map<std::string_view, const Answer*> partners;
    for (const Answer& answer : after)
        partners.emplace(answer.fKey, &answer);
    for (const Answer& answer : before) {
        const auto found = partners.find(answer.fKey);
        if (found == partners.end()) {
            CompareAnswer(pair, &answer, nullptr, afterFailure);
        } else {
            CompareAnswer(pair, &answer, found->second, afterFailure);
            partners.erase(found);
        }
    }
    for (const Answer& answer : after)
        if (partners.count(answer.fKey) > 0)
            CompareAnswer(pair, nullptr, &answer, afterFailure);
}

void Comparer::CompareAnswer(const DevicePair& pair, const Answer* before, const Answer* after,
                             Unanswered& afterFailure)
{
    const DiffGroup group = GetGroup(before ? *before : *after);
    if ((group == DiffGroup::kIdentity && !fOptions.fIdentity) ||
        (group == DiffGroup::kOthers && !fOptions.fAll))
        return;
    const ReportLine* const left = before ? before->fLine : nullptr;
    const ReportLine* const right = after ? after->fLine : nullptr;
    if (!left && !right)
        return;
    std::string note;
    if (left && right) {
        bool isSame = left->fQuoted == right->fQuoted && left->fValue == right->fValue;
        if (group == DiffGroup::kMeasurements) {
            MeasurementChange change = Measure(pair, *before, *after);
            isSame = !change.fIsChange;
            note = std::move(change.fNote);
        }
        if (isSame) {
            if (fOptions.fKeepSame || !note.empty())
                fComparison.fSame.push_back({pair.fBefore, before, after, std::move(note)});
            return;
        }
    } else if (CountUnanswered(before, after, afterFailure) && !fOptions.fAll) {
        return;
    }
    fComparison.fDifferences.push_back(
        {group, pair.fBefore, pair.fAfter, before, after, {}, {}, {}, {}, {}, std::move(note)});
}

MeasurementChange Comparer::Measure(const DevicePair& pair, const Answer& before,
                                    const Answer& after) const
{
    const MeasurementRule& rule = fOptions.fMeasurements;
    if (rule.fTest && pair.fBefore && pair.fAfter)
        if (auto tested = rule.fTest(*pair.fBefore, *pair.fAfter, before.fKey))
            return std::move(*tested);
    return CompareMeasurements(before, after, rule);
}

// Counts an answer that one run doesn't have because it, or the device, failed before. Returns
// whether it did.
bool Comparer::CountUnanswered(const Answer* before, const Answer* after, Unanswered& afterFailure)
{
    const bool isOnlyBefore = before && before->fLine;
    const Answer* const missing = isOnlyBefore ? after : before;
    const Missing reason = missing ? missing->fMissing : Missing::kNot;
    if (reason != Missing::kRunEnded && reason != Missing::kDeviceFailed)
        return false;
    Unanswered& unanswered = reason == Missing::kRunEnded ? fAfterEnd : afterFailure;
    ++(isOnlyBefore ? unanswered.fOnlyBefore : unanswered.fOnlyAfter);
    return true;
}

void Comparer::CompareRawLines()
{
    std::map<std::string_view, std::ptrdiff_t> counts;
    const auto count = [&counts](const Report& report, std::ptrdiff_t weight) {
        for (const ReportLine& line : report.GetLines())
            if (line.fKind == LineKind::kRaw)
                counts[line.fText] += weight;
    };
    count(fReportBefore, -1);
    count(fReportAfter, 1);
    for (const auto& [text, weight] : counts)
        if (weight < 0)
            AddText(DiffGroup::kOthers, "line", std::string(text), {}, {});
        else if (weight > 0)
            AddText(DiffGroup::kOthers, "line", {}, std::string(text), {});
}

} // namespace

void SortByGroup(std::vector<Difference>& differences)
{
    std::stable_sort(differences.begin(), differences.end(),
                     [](const Difference& a, const Difference& b) { return a.fGroup < b.fGroup; });
}

Comparison CompareReports(const Report& before, const Report& after,
                          const ComparisonOptions& options)
{
    return Comparer(before, after, options).Compare();
}

} // namespace assay_host
