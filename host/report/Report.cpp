#include "report/Report.h"

#include <optional>

#include "report/LineForm.h"

namespace assay_host {

void Report::Add(ReportLine line)
{
    const std::size_t index = fLines.size();
    if (line.fKind == LineKind::kValue) {
        const std::optional<std::string_view> tag = GetDeviceTag(line.fKey);
        if (tag)
            AddDeviceKey(std::string(*tag), line.fKey, index);
        else
            fPlaces[line.fKey] = {index, 0, 0};
    }
    fLines.push_back(std::move(line));
}

void Report::Add(std::vector<ReportLine> lines)
{
    for (ReportLine& line : lines)
        Add(std::move(line));
}

void Report::AddDeviceKey(const std::string& tag, const std::string& key, std::size_t line)
{
    const auto [device, isNew] = fTags.try_emplace(tag, fDevices.size());
    if (isNew)
        fDevices.push_back({tag, {}});
    auto& keys = fDevices[device->second].fKeys;
    const auto [place, isNewKey] =
        fPlaces.try_emplace(key, Place{line, device->second, keys.size()});
    if (isNewKey) {
        keys.emplace_back(key.substr(tag.size() + 1), line);
    } else {
        place->second.fLine = line;
        keys[place->second.fKey].second = line;
    }
}

const ReportLine* Report::Find(const std::string& key) const
{
    const auto place = fPlaces.find(key);
    return place == fPlaces.end() ? nullptr : &fLines[place->second.fLine];
}

const ReportLine* Report::Find(const Device& device, const std::string& key) const
{
    return Find(device.fTag + "." + key);
}

bool Report::IsWhole() const
{
    const ReportLine* const start = Find("assayStart");
    return start && IsStamp(*start) && HasEnd();
}

bool Report::HasEnd() const
{
    const ReportLine* const end = Find("assayEnd");
    return end && IsStamp(*end);
}

std::string Report::ToText() const
{
    std::string text;
    for (const ReportLine& line : fLines) {
        text += line.fText;
        text += line.fLineEnd;
    }
    return text;
}

} // namespace assay_host
