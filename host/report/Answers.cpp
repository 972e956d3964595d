#include "report/Answers.h"

#include <algorithm>
#include <map>
#include <string_view>
#include <unordered_set>
#include <utility>

#include "report/LineForm.h"
#include "report/Numbers.h"
#include "report/SequenceReader.h"

namespace assay_host {

namespace {

constexpr DeviceKind kKinds[] = {DeviceKind::kOpenGL, DeviceKind::kOpenCL};

class Collector {
public:
    explicit Collector(const Report& report) : fReport(report)
    {
        for (const ReportLine& line : report.GetLines())
            fSequence.Add(line);
    }

    Answers Collect()
    {
        for (const DeviceKind kind : kKinds)
            CollectDevices(kind);
        CollectReportKeys();
        JudgeValues(fAnswers.fReport, true);
        for (DeviceAnswers& device : fAnswers.fDevices)
            JudgeValues(device.fAnswers, device.GetValue("GLVendorID") != "0");
        fAnswers.fNext = fSequence.GetNextKey();
        return std::move(fAnswers);
    }

private:
    void CollectDevices(DeviceKind kind);
    DeviceAnswers CollectDevice(const DeviceTag& tag, const Device* device);
    Missing JudgeMissing(const DeviceAnswers& device, std::size_t key) const;
    void CollectReportKeys();
    Missing JudgeMissingReportKey(const KnownKey& key) const;
    static void JudgeValues(std::vector<Answer>& answers, bool hasAdapter);

    bool HasDevice(DeviceKind kind) const;

