// The devices of a series. A device of one run is found again in the others by its name and index,
// then by its name, then by its index.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "report/Answers.h"

namespace assay_host {

struct KnownDevice {
    DeviceKind fKind;
    std::string fTag;  // when it was first seen
    std::string fName; // the same, raw bytes; may be empty
};

// One thread at a time.
class DeviceList {
public:
    // Returns for each device of a run its place in GetDevices(), to which new ones are added.
    std::vector<std::size_t> Match(const std::vector<DeviceAnswers>& devices);

    const std::vector<KnownDevice>& GetDevices() const { return fDevices; }

private:
    std::vector<KnownDevice> fDevices;
};

} // namespace assay_host
