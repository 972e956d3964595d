#include "facts/linux/ElfNotes.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <string_view>

#include <elf.h>
#include <link.h>

namespace assay_host {

namespace {

constexpr std::size_t kMaxNoteBytes = std::size_t{1} << 16;

template <typename T>
bool ReadAt(std::istream& file, std::uint64_t offset, T& value)
{
    file.clear();
    file.seekg(static_cast<std::streamoff>(offset));
    file.read(reinterpret_cast<char*>(&value), sizeof(value));
    return static_cast<bool>(file);
}

bool IsNative(const ElfW(Ehdr) & header)
{
    constexpr unsigned char kClass = sizeof(void*) == 8 ? ELFCLASS64 : ELFCLASS32;
    return std::memcmp(header.e_ident, ELFMAG, SELFMAG) == 0 &&
           header.e_ident[EI_CLASS] == kClass && header.e_ident[EI_DATA] == ELFDATA2LSB &&
           header.e_phentsize == sizeof(ElfW(Phdr));
}

std::size_t Align(std::size_t size)
{
    return (size + 3) & ~std::size_t{3};
}

} // namespace

std::string FindNote(const std::string& notes, const std::string& owner, std::uint32_t type)
{
    std::size_t at = 0;
    while (notes.size() - at >= sizeof(ElfW(Nhdr))) {
        ElfW(Nhdr) header{};
        std::memcpy(&header, notes.data() + at, sizeof(header));
        at += sizeof(header);
        const std::size_t name = Align(header.n_namesz);
        const std::size_t text = Align(header.n_descsz);
        if (name > notes.size() - at || text > notes.size() - at - name)
            break;
        if (header.n_type == type && header.n_namesz == owner.size() + 1 &&
            notes.compare(at, owner.size() + 1, owner.c_str(), owner.size() + 1) == 0)
            return notes.substr(at + name, header.n_descsz);
        at += name + text;
    }
    return {};
}

std::string MakeHexText(const std::string& bytes)
{
    constexpr std::string_view kDigits = "0123456789abcdef";
    std::string text;
    for (const char byte : bytes) {
        const auto value = static_cast<unsigned char>(byte);
        text += kDigits[value >> 4];
        text += kDigits[value & 0xF];
    }
    return text;
}

std::string FindElfNote(std::istream& file, const std::string& owner, std::uint32_t type)
{
    ElfW(Ehdr) header{};
    if (!ReadAt(file, 0, header) || !IsNative(header))
        return {};
    for (std::uint64_t index = 0; index < header.e_phnum; ++index) {
        ElfW(Phdr) segment{};
        if (!ReadAt(file, header.e_phoff + index * sizeof(segment), segment))
            return {};
        if (segment.p_type != PT_NOTE)
            continue;
        std::string notes(std::min<std::uint64_t>(segment.p_filesz, kMaxNoteBytes), '\0');
        file.seekg(static_cast<std::streamoff>(segment.p_offset));
        file.read(notes.data(), static_cast<std::streamsize>(notes.size()));
        notes.resize(static_cast<std::size_t>(file.gcount()));
        std::string found = FindNote(notes, owner, type);
        if (!found.empty())
            return found;
    }
    return {};
}

} // namespace assay_host