    const Report& fReport;
    SequenceReader fSequence;
    Answers fAnswers{};
};

bool Collector::HasDevice(DeviceKind kind) const
{
    return std::any_of(fAnswers.fDevices.begin(), fAnswers.fDevices.end(),
                       [kind](const DeviceAnswers& device) { return device.fKind == kind; });
}

void Collector::CollectDevices(DeviceKind kind)
{
    std::map<std::size_t, const Device*> devices;
    for (const Device& device : fReport.GetDevices()) {
        const DeviceTag tag = *ReadDeviceTag(device.fTag);
        if (tag.fKind != kind)
            continue;
        if (tag.fIndex < kMaxDevices)
            devices.emplace(tag.fIndex, &device);
        else
            ++fAnswers.fDevicesLeftOut;
    }
    if (const ReportLine* const line = fReport.Find(GetCountKey(kind))) {
        const std::uint64_t count = ReadUnsigned(line->fValue).value_or(0);
        for (std::size_t index = 0; index < std::min<std::uint64_t>(count, kMaxDevices); ++index)
            devices.emplace(index, nullptr);
    }
    for (const auto& [index, device] : devices)
        fAnswers.fDevices.push_back(CollectDevice({kind, index}, device));
}

DeviceAnswers Collector::CollectDevice(const DeviceTag& tag, const Device* device)
{
    DeviceAnswers answers{};
    answers.fTag = MakeTag(tag.fKind, tag.fIndex);
    answers.fKind = tag.fKind;
    answers.fIndex = static_cast<std::uint32_t>(tag.fIndex);
    answers.fFailed = fSequence.HasFailed(tag);
    for (const KnownKey& known : GetDeviceKeys(tag.fKind)) {
        const ReportLine* const line = device ? fReport.Find(*device, known.fKey) : nullptr;
        answers.fAnswers.push_back({known.fKey, &known, line, Missing::kNot, Unknown::kNot});
    }
    answers.fComplete = answers.fAnswers.back().fLine != nullptr;
    for (std::size_t key = 0; key < answers.fAnswers.size(); ++key)
        if (!answers.fAnswers[key].fLine)
            answers.fAnswers[key].fMissing = JudgeMissing(answers, key);
    if (!device)
        return answers;
    for (const auto& [key, line] : device->fKeys) {
        if (!FindKnownKey(tag.fKind, key))
            answers.fAnswers.push_back(
                {key, nullptr, &fReport.GetLines()[line], Missing::kNot, Unknown::kNot});
    }
    return answers;
}

Missing Collector::JudgeMissing(const DeviceAnswers& device, std::size_t key) const
{
    const KnownKey& known = *device.fAnswers[key].fKnown;
    const Missing passed = known.MayBeSilent() ? Missing::kNotPrinted : Missing::kUnreadable;
    if (key < fSequence.CountAnswered({device.fKind, device.fIndex}))
        return passed;
    if (known.MayBeSilent() && device.GetValue(known.fSilentWithout) == "0")
        return Missing::kNotPrinted;
    if (device.fFailed)
        return Missing::kDeviceFailed;
    return fSequence.HasPassed(known, device.fIndex) ? passed : Missing::kRunEnded;
}

void Collector::CollectReportKeys()
{
    for (const KnownKey* const key : GetReportKeys()) {
        const ReportLine* const line = fReport.Find(key->fKey);
        fAnswers.fReport.push_back(
            {key->fKey, key, line, line ? Missing::kNot : JudgeMissingReportKey(*key)});
    }
    std::unordered_set<std::string> others;
    for (const ReportLine& line : fReport.GetLines()) {
        if (line.fKind == LineKind::kValue && !GetDeviceTag(line.fKey) &&
            !FindKnownKey(std::nullopt, line.fKey) && others.insert(line.fKey).second)
            fAnswers.fReport.push_back(
                {line.fKey, nullptr, fReport.Find(line.fKey), Missing::kNot});
    }
}

Missing Collector::JudgeMissingReportKey(const KnownKey& key) const
{
    if (!fSequence.HasPassed(key))
        return Missing::kRunEnded;
    const bool isNoOpenCL =
        key.fKey == GetCountKey(DeviceKind::kOpenCL) && !HasDevice(DeviceKind::kOpenCL);
    return isNoOpenCL ? Missing::kNoOpenCL : Missing::kUnreadable;
}

void Collector::JudgeValues(std::vector<Answer>& answers, bool hasAdapter)
{
    for (Answer& answer : answers)
        if (answer.fLine)
            answer.fUnknown = JudgeUnknown(*answer.fLine, answer.fKnown, hasAdapter);
}

} // namespace

const char* GetMissingText(Missing missing)
{
    switch (missing) {
    case Missing::kNot:
        break;
    case Missing::kNotPrinted:
        return "not printed by this device";
    case Missing::kDeviceFailed:
        return "device failed before";
    case Missing::kRunEnded:
        return "run ended before";
    case Missing::kNoOpenCL:
        return "no OpenCL";
    case Missing::kUnreadable:
        return "no readable line";
    }
    return "";
}

const ReportLine* DeviceAnswers::Find(std::string_view key) const
{
    const auto answer = std::find_if(fAnswers.begin(), fAnswers.end(),
                                     [key](const Answer& row) { return row.fKey == key; });
    return answer == fAnswers.end() ? nullptr : answer->fLine;
}

std::string DeviceAnswers::GetValue(std::string_view key) const
{
    const ReportLine* const line = Find(key);
    return line ? line->fValue : std::string();
}

const Answer* DeviceAnswers::FindFailed() const
{
    const auto answer = std::find_if(fAnswers.begin(), fAnswers.end(), [](const Answer& row) {
        return row.fMissing == Missing::kDeviceFailed;
    });
    return answer == fAnswers.end() ? nullptr : &*answer;
}

Answers GetAnswers(const Report& report)
{
    return Collector(report).Collect();
}

Answers GetAnswers(const Report& report, const RunOutcome& outcome)
{
    Answers answers = GetAnswers(report);
    for (DeviceAnswers& device : answers.fDevices)
        for (Answer& answer : device.fAnswers)
            if (answer.fKnown)
                answer.fLowerBound = outcome.FindLowerBound(answer.fKnown->GetKey(device.fTag));
    return answers;
}

} // namespace assay_host
