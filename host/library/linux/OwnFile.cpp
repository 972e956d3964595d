#include <dlfcn.h>

#include <cinttypes>
#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>

#include "library/OwnFile.h"

namespace assay_host {

namespace {

// An object of this file, whose address is in the mapping of the file.
const char gMark = 0;

// Returns the file of the mapping that contains the address: an absolute path, whatever name the
// file was opened by. Empty without /proc.
std::string FindMappedFile(std::uintptr_t address)
{
    std::ifstream maps("/proc/self/maps");
    for (std::string line; std::getline(maps, line);) {
        std::uintptr_t begin = 0;
        std::uintptr_t end = 0;
        char dash = 0;
        std::istringstream range(line);
        range.imbue(std::locale::classic());
        range >> std::hex >> begin >> dash >> end;
        const std::size_t path = line.find('/');
        if (address >= begin && address < end && path != std::string::npos)
            return line.substr(path);
    }
    return {};
}

} // namespace

boost::filesystem::path GetOwnFile()
{
    const std::string mapped = FindMappedFile(reinterpret_cast<std::uintptr_t>(&gMark));
    if (!mapped.empty())
        return mapped;
    Dl_info info = {};
    return ::dladdr(&gMark, &info) != 0 && info.dli_fname != nullptr ? info.dli_fname : "";
}

void KeepLoaded() {}

} // namespace assay_host
