#include "report/SequenceReader.h"

#include <algorithm>
#include <string_view>
#include <tuple>
#include <vector>

#include "report/Numbers.h"

namespace assay_host {

namespace {

std::size_t GetRow(const KnownKey& key)
{
    return static_cast<std::size_t>(&key - GetKnownKeys().data());
}

std::string_view GetLineKey(std::string_view line)
{
    return line.substr(0, line.find('='));
}

} // namespace

bool operator<(const SequenceReader::Place& a, const SequenceReader::Place& b)
{
    return std::tie(a.fRow, a.fDevice, a.fLine) < std::tie(b.fRow, b.fDevice, b.fLine);
}

void SequenceReader::Add(const ReportLine& line)
{
    if (line.fKind == LineKind::kComment)
        AddTermination(line.fText);
    if (line.fKind != LineKind::kValue)
        return;
    if (const auto word = GetDeviceTag(line.fKey))
        AddDeviceLine(*ReadDeviceTag(*word), line);
    else if (line.fKey.rfind("gputag.", 0) == 0)
        AddTagLine(line.fKey);
    else
        AddReportLine(line);
}

// Reads "Testing terminated for glgpu[0]" at the end of a log line.
void SequenceReader::AddTermination(const std::string& text)
{
    constexpr std::string_view kText = "Testing terminated for ";
    const std::size_t at = text.rfind(kText);
    if (at == std::string::npos)
        return;
    const auto tag = ReadDeviceTag(std::string_view(text).substr(at + kText.size()));
    if (tag && tag->fIndex < kMaxDevices)
        fKinds[tag->fKind].fDevices[tag->fIndex].fTerminated = true;
}

void SequenceReader::AddReportLine(const ReportLine& line)
{
    const KnownKey* const known = FindKnownKey(std::nullopt, line.fKey);
    if (!known || HasPassed(*known))
        return;
    Advance({GetRow(*known), 0, 0});
    for (auto& [which, kind] : fKinds) {
        if (known->fKey != GetCountKey(which))
            continue;
        kind.fCount = std::min<std::uint64_t>(ReadUnsigned(line.fValue).value_or(0), kMaxDevices);
        for (std::size_t index = 0; index < *kind.fCount; ++index)
            kind.fDevices[index];
    }
    fEnded = known == &GetKnownKeys().back() && IsStamp(line);
}

void SequenceReader::AddDeviceLine(const DeviceTag& tag, const ReportLine& line)
{
    const KnownKey* const known =
        FindKnownKey(tag.fKind, std::string_view(line.fKey).substr(line.fKey.find('.') + 1));
    if (!known || tag.fIndex >= kMaxDevices)
        return;
    Kind& kind = fKinds[tag.fKind];
    Device& device = kind.fDevices[tag.fIndex];
    const Table<KnownKey> keys = GetDeviceKeys(tag.fKind);
    device.fAnswered =
        std::max(device.fAnswered, static_cast<std::size_t>(known - keys.begin()) + 1);
    for (const KnownKey& key : keys)
        if (line.fValue == "0" && key.fSilentWithout == known->fKey)
            device.fSilent.insert(GetRow(key));
    if (kind.Has(tag.fIndex))
        Advance({GetRow(*known), tag.fIndex, known->fTagLines.size()});
}

// A gputag line names no device. It belongs to the first device that can print it now.
void SequenceReader::AddTagLine(const std::string& key)
{
    for (const KnownKey& known : GetKnownKeys()) {
        const auto line =
            std::find_if(known.fTagLines.begin(), known.fTagLines.end(),
                         [&key](const std::string& text) { return GetLineKey(text) == key; });
        if (line == known.fTagLines.end())
            continue;
        const Kind& kind = fKinds.at(*known.fKind);
        for (const auto& [index, device] : kind.fDevices) {
            const Place place{GetRow(known), index,
                              static_cast<std::size_t>(line - known.fTagLines.begin())};
            if (fLast && !(*fLast < place))
                continue;
            if (!kind.Has(index) || HasFailed({*known.fKind, index}, device))
                continue;
            Advance(place);
            return;
        }
    }
}

void SequenceReader::Advance(const Place& place)
{
    if (!fLast || *fLast < place)
        fLast = place;
}

bool SequenceReader::HasPassed(const KnownKey& key, std::size_t device) const
{
    return fLast && Place{GetRow(key), device, key.fTagLines.size()} < *fLast;
}

bool SequenceReader::HasFailed(const DeviceTag& tag) const
{
    const auto& devices = fKinds.at(tag.fKind).fDevices;
    const auto device = devices.find(tag.fIndex);
    return device != devices.end() && HasFailed(tag, device->second);
}

bool SequenceReader::HasFailed(const DeviceTag& tag, const Device& device) const
{
    const Table<KnownKey> keys = GetDeviceKeys(tag.fKind);
    const auto* const next = std::find_if(keys.begin() + device.fAnswered, keys.end(),
                                          [](const KnownKey& key) { return !key.MayBeSilent(); });
    return device.fTerminated || (next != keys.end() && HasPassed(*next, tag.fIndex));
}

std::size_t SequenceReader::CountAnswered(const DeviceTag& tag) const
{
    const auto& devices = fKinds.at(tag.fKind).fDevices;
    const auto device = devices.find(tag.fIndex);
    return device == devices.end() ? 0 : device->second.fAnswered;
}

bool SequenceReader::HasOpenCL() const
{
    const Kind& kind = fKinds.at(DeviceKind::kOpenCL);
    return kind.fCount || !kind.fDevices.empty();
}

std::size_t SequenceReader::GetSteps() const
{
    if (!fLast)
        return 0;
    std::size_t steps = 1; // the one before the first line
    for (const KnownKey* const key : GetReportKeys()) {
        const bool isReached = GetRow(*key) <= fLast->fRow;
        const bool isCLCount = key->fKey == GetCountKey(DeviceKind::kOpenCL);
        if (isReached && (!isCLCount || HasOpenCL()))
            ++steps;
    }
    for (const auto& [which, kind] : fKinds)
        for (const auto& [index, device] : kind.fDevices)
            steps += CountSteps({which, index}, device);
    return steps;
}

// A step without a line counts once the report has gone past it, unless the device failed there.
std::size_t SequenceReader::CountSteps(const DeviceTag& tag, const Device& device) const
{
    const Table<KnownKey> keys = GetDeviceKeys(tag.fKind);
    std::size_t end = device.fAnswered;
    while (end < keys.size() && keys[end].MayBeSilent() && HasPassed(keys[end], tag.fIndex) &&
           !HasFailed(tag, device))
        ++end;
    return static_cast<std::size_t>(std::count_if(
        keys.begin(), keys.begin() + end, [](const KnownKey& key) { return key.fTakesStep; }));
}

std::string SequenceReader::GetNextKey() const
{
    return GetNext(true);
}

std::string SequenceReader::GetNextAnswerKey() const
{
    return GetNext(false);
}

std::string SequenceReader::GetNext(bool withTagLines) const
{
    const std::vector<KnownKey>& keys = GetKnownKeys();
    if (!fLast)
        return keys.front().fKey;
    if (fEnded)
        return {};
    for (std::size_t row = fLast->fRow; row < keys.size(); ++row) {
        const KnownKey& key = keys[row];
        if (!key.fKind) {
            if (row > fLast->fRow)
                return key.fKey;
            continue;
        }
        const Kind& kind = fKinds.at(*key.fKind);
        for (const auto& [index, device] : kind.fDevices) {
            if (!kind.Has(index))
                continue;
            if (const auto line = FindNextLine(row, {*key.fKind, index}, device))
                return withTagLines && *line < key.fTagLines.size()
                           ? std::string(GetLineKey(key.fTagLines[*line]))
                           : key.GetKey(MakeTag(*key.fKind, index));
        }
    }
    return keys.back().fKey; // its line has come, but isn't whole
}

// Returns which of the row's lines the device prints next, and nothing if it prints no more of
// them.
std::optional<std::size_t> SequenceReader::FindNextLine(std::size_t row, const DeviceTag& tag,
                                                        const Device& device) const
{
    std::size_t line = 0;
    if (row == fLast->fRow && tag.fIndex <= fLast->fDevice)
        line = tag.fIndex < fLast->fDevice ? std::string::npos : fLast->fLine + 1;
    if (line > GetKnownKeys()[row].fTagLines.size() || device.fSilent.count(row) > 0 ||
        HasFailed(tag, device))
        return std::nullopt;
    return line;
}

} // namespace assay_host
