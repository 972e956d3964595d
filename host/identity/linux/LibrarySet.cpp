#include "identity/linux/LibrarySet.h"

#include <algorithm>
#include <iterator>
#include <string_view>

namespace assay_host {

namespace {

// Every program has these. They belong to the system, not to a driver.
constexpr std::string_view kRuntime[] = {"libc.so.",       "libm.so.",  "libdl.so.",
                                         "libpthread.so.", "librt.so.", "libgcc_s.so.",
                                         "libstdc++.so.",  "ld-linux"};

// Bounds the work on a machine with damaged files.
constexpr std::size_t kMaxFiles = 4096;

bool IsRuntime(const std::string& name)
{
    return std::any_of(std::begin(kRuntime), std::end(kRuntime), [&](std::string_view start) {
        return name.compare(0, start.size(), start) == 0;
    });
}

std::string GetFolder(const std::string& path)
{
    return path.substr(0, std::min(path.rfind('/'), path.size()));
}

} // namespace

const ElfFile& LibrarySet::GetElfFile(const std::string& path)
{
    const auto [known, isNew] = fElfFiles.try_emplace(path);
    if (isNew)
        known->second = ReadElfFile(fFiles.GetRealPath(path), GetFolder(path));
    return known->second;
}

void LibrarySet::AddFile(DeviceKind kind, const FileStatus& status)
{
    if (fNodes.emplace(kind, status.fNode).second)
        fDriverFiles.push_back({kind, status.fPath, status.fSize, status.fTime, {}});
}

std::vector<std::string> LibrarySet::Add(DeviceKind kind, const std::string& name,
                                         const ElfFile& from)
{
    std::vector<std::string> paths;
    for (const FileStatus& status : fSearch.Find(name, from)) {
        paths.push_back(status.fPath);
        AddLibrary(kind, status);
    }
    return paths;
}

void LibrarySet::AddLibrary(DeviceKind kind, const FileStatus& status)
{
    std::vector<FileStatus> waiting = {status};
    while (!waiting.empty() && fDriverFiles.size() < kMaxFiles) {
        const FileStatus next = std::move(waiting.back());
        waiting.pop_back();
        if (!fNodes.emplace(kind, next.fNode).second)
            continue;
        const ElfFile& elf = GetElfFile(next.fPath);
        fDriverFiles.push_back({kind, next.fPath, next.fSize, next.fTime, elf.fBuildId});
        for (const std::string& name : elf.fNeeded) {
            // Without folders of its own, every library finds the same.
            if (IsRuntime(name) || (elf.fRunPath.empty() && !fNames.emplace(kind, name).second))
                continue;
            for (FileStatus& needed : fSearch.Find(name, elf))
                waiting.push_back(std::move(needed));
        }
    }
}

} // namespace assay_host
