// Finds the same devices in two reports.
#pragma once

#include <vector>

#include "report/Answers.h"

namespace assay_host {

struct DevicePair {
    const DeviceAnswers* fBefore;
    const DeviceAnswers* fAfter;
};

struct DevicePairs {
    std::vector<DevicePair> fPairs; // in the order of the first report
    std::vector<const DeviceAnswers*> fOnlyBefore;
    std::vector<const DeviceAnswers*> fOnlyAfter;
};

// Pairs devices by name and index, then by name, then by index. Points into the vectors. Any thread
// may call.
DevicePairs PairDevices(const std::vector<DeviceAnswers>& before,
                        const std::vector<DeviceAnswers>& after);

} // namespace assay_host
