#include "facts/FileVersion.h"

#include <algorithm>
#include <fstream>
#include <utility>

#include "facts/linux/ElfNotes.h"

namespace assay_host {

Fact GetFileVersion(const std::string& path)
{
    constexpr std::uint32_t kVersionNote = 1;
    std::ifstream file(path, std::ios::binary);
    if (!file)
        return {{}, "its file can't be read"};
    std::string version = FindElfNote(file, "assay", kVersionNote);
    version.erase(std::min(version.find('\0'), version.size()));
    if (version.empty())
        return {{}, "its file has none"};
    return {std::move(version), {}};
}

} // namespace assay_host
