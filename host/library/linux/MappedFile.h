// Finds the file of a mapping of this process.
#pragma once

#include <cstdint>
#include <istream>
#include <locale>
#include <sstream>
#include <string>

namespace assay_host {

// Returns the file of the mapping that contains the address, by a text as that of /proc/self/maps:
// an absolute path, whatever name the file was opened by. Empty if no mapping contains it, or if
// that mapping has no file.
inline std::string FindMappedFile(std::istream& maps, std::uintptr_t address)
{
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

} // namespace assay_host
