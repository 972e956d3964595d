#include "report/Answers.h"

#include <algorithm>
#include <map>
#include <optional>
#include <string_view>
#include <unordered_set>
#include <utility>

#include "report/LineForm.h"
#include "report/Numbers.h"

namespace assay_host {

namespace {

constexpr DeviceKind kKinds[] = {DeviceKind::kOpenGL, DeviceKind::kOpenCL};

std::optional<std::size_t> FindKnown(DeviceKind kind, std::string_view key)
{
    const Table<KnownKey> keys = GetDeviceKeys(kind);
    const auto* const known = std::find_if(keys.begin(), keys.end(),
                                           [key](const KnownKey& row) { return key == row.fKey; });
    if (known == keys.end())
        return std::nullopt;
    return static_cast<std::size_t>(known - keys.begin());
}

// Where the report prints a key of a device: all devices' first key, all devices' second key...
struct Position {
    std::size_t fKey;
    std::uint32_t fIndex;
};

bool operator<(const Position& a, const Position& b)
{
    return std::make_pair(a.fKey, a.fIndex) < std::make_pair(b.fKey, b.fIndex);
}

// "Testing terminated for glgpu[0]" at the end of a log line.
std::unordered_set<std::string> FindTerminated(const Report& report)
{
    constexpr std::string_view kText = "Testing terminated for ";
    std::unordered_set<std::string> tags;
    for (const ReportLine& line : report.GetLines()) {
        const std::size_t at =
            line.fKind == LineKind::kComment ? line.fText.rfind(kText) : std::string::npos;
        if (at != std::string::npos)
            tags.insert(line.fText.substr(at + kText.size()));
    }
    return tags;
}

class Collector {
public:
    explicit Collector(const Report& report) : fReport(report), fTerminated(FindTerminated(report))
    {}

    Answers Collect()
    {
        for (const DeviceKind kind : kKinds)
            CollectDevices(kind);
        CollectReportKeys();
        fAnswers.fNext = FindNext();
        return std::move(fAnswers);
    }

private:
    void CollectDevices(DeviceKind kind);
    DeviceAnswers CollectDevice(DeviceKind kind, std::uint32_t index, const Device* device);
    static void JudgeMissing(DeviceAnswers& device, const std::optional<Position>& last,
                             bool isBehind);
    void CollectReportKeys();
    Missing JudgeMissingReportKey(std::size_t key) const;

    bool HasDevice(DeviceKind kind) const;
    bool IsBehind(DeviceKind kind) const;
    std::string FindNext() const;
    std::string FindNextOfDevice(DeviceKind kind, const Position& position) const;
    std::string FindFirstOfDevices(DeviceKind kind) const;

