#include "report/DevicePairs.h"

#include <algorithm>
#include <deque>
#include <string>
#include <unordered_map>
#include <unordered_set>

#include "report/ValueText.h"

namespace assay_host {

namespace {

// Moves the devices with an equal key from the two lists to the pairs.
template <typename GetKey>
void PairBy(GetKey getKey, bool isNamed, DevicePairs& pairs)
{
    std::unordered_map<std::string, std::deque<const DeviceAnswers*>> partners;
    for (const DeviceAnswers* device : pairs.fOnlyAfter)
        partners[getKey(*device)].push_back(device);
    std::unordered_set<const DeviceAnswers*> taken;
    for (const DeviceAnswers* device : pairs.fOnlyBefore) {
        if (isNamed && GetDeviceName(*device).empty())
            continue;
        const auto found = partners.find(getKey(*device));
        if (found == partners.end() || found->second.empty())
            continue;
        pairs.fPairs.push_back({device, found->second.front()});
        taken.insert(device);
        taken.insert(found->second.front());
        found->second.pop_front();
    }
    const auto remove = [&taken](std::vector<const DeviceAnswers*>& devices) {
        devices.erase(std::remove_if(devices.begin(), devices.end(),
                                     [&taken](const DeviceAnswers* device) {
                                         return taken.count(device) > 0;
                                     }),
                      devices.end());
    };
    remove(pairs.fOnlyBefore);
    remove(pairs.fOnlyAfter);
}

} // namespace

DevicePairs PairDevices(const std::vector<DeviceAnswers>& before,
                        const std::vector<DeviceAnswers>& after)
{
    DevicePairs pairs;
    for (const DeviceAnswers& device : before)
        pairs.fOnlyBefore.push_back(&device);
    for (const DeviceAnswers& device : after)
        pairs.fOnlyAfter.push_back(&device);
    const auto byTag = [](const DeviceAnswers& device) { return device.fTag; };
    const auto byName = [](const DeviceAnswers& device) {
        return GetTagWord(device.fKind) + GetDeviceName(device);
    };
    PairBy([&](const DeviceAnswers& device) { return byTag(device) + byName(device); }, true,
           pairs);
    PairBy(byName, true, pairs);
    PairBy(byTag, false, pairs);
    std::sort(pairs.fPairs.begin(), pairs.fPairs.end(),
              [](const DevicePair& a, const DevicePair& b) { return a.fBefore < b.fBefore; });
    return pairs;
}

} // namespace assay_host
