#include "report/Diff.h"

#include <algorithm>
#include <cmath>
#include <deque>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/Numbers.h"
#include "report/ValueText.h"

namespace assay_host {

namespace {

bool IsComparedBy(Match match, const Answer* before, const Answer* after)
{
    const Answer& answer = before ? *before : *after;
    return answer.fKnown && answer.fKnown->fMatch == match;
}

std::string ShowAnswer(const Answer* answer)
{
    if (!answer)
        return "missing";
    if (!answer->fLine)
        return fmt::format("missing ({})", GetMissingText(answer->fMissing));
    const ReportLine& line = *answer->fLine;
    const std::string text = ShowBytes(line.fValue);
    return line.fQuoted ? "\"" + text + "\"" : text;
}

std::string ShowDevice(const DeviceAnswers& device)
{
    const std::string name = GetDeviceName(device);
    return name.empty() ? device.fTag : fmt::format("{} \"{}\"", device.fTag, ShowBytes(name));
}

class Comparer {
public:
    Comparer(std::ostream& out, const DiffOptions& options) : fOut(out), fOptions(options) {}

    bool Compare(const Report& before, const Report& after);

private:
    using Devices = std::vector<const DeviceAnswers*>;
    struct Pair {
        const DeviceAnswers* fBefore;
        const DeviceAnswers* fAfter;
    };

    void Print(const std::string& line)
    {
        fOut << line << "\n";
        fDiffers = true;
    }

    void CompareEnds(const Report& before, const Report& after);
    void CompareDevices(const Answers& before, const Answers& after);
    void CompareAnswers(const std::string& prefix, const std::vector<Answer>& before,
                        const std::vector<Answer>& after);
    bool IsSame(const Answer* before, const Answer* after) const;
    void CompareRawLines(const Report& before, const Report& after);

    static std::vector<Pair> PairUp(Devices& before, Devices& after);

