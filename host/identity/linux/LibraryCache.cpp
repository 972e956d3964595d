// The format is described in glibc's sysdeps/generic/dl-cache.h, and the flags of each machine in
// its dl-cache.h below sysdeps/unix/sysv/linux. A file may begin with a table of the old format.
#include "identity/linux/LibraryCache.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace assay_host {

namespace {

constexpr std::string_view kOldMagic = "ld.so-1.7.0";
constexpr std::string_view kMagic = "glibc-ld.so.cache1.1";

// Libraries of this machine.
#if defined(__x86_64__) && defined(__LP64__)
constexpr std::int32_t kFlags = 0x0303;
#elif defined(__aarch64__)
constexpr std::int32_t kFlags = 0x0A03;
#else
constexpr std::int32_t kFlags = 0x0003;
#endif

struct Header {
    char fMagic[20];
    std::uint32_t fCount;
    std::uint32_t fNameBytes;
    std::uint8_t fByteOrder; // in the two lowest bits: 0 for unknown, 2 for little
    std::uint8_t fPadding[3];
    std::uint32_t fExtensions;
    std::uint32_t fUnused[3];
};
static_assert(sizeof(Header) == 48, "the header of the file");

struct Entry {
    std::int32_t fFlags;
    std::uint32_t fName; // places of texts, from the header on
    std::uint32_t fPath;
    std::uint32_t fSystemVersion;
    std::uint64_t fProcessor;
};
static_assert(sizeof(Entry) == 24, "an entry of the file");

struct OldEntry {
    std::int32_t fFlags;
    std::uint32_t fName;
    std::uint32_t fPath;
};

// Returns the bytes from the header on; empty if there is none.
std::string_view FindHeader(std::string_view bytes)
{
    std::size_t begin = 0;
    if (bytes.substr(0, kOldMagic.size()) == kOldMagic) {
        constexpr std::size_t kCount = 12; // after the padded magic text
        constexpr std::size_t kAlignment = 8;
        std::uint32_t count = 0;
        if (bytes.size() < kCount + sizeof(count))
            return {};
        std::memcpy(&count, bytes.data() + kCount, sizeof(count));
        begin = kCount + sizeof(count) + std::size_t{count} * sizeof(OldEntry);
        begin = (begin + kAlignment - 1) / kAlignment * kAlignment;
    }
    if (bytes.size() < begin || bytes.size() - begin < sizeof(Header) ||
        bytes.compare(begin, kMagic.size(), kMagic) != 0)
        return {};
    return bytes.substr(begin);
}

std::string_view GetText(std::string_view bytes, std::size_t place)
{
    if (place >= bytes.size())
        return {};
    const std::string_view text = bytes.substr(place);
    const std::size_t end = text.find('\0');
    return end == std::string_view::npos ? std::string_view() : text.substr(0, end);
}

} // namespace

LibraryCache::LibraryCache(std::string bytes) : fBytes(std::move(bytes))
{
    const std::string_view file = FindHeader(fBytes);
    if (file.empty())
        return;
    Header header{};
    std::memcpy(&header, file.data(), sizeof(header));
    constexpr std::uint8_t kLittle = 2;
    const std::uint8_t order = header.fByteOrder & 3U;
    if ((order != 0 && order != kLittle) ||
        header.fCount > (file.size() - sizeof(header)) / sizeof(Entry))
        return;
    fEntries.reserve(header.fCount);
    for (std::uint32_t index = 0; index < header.fCount; ++index) {
        Entry entry{};
        std::memcpy(&entry, file.data() + sizeof(header) + index * sizeof(entry), sizeof(entry));
        const std::string_view name = GetText(file, entry.fName);
        const std::string_view path = GetText(file, entry.fPath);
        if (entry.fFlags == kFlags && !name.empty() && !path.empty())
            fEntries.emplace_back(name, path);
    }
    std::sort(fEntries.begin(), fEntries.end());
}

std::vector<std::string> LibraryCache::Find(std::string_view name) const
{
    std::vector<std::string> paths;
    const auto first = std::lower_bound(
        fEntries.begin(), fEntries.end(), name,
        [](const auto& entry, std::string_view wanted) { return entry.first < wanted; });
    for (auto entry = first; entry != fEntries.end() && entry->first == name; ++entry)
        paths.emplace_back(entry->second);
    return paths;
}

} // namespace assay_host
