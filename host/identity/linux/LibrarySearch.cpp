// The order is that of glibc's elf/dl-load.c (_dl_map_object): DT_RPATH, LD_LIBRARY_PATH,
// DT_RUNPATH, the cache, the system's folders. Of the libraries below "glibc-hwcaps" the loader
// takes the one for the best processor that it runs on; all of them are returned here, since
// listing one too many only costs a look at it.
#include "identity/linux/LibrarySearch.h"

#include <cstddef>
#include <iterator>

namespace assay_host {

namespace {

constexpr std::size_t kMaxCacheSize = std::size_t{16} << 20;

#if defined(__x86_64__)
constexpr const char* kMachine = "x86_64-linux-gnu";
#elif defined(__aarch64__)
constexpr const char* kMachine = "aarch64-linux-gnu";
#else
constexpr const char* kMachine = "unknown";
#endif

} // namespace

LibrarySearch::LibrarySearch(const Files& files, const Process& process)
    : fFiles(files), fProcess(process), fCache(files.Read("/etc/ld.so.cache", kMaxCacheSize))
{
    std::string list = process.Get("LD_LIBRARY_PATH");
    // Both separators count.
    for (char& letter : list)
        if (letter == ';')
            letter = ':';
    for (const std::string& folder : SplitPaths(list))
        fFirstFolders.push_back(process.MakeAbsolute(folder));
    for (const std::string folder : {"/lib", "/usr/lib"})
        fLastFolders.insert(fLastFolders.end(), {folder + "/" + kMachine, folder + "64", folder});
}

const std::vector<std::string>& LibrarySearch::ListVariants(const std::string& folder) const
{
    const auto [known, isNew] = fVariants.try_emplace(folder);
    if (isNew) {
        const std::string variants = folder + "/glibc-hwcaps";
        for (const std::string& variant : fFiles.List(variants))
            known->second.push_back(JoinPath(variants, variant));
    }
    return known->second;
}

void LibrarySearch::AddFolder(const std::string& folder, const std::string& name,
                              std::vector<FileStatus>& found) const
{
    for (const std::string& place : ListVariants(folder))
        if (const auto status = fFiles.Find(JoinPath(place, name)))
            found.push_back(*status);
    if (const auto status = fFiles.Find(JoinPath(folder, name)))
        found.push_back(*status);
}

std::vector<FileStatus> LibrarySearch::FindIn(const std::vector<std::string>& folders,
                                              const std::string& name) const
{
    std::vector<FileStatus> found;
    for (auto folder = folders.begin(); folder != folders.end() && found.empty(); ++folder)
        AddFolder(*folder, name, found);
    return found;
}

std::vector<FileStatus> LibrarySearch::Find(const std::string& name, const ElfFile& from) const
{
    if (name.empty())
        return {};
    if (name.find('/') != std::string::npos) {
        const auto status = fFiles.Find(fProcess.MakeAbsolute(name));
        return status ? std::vector<FileStatus>{*status} : std::vector<FileStatus>();
    }
    if (!from.fRunPath.empty())
        return FindName(name, from);
    const auto [known, isNew] = fKnown.try_emplace(name);
    if (isNew)
        known->second = FindName(name, {});
    return known->second;
}

std::vector<FileStatus> LibrarySearch::FindName(const std::string& name, const ElfFile& from) const
{
    std::vector<FileStatus> found;
    if (from.fIsRunPathFirst)
        found = FindIn(from.fRunPath, name);
    if (found.empty())
        found = FindIn(fFirstFolders, name);
    if (found.empty() && !from.fIsRunPathFirst)
        found = FindIn(from.fRunPath, name);
    if (found.empty())
        for (const std::string& path : fCache.Find(name))
            if (const auto status = fFiles.Find(path))
                found.push_back(*status);
    if (found.empty())
        found = FindIn(fLastFolders, name);
    return found;
}

} // namespace assay_host