    const Report& fReport;
    std::unordered_set<std::string> fTerminated;
    Answers fAnswers{};
};

bool Collector::HasDevice(DeviceKind kind) const
{
    const std::string start = GetTagWord(kind) + std::string("[");
    const std::vector<Device>& devices = fReport.GetDevices();
    return std::any_of(devices.begin(), devices.end(), [&start](const Device& device) {
        return device.fTag.compare(0, start.size(), start) == 0;
    });
}

// Whether the report has something that comes behind all devices of the kind.
bool Collector::IsBehind(DeviceKind kind) const
{
    const bool behindOpenGL = kind == DeviceKind::kOpenGL &&
                              (fReport.Find("NumCLGPUs") || HasDevice(DeviceKind::kOpenCL));
    return behindOpenGL || fReport.HasEnd();
}

void Collector::CollectDevices(DeviceKind kind)
{
    std::map<std::uint32_t, const Device*> devices;
    const std::string start = GetTagWord(kind) + std::string("[");
    for (const Device& device : fReport.GetDevices()) {
        const std::string_view tag = device.fTag;
        if (tag.substr(0, start.size()) != start)
            continue;
        const auto index = ReadUnsigned(tag.substr(start.size(), tag.size() - start.size() - 1));
        devices.emplace(static_cast<std::uint32_t>(*index), &device);
    }
    if (const ReportLine* const line = fReport.Find(GetCountKey(kind))) {
        const std::uint64_t count = ReadUnsigned(line->fValue).value_or(0);
        for (std::uint32_t index = 0; index < std::min<std::uint64_t>(count, kMaxDevices); ++index)
            devices.emplace(index, nullptr);
    }

    std::vector<DeviceAnswers> found;
    std::optional<Position> last;
    for (const auto& [index, device] : devices) {
        if (found.size() == kMaxDevices) {
            fAnswers.fDevicesLeftOut += devices.size() - kMaxDevices;
            break;
        }
        found.push_back(CollectDevice(kind, index, device));
        for (std::size_t key = 0; key < GetDeviceKeys(kind).size(); ++key) {
            const Position position{key, index};
            if (found.back().fAnswers[key].fLine && (!last || *last < position))
                last = position;
        }
    }
    const bool isBehind = IsBehind(kind);
    for (DeviceAnswers& device : found) {
        device.fFailed = fTerminated.count(device.fTag) > 0;
        JudgeMissing(device, last, isBehind);
        fAnswers.fDevices.push_back(std::move(device));
    }
}

DeviceAnswers Collector::CollectDevice(DeviceKind kind, std::uint32_t index, const Device* device)
{
    DeviceAnswers answers{};
    answers.fTag = MakeTag(kind, index);
    answers.fKind = kind;
    answers.fIndex = index;
    for (const KnownKey& known : GetDeviceKeys(kind)) {
        const ReportLine* const line = device ? fReport.Find(*device, known.fKey) : nullptr;
        answers.fAnswers.push_back({known.fKey, &known, line, Missing::kNot});
    }
    answers.fComplete = answers.fAnswers.back().fLine != nullptr;
    if (!device)
        return answers;
    for (const auto& [key, line] : device->fKeys) {
        if (!FindKnown(kind, key))
            answers.fAnswers.push_back({key, nullptr, &fReport.GetLines()[line], Missing::kNot});
    }
    return answers;
}

void Collector::JudgeMissing(DeviceAnswers& device, const std::optional<Position>& last,
                             bool isBehind)
{
    const std::size_t keys = GetDeviceKeys(device.fKind).size();
    std::size_t answered = 0; // behind the last key that is there
    for (std::size_t key = 0; key < keys; ++key) {
        if (device.fAnswers[key].fLine)
            answered = key + 1;
    }
    for (std::size_t key = 0; key < keys; ++key) {
        Answer& answer = device.fAnswers[key];
        if (answer.fLine)
            continue;
        const bool isOptional = answer.fKnown->MayBeSilent();
        if (key < answered) {
            answer.fMissing = isOptional ? Missing::kNotPrinted : Missing::kUnreadable;
        } else if (isOptional && device.GetValue(answer.fKnown->fSilentWithout) == "0") {
            answer.fMissing = Missing::kNotPrinted;
        } else if (device.fFailed || isBehind || (last && Position{key, device.fIndex} < *last)) {
            answer.fMissing = Missing::kDeviceFailed;
            device.fFailed = true;
        } else {
            answer.fMissing = Missing::kRunEnded;
        }
    }
}

void Collector::CollectReportKeys()
{
    const std::vector<const KnownKey*>& keys = GetReportKeys();
    std::unordered_set<std::string> known;
    for (std::size_t key = 0; key < keys.size(); ++key) {
        const std::string& name = keys[key]->fKey;
        const ReportLine* const line = fReport.Find(name);
        fAnswers.fReport.push_back(
            {name, keys[key], line, line ? Missing::kNot : JudgeMissingReportKey(key)});
        known.insert(name);
    }
    for (const ReportLine& line : fReport.GetLines()) {
        if (line.fKind == LineKind::kValue && !GetDeviceTag(line.fKey) &&
            known.insert(line.fKey).second)
            fAnswers.fReport.push_back(
                {line.fKey, nullptr, fReport.Find(line.fKey), Missing::kNot});
    }
}

Missing Collector::JudgeMissingReportKey(std::size_t key) const
{
    const std::vector<const KnownKey*>& keys = GetReportKeys();
    const std::string& name = keys[key]->fKey;
    const bool isOpenCL = name == "NumCLGPUs";
    const bool hasDevice =
        HasDevice(DeviceKind::kOpenCL) || (!isOpenCL && HasDevice(DeviceKind::kOpenGL));
    if (name != "assayEnd" && hasDevice)
        return Missing::kUnreadable;
    if (isOpenCL && fReport.HasEnd())
        return Missing::kNoOpenCL;
    for (std::size_t later = key + 1; later < keys.size(); ++later) {
        if (fReport.Find(keys[later]->fKey))
            return Missing::kUnreadable;
    }
    return Missing::kRunEnded;
}

std::string Collector::FindNext() const
{
    if (fReport.HasEnd())
        return {};
    const std::vector<const KnownKey*>& keys = GetReportKeys();
    const std::vector<ReportLine>& lines = fReport.GetLines();
    for (auto line = lines.rbegin(); line != lines.rend(); ++line) {
        if (line->fKind != LineKind::kValue)
            continue;
        if (const auto tag = GetDeviceTag(line->fKey)) {
            const DeviceKind kind = (*tag)[0] == 'g' ? DeviceKind::kOpenGL : DeviceKind::kOpenCL;
            const std::size_t open = tag->find('[') + 1;
            const auto index = ReadUnsigned(tag->substr(open, tag->size() - open - 1));
            if (const auto key = FindKnown(kind, line->fKey.substr(tag->size() + 1)))
                return FindNextOfDevice(kind, {*key, static_cast<std::uint32_t>(*index)});
            continue;
        }
        for (const DeviceKind kind : kKinds) {
            if (line->fKey == GetCountKey(kind))
                return FindFirstOfDevices(kind);
        }
        const auto key = std::find(keys.begin(), keys.end(), FindReportKey(line->fKey));
        if (key != keys.end()) // an end stamp that isn't whole is still to come
            return (key + 1 == keys.end() ? *key : key[1])->fKey;
    }
    return keys.front()->fKey;
}

std::string Collector::FindFirstOfDevices(DeviceKind kind) const
{
    for (const DeviceAnswers& device : fAnswers.fDevices) {
        if (device.fKind == kind && !device.fFailed)
            return device.fTag + "." + device.fAnswers[0].fKey;
    }
    return kind == DeviceKind::kOpenGL ? "NumCLGPUs" : "assayEnd";
}

std::string Collector::FindNextOfDevice(DeviceKind kind, const Position& position) const
{
    for (std::size_t key = position.fKey; key < GetDeviceKeys(kind).size(); ++key) {
        for (const DeviceAnswers& device : fAnswers.fDevices) {
            const bool isBehind = position < Position{key, device.fIndex};
            if (device.fKind != kind || !isBehind || device.fFailed)
                continue;
            const bool isSkipped = device.fAnswers[key].fMissing == Missing::kNotPrinted;
            if (!isSkipped)
                return device.fTag + "." + device.fAnswers[key].fKey;
        }
    }
    return kind == DeviceKind::kOpenGL ? "NumCLGPUs" : "assayEnd";
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

Answers GetAnswers(const Report& report)
{
    return Collector(report).Collect();
}

} // namespace assay_host
