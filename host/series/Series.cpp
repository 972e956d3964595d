#include "series/Series.h"

namespace assay_host {

const char* GetSeriesEndName(SeriesEnd end)
{
    constexpr const char* kNames[] = {"done", "interrupted", "given-up", "full"};
    return kNames[static_cast<std::size_t>(end)];
}

} // namespace assay_host
