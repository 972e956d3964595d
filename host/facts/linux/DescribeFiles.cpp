#include "facts/DescribeFiles.h"

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <fstream>
#include <string>
#include <string_view>

#include <elf.h>
#include <sys/stat.h>

#include "facts/linux/ElfNotes.h"

namespace assay_host {

namespace {

std::string GetRealPath(const std::string& path)
{
    char real[PATH_MAX];
    return ::realpath(path.c_str(), real) != nullptr ? real : path;
}

bool IsDigit(char letter)
{
    return letter >= '0' && letter <= '9';
}

// Returns the part of the name after "-", as in "libgallium-25.0.7.so".
std::string_view FindNameVersion(std::string_view name)
{
    for (std::size_t at = 0; at + 1 < name.size(); ++at)
        if (name[at] == '-' && IsDigit(name[at + 1]))
            return name.substr(at + 1);
    return {};
}

// Returns the version in "libEGL.so.1.1.0" or "libgallium-25.0.7.so". Of two the longer one counts,
// and that of the name if both are as long: "libLLVM-15.so.1" is of version 15.
Fact FindVersion(std::string_view path)
{
    constexpr std::string_view kMark = ".so";
    const std::string_view file = path.substr(path.rfind('/') + 1);
    const std::size_t mark = file.find(kMark);
    if (mark == std::string_view::npos)
        return {{}, "the file's name has none"};
    const std::string_view first = FindNameVersion(file.substr(0, mark));
    std::string_view last = file.substr(mark + kMark.size());
    last =
        last.size() > 1 && last[0] == '.' && IsDigit(last[1]) ? last.substr(1) : std::string_view();
    const auto count = [](std::string_view text) {
        return text.empty() ? -1 : std::count(text.begin(), text.end(), '.');
    };
    const std::string_view version = count(first) >= count(last) ? first : last;
    if (version.empty())
        return {{}, "the file's name has none"};
    return {std::string(version), {}};
}

Fact ReadBuildId(const std::string& path)
{
    // The file may have been replaced, also by one whose opening never returns.
    struct stat status {};
    if (::stat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode))
        return {{}, "the file can't be read"};
    std::ifstream file(path, std::ios::binary);
    if (!file)
        return {{}, "the file can't be read"};
    const std::string id = MakeHexText(FindElfNote(file, ELF_NOTE_GNU, NT_GNU_BUILD_ID));
    if (id.empty())
        return {{}, "the file has none"};
    return {id, {}};
}

} // namespace

void DescribeFiles(std::vector<LoadedFile>& files)
{
    for (LoadedFile& file : files) {
        file.fPath = GetRealPath(file.fPath);
        file.fVersion = FindVersion(file.fPath);
        file.fBuildId = ReadBuildId(file.fPath);
    }
}

} // namespace assay_host
