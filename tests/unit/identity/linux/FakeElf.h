// Makes the bytes of shared libraries that need others, and of the dynamic loader's list.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include <elf.h>
#include <link.h>

namespace assay_host {

struct FakeElf {
    std::vector<std::string> fNeeded;
    std::string fBuildId = "\x12\x34";
    std::string fRunPath;
    std::string fFirstPath;         // DT_RPATH
    std::string fFirstNotes;        // whole notes before that of the build id
    std::size_t fEmptySegments = 0; // before the others
    bool fHasTable = true;          // whether an entry tells where the names are
    bool fAreNamesApart = false;    // in a segment of their own, a gap in the file after the other

    // The addresses differ from the places in the file.
    static constexpr std::uint64_t kAddress = 0x10000;

    std::string Make() const
    {
        std::string names(1, '\0');
        const auto addName = [&names](const std::string& name) {
            const std::uint64_t place = names.size();
            names += name + '\0';
            return place;
        };
        std::vector<std::pair<std::int64_t, std::uint64_t>> entries;
        for (const std::string& name : fNeeded)
            entries.emplace_back(DT_NEEDED, addName(name));
        if (!fRunPath.empty())
            entries.emplace_back(DT_RUNPATH, addName(fRunPath));
        if (!fFirstPath.empty())
            entries.emplace_back(DT_RPATH, addName(fFirstPath));

        const std::size_t segments = fEmptySegments + (fAreNamesApart ? 4 : 3);
        const std::size_t notesAt = sizeof(ElfW(Ehdr)) + segments * sizeof(ElfW(Phdr));
        const std::string notes = fFirstNotes + MakeNotes();
        const std::size_t dynamicAt = (notesAt + notes.size() + 7) / 8 * 8;
        const std::size_t namesAt = dynamicAt + (entries.size() + 2) * sizeof(ElfW(Dyn));
        entries.emplace_back(fHasTable ? DT_STRTAB : DT_DEBUG, kAddress + namesAt);
        entries.emplace_back(DT_NULL, 0);

        ElfW(Ehdr) header{};
        std::memcpy(header.e_ident, ELFMAG, SELFMAG);
        header.e_ident[EI_CLASS] = sizeof(void*) == 8 ? ELFCLASS64 : ELFCLASS32;
        header.e_ident[EI_DATA] = ELFDATA2LSB;
        header.e_type = ET_DYN;
        header.e_phoff = sizeof(header);
        header.e_phentsize = sizeof(ElfW(Phdr));
        header.e_phnum = static_cast<decltype(header.e_phnum)>(segments);
        std::string file;
        Append(file, header);
        for (std::size_t segment = 0; segment < fEmptySegments; ++segment)
            AddSegment(file, PT_NULL, 0, 0);
        AddSegment(file, PT_LOAD, 0, namesAt + (fAreNamesApart ? 0 : names.size()));
        AddSegment(file, PT_NOTE, notesAt, notes.size());
        AddSegment(file, PT_DYNAMIC, dynamicAt, namesAt - dynamicAt);
        constexpr std::size_t kGap = 8;
        if (fAreNamesApart)
            AddSegment(file, PT_LOAD, namesAt, names.size(), kGap);
        file += notes;
        file.resize(dynamicAt);
        for (const auto& [tag, value] : entries) {
            ElfW(Dyn) entry{};
            entry.d_tag = tag;
            entry.d_un.d_val = value;
            Append(file, entry);
        }
        return file + std::string(fAreNamesApart ? kGap : 0, 'x') + names;
    }

private:
    template <typename T>
    static void Append(std::string& file, const T& value)
    {
        file.append(reinterpret_cast<const char*>(&value), sizeof(value));
    }

    static void AddSegment(std::string& file, std::uint32_t type, std::uint64_t offset,
                           std::uint64_t size, std::uint64_t gap = 0)
    {
        ElfW(Phdr) segment{};
        segment.p_type = type;
        segment.p_offset = offset + gap;
        segment.p_vaddr = kAddress + offset;
        segment.p_filesz = size;
        segment.p_memsz = size;
        Append(file, segment);
    }

    std::string MakeNotes() const
    {
        if (fBuildId.empty())
            return {};
        ElfW(Nhdr) header{};
        header.n_namesz = 4;
        header.n_descsz = static_cast<std::uint32_t>(fBuildId.size());
        header.n_type = NT_GNU_BUILD_ID;
        std::string notes;
        Append(notes, header);
        notes.append("GNU", 4);
        notes += fBuildId;
        notes.resize((notes.size() + 3) / 4 * 4);
        return notes;
    }
};

// Makes the bytes of ld.so.cache with these names and paths.
inline std::string
MakeLibraryCache(const std::vector<std::pair<std::string, std::string>>& libraries,
                 std::int32_t flags, unsigned char byteOrder = 2)
{
    constexpr std::size_t kHeader = 48;
    constexpr std::size_t kEntry = 24;
    std::string file = "glibc-ld.so.cache1.1";
    file.resize(kHeader);
    const auto count = static_cast<std::uint32_t>(libraries.size());
    std::memcpy(file.data() + 20, &count, sizeof(count));
    file[28] = static_cast<char>(byteOrder);
    std::string names;
    for (const auto& [name, path] : libraries) {
        const auto place = static_cast<std::uint32_t>(kHeader + libraries.size() * kEntry);
        const std::uint32_t nameAt = place + static_cast<std::uint32_t>(names.size());
        names += name + '\0';
        const std::uint32_t pathAt = place + static_cast<std::uint32_t>(names.size());
        names += path + '\0';
        std::string entry(kEntry, '\0');
        std::memcpy(entry.data(), &flags, sizeof(flags));
        std::memcpy(entry.data() + 4, &nameAt, sizeof(nameAt));
        std::memcpy(entry.data() + 8, &pathAt, sizeof(pathAt));
        file += entry;
    }
    return file + names;
}

// The flags of this machine's libraries in the cache.
#if defined(__x86_64__)
constexpr std::int32_t kCacheFlags = 0x0303;
#elif defined(__aarch64__)
constexpr std::int32_t kCacheFlags = 0x0A03;
#else
constexpr std::int32_t kCacheFlags = 0x0003;
#endif

} // namespace assay_host
