#include "facts/DescribeFiles.h"

#include <fmt/format.h>

#include "facts/win/FixedInfo.h"

namespace assay_host {

namespace {

// All four numbers: the last ones distinguish the drivers of a vendor.
Fact ReadVersion(const std::string& path)
{
    const auto info = ReadFixedInfo(path);
    if (!info)
        return {{}, "the file has none"};
    return {fmt::format("{}.{}.{}.{}", HIWORD(info->dwFileVersionMS), LOWORD(info->dwFileVersionMS),
                        HIWORD(info->dwFileVersionLS), LOWORD(info->dwFileVersionLS)),
            {}};
}

} // namespace

void DescribeFiles(std::vector<LoadedFile>& files)
{
    for (LoadedFile& file : files) {
        file.fVersion = ReadVersion(file.fPath);
        file.fBuildId = {{}, "files of Windows have none"};
    }
}

} // namespace assay_host
