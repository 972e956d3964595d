#include "identity/linux/ElfFile.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string_view>

#include <elf.h>
#include <fcntl.h>
#include <link.h>
#include <unistd.h>

#include "facts/linux/ElfNotes.h"
#include "identity/linux/Descriptor.h"

namespace assay_host {

namespace {

constexpr std::size_t kMaxSegments = 256;
constexpr std::size_t kMaxNoteBytes = 4096;
constexpr std::size_t kMaxEntries = 1024; // of the dynamic section
constexpr std::size_t kMaxNeeded = 256;
constexpr std::size_t kMaxName = 4096;

// Reads from an open file, in blocks, since what is wanted lies in few places. Maps nothing: a file
// that is cut at the same time would end the process.
class Reader {
public:
    explicit Reader(const std::string& path)
        : fFile(::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC))
    {}

    // Reads at most `size` bytes.
    std::string Read(std::uint64_t offset, std::size_t size) const
    {
        if (offset < fBegin || offset - fBegin > fBlock.size() ||
            fBlock.size() - (offset - fBegin) < size) {
            fBegin = offset;
            fBlock.resize(std::max(size, kBlock));
            const ssize_t count =
                ::pread(fFile.Get(), fBlock.data(), fBlock.size(), static_cast<off_t>(offset));
            fBlock.resize(static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
        }
        return fBlock.substr(static_cast<std::size_t>(offset - fBegin), size);
    }

    template <typename T>
    std::vector<T> ReadTable(std::uint64_t offset, std::size_t count) const
    {
        const std::string bytes = Read(offset, count * sizeof(T));
        std::vector<T> table(bytes.size() / sizeof(T));
        if (!table.empty())
            std::memcpy(table.data(), bytes.data(), table.size() * sizeof(T));
        return table;
    }

    std::string ReadName(std::uint64_t offset) const
    {
        // Few names are longer than the first read.
        for (const std::size_t size : {std::size_t{128}, kMaxName}) {
            const std::string bytes = Read(offset, size);
            const std::size_t end = bytes.find('\0');
            if (end != std::string::npos)
                return bytes.substr(0, end);
        }
        return {};
    }

private:
    static constexpr std::size_t kBlock = 4096;

    Descriptor fFile;
    mutable std::uint64_t fBegin = 0; // of the block in the file
    mutable std::string fBlock;
};

using Segments = std::vector<ElfW(Phdr)>;

Segments ReadSegments(const Reader& file)
{
    const auto headers = file.ReadTable<ElfW(Ehdr)>(0, 1);
    if (headers.empty())
        return {};
    const ElfW(Ehdr)& header = headers.front();
    constexpr unsigned char kClass = sizeof(void*) == 8 ? ELFCLASS64 : ELFCLASS32;
    if (std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0 || header.e_ident[EI_CLASS] != kClass ||
        header.e_ident[EI_DATA] != ELFDATA2LSB || header.e_phentsize != sizeof(ElfW(Phdr)))
        return {};
    return file.ReadTable<ElfW(Phdr)>(header.e_phoff,
                                      std::min<std::size_t>(header.e_phnum, kMaxSegments));
}

std::string ReadBuildId(const Reader& file, const Segments& segments)
{
    for (const ElfW(Phdr) & segment : segments) {
        if (segment.p_type != PT_NOTE)
            continue;
        const std::string notes =
            file.Read(segment.p_offset, std::min<std::uint64_t>(segment.p_filesz, kMaxNoteBytes));
        const std::string id = FindNote(notes, ELF_NOTE_GNU, NT_GNU_BUILD_ID);
        if (!id.empty())
            return MakeHexText(id);
    }
    return {};
}

// Returns the place in the file of an address; 0 if no segment has it.
std::uint64_t GetOffset(const Segments& segments, std::uint64_t address)
{
    for (const ElfW(Phdr) & segment : segments)
        if (segment.p_type == PT_LOAD && address >= segment.p_vaddr &&
            address - segment.p_vaddr < segment.p_filesz)
            return segment.p_offset + (address - segment.p_vaddr);
    return 0;
}

std::vector<ElfW(Dyn)> ReadDynamic(const Reader& file, const Segments& segments)
{
    for (const ElfW(Phdr) & segment : segments)
        if (segment.p_type == PT_DYNAMIC)
            return file.ReadTable<ElfW(Dyn)>(
                segment.p_offset,
                std::min<std::size_t>(segment.p_filesz / sizeof(ElfW(Dyn)), kMaxEntries));
    return {};
}

// Returns the folders of a list. A folder with a variable other than $ORIGIN is left out.
std::vector<std::string> SplitRunPath(std::string_view list, const std::string& folder)
{
    std::vector<std::string> paths;
    while (!list.empty()) {
        const std::size_t end = std::min(list.find(':'), list.size());
        std::string path(list.substr(0, end));
        list.remove_prefix(std::min(end + 1, list.size()));
        for (const std::string_view name : {"${ORIGIN}", "$ORIGIN"})
            if (path.compare(0, name.size(), name) == 0)
                path.replace(0, name.size(), folder);
        if (!path.empty() && path.front() == '/' && path.find('$') == std::string::npos)
            paths.push_back(std::move(path));
    }
    return paths;
}

} // namespace

ElfFile ReadElfFile(const std::string& realPath, const std::string& folder)
{
    const Reader file(realPath);
    const Segments segments = ReadSegments(file);
    ElfFile elf;
    elf.fBuildId = ReadBuildId(file, segments);
    const std::vector<ElfW(Dyn)> entries = ReadDynamic(file, segments);
    const auto end = std::find_if(entries.begin(), entries.end(),
                                  [](const ElfW(Dyn) & entry) { return entry.d_tag == DT_NULL; });
    const auto find = [&](ElfW(Sxword) tag) {
        return std::find_if(entries.begin(), end,
                            [tag](const ElfW(Dyn) & entry) { return entry.d_tag == tag; });
    };
    const auto table = find(DT_STRTAB);
    const std::uint64_t names = table == end ? 0 : GetOffset(segments, table->d_un.d_ptr);
    if (names == 0)
        return elf;
    for (auto entry = entries.begin(); entry != end && elf.fNeeded.size() < kMaxNeeded; ++entry)
        if (entry->d_tag == DT_NEEDED)
            elf.fNeeded.push_back(file.ReadName(names + entry->d_un.d_val));
    const auto runPath = find(DT_RUNPATH);
    const auto first = find(DT_RPATH);
    elf.fIsRunPathFirst = runPath == end && first != end;
    const auto used = elf.fIsRunPathFirst ? first : runPath;
    if (used != end)
        elf.fRunPath = SplitRunPath(file.ReadName(names + used->d_un.d_val), folder);
    return elf;
}

} // namespace assay_host
