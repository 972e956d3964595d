// Makes the entries of a tester's list from the records of an enumeration.
#pragma once

#include <string>

#include "GPUEntry.h"

namespace assay {

// Returns one entry per record in the same order, tagged "prefix[index]".
template <typename Records>
GPUEntries ListDevices(const std::string& prefix, const Records& records)
{
    GPUEntries entries;
    for (const auto& record : records)
        entries.push_back({prefix + "[" + std::to_string(entries.size()) + "]", record});
    return entries;
}

} // namespace assay
