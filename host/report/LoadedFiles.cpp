#include "report/LoadedFiles.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace assay_host {

namespace {

constexpr std::string_view kBegin = "driver files are logged";
constexpr std::string_view kStart = "loaded for ";

// The starts of names, in lower case. These come with any library and belong to no driver.
constexpr std::string_view kRuntime[] = {
    "ld-linux",       "libc.so.",     "libdl.so.",     "libgcc_s.so.", "libm.so.",
    "libpthread.so.", "librt.so.",    "libstdc++.so.", "api-ms-win-",  "msvcp",
    "msvcrt.dll",     "ucrtbase.dll", "vcruntime",
};

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

bool IsRuntime(std::string_view path)
{
    std::string name(path.substr(path.find_last_of("/\\") + 1));
    for (char& letter : name)
        if (letter >= 'A' && letter <= 'Z')
            letter = static_cast<char>(letter - 'A' + 'a');
    return std::any_of(std::begin(kRuntime), std::end(kRuntime),
                       [&](std::string_view start) { return StartsWith(name, start); });
}

void Add(DeviceKind kind, std::string_view path, std::vector<LoadedFile>& files)
{
    if (path.empty() || IsRuntime(path) || files.size() >= LoadedFiles::kMaxFiles ||
        std::any_of(files.begin(), files.end(),
                    [&](const LoadedFile& file) { return file.fPath == path; }))
        return;
    LoadedFile file;
    file.fInterface = kind;
    file.fPath = path;
    files.push_back(std::move(file));
}

} // namespace

bool TakeLoadedFile(std::string_view text, LoadedFiles& files)
{
    if (text == kBegin) {
        files.fReason.clear();
        return true;
    }
    if (!StartsWith(text, kStart))
        return false;
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        const std::string start = std::string(kStart) + GetKindName(kind) + ": ";
        if (!StartsWith(text, start))
            continue;
        files.fReason.clear();
        Add(kind, text.substr(start.size()), files.fFiles);
        return true;
    }
    return false;
}

} // namespace assay_host
