#include "supervise/Position.h"

#include <algorithm>
#include <cstdlib>

namespace assay_host {

namespace {

std::size_t ReadCount(const std::string& text)
{
    return std::min<std::size_t>(std::strtoul(text.c_str(), nullptr, 10), kMaxDevices);
}

} // namespace

Position::Position()
{
    Build();
}

void Position::Build()
{
    fEntries.clear();
    for (const KnownKey* const key : GetReportKeys()) {
        const bool isCLCount = key->fKey == GetCountKey(DeviceKind::kOpenCL);
        fEntries.push_back({{}, key->fKey, true, isCLCount});
        if (isCLCount)
            AddDevices(DeviceKind::kOpenCL, fCLCount);
        else if (key->fKey == GetCountKey(DeviceKind::kOpenGL))
            AddDevices(DeviceKind::kOpenGL, fGLCount);
    }
    fPlaces.clear();
    for (std::size_t index = 0; index < fEntries.size(); ++index)
        fPlaces[fEntries[index].fKey] = index;
}

void Position::AddDevices(DeviceKind kind, std::size_t count)
{
    for (const KnownKey& key : GetDeviceKeys(kind)) {
        for (std::size_t index = 0; index < count; ++index) {
            const std::string tag = MakeTag(kind, index);
            fEntries.push_back({tag, key.GetKey(tag), key.fTakesStep, key.MayBeSilent()});
        }
    }
}

void Position::Add(const ReportLine& line)
{
    if (line.fKind != LineKind::kValue)
        return;
    const auto place = fPlaces.find(line.fKey);
    if (place == fPlaces.end() || place->second < fNext)
        return;
    if (fNext == 0)
        ++fSteps; // that of the start
    for (; fNext < place->second; ++fNext) {
        const Entry& passed = fEntries[fNext];
        if (!passed.fMayBeSilent)
            fDropped.insert(passed.fTag);
        else if (!passed.fTag.empty() && fDropped.count(passed.fTag) == 0)
            ++fSteps;
    }
    const Entry& entry = fEntries[fNext];
    if (entry.fTakesStep)
        ++fSteps;
    if (entry.fKey == entry.fTag + ".CUDASupported" && line.fValue == "0")
        fSilent.insert(entry.fTag);
    ++fNext;
    if (line.fKey == GetCountKey(DeviceKind::kOpenGL))
        fGLCount = ReadCount(line.fValue);
    else if (line.fKey == GetCountKey(DeviceKind::kOpenCL))
        fCLCount = ReadCount(line.fValue);
    else
        return;
    Build();
}

std::string Position::GetNextKey() const
{
    for (std::size_t index = fNext; index < fEntries.size(); ++index) {
        const Entry& entry = fEntries[index];
        const bool isSilent = entry.fMayBeSilent && fSilent.count(entry.fTag) > 0;
        if (entry.fTag.empty() || (!isSilent && fDropped.count(entry.fTag) == 0))
            return entry.fKey;
    }
    return {};
}

} // namespace assay_host
