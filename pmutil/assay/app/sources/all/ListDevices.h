// From the records of an enumeration to the entries of a tester's list.
#pragma once

#include <string>

#include "GPUEntry.h"

namespace assay {

// One entry per record in the same order, tagged "prefix[index]".
template <typename Records>
GPUEntries ListDevices(const std::string& prefix, const Records& records)
{
    GPUEntries entries;
    for (const auto& record : records)
        entries.push_back({prefix + "[" + std::to_string(entries.size()) + "]", record});
    return entries;
}

} // namespace assay