    std::ostream& fOut;
    const DiffOptions& fOptions;
    bool fDiffers = false;
};

bool Comparer::Compare(const Report& before, const Report& after)
{
    const Answers answersBefore = GetAnswers(before);
    const Answers answersAfter = GetAnswers(after);
    CompareEnds(before, after);
    CompareAnswers("", answersBefore.fReport, answersAfter.fReport);
    CompareDevices(answersBefore, answersAfter);
    CompareRawLines(before, after);
    return fDiffers;
}

void Comparer::CompareEnds(const Report& before, const Report& after)
{
    if (before.IsWhole() == after.IsWhole())
        return;
    const auto show = [](const Report& report) {
        return report.IsWhole() ? "whole" : "broken off";
    };
    Print(fmt::format("report: {} -> {}", show(before), show(after)));
}

// Pairs devices by name and index, then by name, then by index. Removes them from the two lists;
// the devices without a partner stay there.
std::vector<Comparer::Pair> Comparer::PairUp(Devices& before, Devices& after)
{
    std::vector<Pair> pairs;
    const auto pair = [&](auto key, bool isNamed) {
        std::unordered_map<std::string, std::deque<const DeviceAnswers*>> partners;
        for (const DeviceAnswers* device : after)
            partners[key(*device)].push_back(device);
        std::unordered_set<const DeviceAnswers*> taken;
        for (const DeviceAnswers* device : before) {
            if (isNamed && GetDeviceName(*device).empty())
                continue;
            const auto found = partners.find(key(*device));
            if (found == partners.end() || found->second.empty())
                continue;
            pairs.push_back({device, found->second.front()});
            taken.insert(device);
            taken.insert(found->second.front());
            found->second.pop_front();
        }
        const auto isTaken = [&taken](const DeviceAnswers* device) {
            return taken.count(device) > 0;
        };
        before.erase(std::remove_if(before.begin(), before.end(), isTaken), before.end());
        after.erase(std::remove_if(after.begin(), after.end(), isTaken), after.end());
    };
    const auto byTag = [](const DeviceAnswers& device) { return device.fTag; };
    const auto byName = [](const DeviceAnswers& device) {
        return GetTagWord(device.fKind) + GetDeviceName(device);
    };
    const auto byBoth = [&](const DeviceAnswers& device) { return byTag(device) + byName(device); };
    pair(byBoth, true);
    pair(byName, true);
    pair(byTag, false);
    return pairs;
}

void Comparer::CompareDevices(const Answers& before, const Answers& after)
{
    Devices left;
    Devices right;
    for (const DeviceAnswers& device : before.fDevices)
        left.push_back(&device);
    for (const DeviceAnswers& device : after.fDevices)
        right.push_back(&device);
    std::vector<Pair> pairs = PairUp(left, right);
    std::sort(pairs.begin(), pairs.end(),
              [](const Pair& a, const Pair& b) { return a.fBefore < b.fBefore; });
    for (const DeviceAnswers* device : left)
        Print(fmt::format("{}: only in the first report", ShowDevice(*device)));
    for (const DeviceAnswers* device : right)
        Print(fmt::format("{}: only in the second report", ShowDevice(*device)));
    for (const Pair& pair : pairs) {
        if (pair.fBefore->fTag != pair.fAfter->fTag)
            Print(fmt::format("{}: now {}", ShowDevice(*pair.fBefore), pair.fAfter->fTag));
        CompareAnswers(pair.fBefore->fTag + ".", pair.fBefore->fAnswers, pair.fAfter->fAnswers);
    }
}

void Comparer::CompareAnswers(const std::string& prefix, const std::vector<Answer>& before,
                              const std::vector<Answer>& after)
{
    std::unordered_map<std::string_view, const Answer*> partners;
    for (const Answer& answer : after)
        partners.emplace(answer.fKey, &answer);
    const auto compare = [&](const std::string& key, const Answer* left, const Answer* right) {
        const bool isLeftOut = !fOptions.fStamps && IsComparedBy(Match::kStamp, left, right);
        if (!isLeftOut && !IsSame(left, right))
            Print(fmt::format("{}{}: {} -> {}", prefix, ShowBytes(key), ShowAnswer(left),
                              ShowAnswer(right)));
    };
    for (const Answer& answer : before) {
        const auto found = partners.find(answer.fKey);
        const Answer* const partner = found == partners.end() ? nullptr : found->second;
        compare(answer.fKey, &answer, partner);
        partners.erase(answer.fKey);
    }
    for (const Answer& answer : after)
        if (partners.count(answer.fKey) > 0)
            compare(answer.fKey, nullptr, &answer);
}

bool Comparer::IsSame(const Answer* before, const Answer* after) const
{
    const ReportLine* const left = before ? before->fLine : nullptr;
    const ReportLine* const right = after ? after->fLine : nullptr;
    // The reason for a missing line isn't compared: it describes the run, not the machine.
    if (!left || !right)
        return left == right;
    if (left->fQuoted == right->fQuoted && left->fValue == right->fValue)
        return true;
    if (!IsComparedBy(Match::kNumber, before, after))
        return false;
    const std::optional<double> a = ReadDouble(left->fValue);
    const std::optional<double> b = ReadDouble(right->fValue);
    if (!a || !b)
        return false;
    if (fOptions.fFasterIsSame && after->IsKnown() && *b >= *a)
        return true;
    return std::abs(*a - *b) <= fOptions.fTolerance * std::max(std::abs(*a), std::abs(*b));
}

void Comparer::CompareRawLines(const Report& before, const Report& after)
{
    std::map<std::string_view, std::ptrdiff_t> counts;
    const auto count = [&counts](const Report& report, std::ptrdiff_t weight) {
        for (const ReportLine& line : report.GetLines())
            if (line.fKind == LineKind::kRaw)
                counts[line.fText] += weight;
    };
    count(before, -1);
    count(after, 1);
    for (const auto& [text, weight] : counts) {
        if (weight != 0)
            Print(fmt::format("other line, only in the {} report: {}",
                              weight < 0 ? "first" : "second", ShowBytes(text)));
    }
}

} // namespace

bool PrintDiff(std::ostream& out, const Report& before, const Report& after,
               const DiffOptions& options)
{
    return Comparer(out, options).Compare(before, after);
}

} // namespace assay_host
