#include "series/DeviceList.h"

#include <optional>

#include "report/ValueText.h"

namespace assay_host {

std::vector<std::size_t> DeviceList::Match(const std::vector<DeviceAnswers>& devices)
{
    std::vector<std::string> names;
    for (const DeviceAnswers& device : devices)
        names.push_back(GetDeviceName(device));
    std::vector<std::optional<std::size_t>> places(devices.size());
    std::vector<bool> isTaken(fDevices.size());
    const auto match = [&](auto isSame) {
        for (std::size_t index = 0; index < devices.size(); ++index) {
            for (std::size_t place = 0; !places[index] && place < isTaken.size(); ++place) {
                if (isTaken[place] || fDevices[place].fKind != devices[index].fKind ||
                    !isSame(fDevices[place], devices[index], names[index]))
                    continue;
                places[index] = place;
                isTaken[place] = true;
            }
        }
    };
    using Known = const KnownDevice&;
    using Found = const DeviceAnswers&;
    using Name = const std::string&;
    match([](Known known, Found found, Name name) {
        return known.fName == name && known.fTag == found.fTag;
    });
    match([](Known known, Found, Name name) { return !name.empty() && known.fName == name; });
    match([](Known known, Found found, Name) { return known.fTag == found.fTag; });
    std::vector<std::size_t> result;
    for (std::size_t index = 0; index < devices.size(); ++index) {
        if (!places[index]) {
            places[index] = fDevices.size();
            fDevices.push_back({devices[index].fKind, devices[index].fTag, names[index]});
        }
        result.push_back(*places[index]);
    }
    return result;
}

} // namespace assay_host
