#include "bugreport/Archive.h"

#include <cstdint>
#include <cstdio>

#include <boost/crc.hpp>

namespace assay_host {

namespace {

// The names and the values are those of the format's description (APPNOTE.TXT of PKWARE).
constexpr std::uint32_t kLocalHeader = 0x04034b50;
constexpr std::uint32_t kCentralHeader = 0x02014b50;
constexpr std::uint32_t kEndOfCentral = 0x06054b50;
constexpr std::uint16_t kVersionNeeded = 20;
constexpr std::uint16_t kMadeByUnix = 3 << 8 | kVersionNeeded;
constexpr std::uint16_t kNamesAreUtf8 = 1 << 11;
constexpr std::uint16_t kStored = 0;
constexpr std::uint32_t kRegularFile = 0100644; // of Unix

class Bytes {
public:
    Bytes& Add16(std::uint32_t value)
    {
        fText += static_cast<char>(value & 0xFFU);
        fText += static_cast<char>(value >> 8U & 0xFFU);
        return *this;
    }

    Bytes& Add32(std::uint32_t value) { return Add16(value & 0xFFFFU).Add16(value >> 16U); }

    Bytes& Add(const std::string& text)
    {
        fText += text;
        return *this;
    }

    std::uint32_t GetSize() const { return static_cast<std::uint32_t>(fText.size()); }
    std::string& GetText() { return fText; }

private:
    std::string fText;
};

struct Stamp {
    std::uint32_t fTime = 0;
    std::uint32_t fDate = 1 << 5 | 1; // 1 January 1980
};

Stamp MakeStamp(const std::string& time)
{
    unsigned year = 0;
    unsigned month = 0;
    unsigned day = 0;
    unsigned hour = 0;
    unsigned minute = 0;
    unsigned second = 0;
    constexpr unsigned kFirstYear = 1980;
    if (std::sscanf(time.c_str(), "%4u-%2u-%2uT%2u:%2u:%2u", &year, &month, &day, &hour, &minute,
                    &second) != 6 ||
        year < kFirstYear)
        return {};
    return {hour << 11U | minute << 5U | second / 2, (year - kFirstYear) << 9U | month << 5U | day};
}

std::uint32_t GetChecksum(const std::string& text)
{
    boost::crc_32_type sum;
    sum.process_bytes(text.data(), text.size());
    return sum.checksum();
}

// The fields that both headers of a file have.
void AddFields(Bytes& bytes, const ArchiveFile& file, const Stamp& stamp)
{
    const auto size = static_cast<std::uint32_t>(file.fText.size());
    bytes.Add16(kVersionNeeded).Add16(kNamesAreUtf8).Add16(kStored);
    bytes.Add16(stamp.fTime).Add16(stamp.fDate).Add32(GetChecksum(file.fText));
    bytes.Add32(size).Add32(size);
    bytes.Add16(static_cast<std::uint32_t>(file.fName.size())).Add16(0);
}

} // namespace

std::string MakeArchive(const std::vector<ArchiveFile>& files, const std::string& time)
{
    const Stamp stamp = MakeStamp(time);
    Bytes archive;
    Bytes central;
    for (const ArchiveFile& file : files) {
        const std::uint32_t offset = archive.GetSize();
        archive.Add32(kLocalHeader);
        AddFields(archive, file, stamp);
        archive.Add(file.fName).Add(file.fText);
        central.Add32(kCentralHeader).Add16(kMadeByUnix);
        AddFields(central, file, stamp);
        // No comment, the first disk, no attributes of DOS.
        central.Add16(0).Add16(0).Add16(0).Add32(kRegularFile << 16U).Add32(offset);
        central.Add(file.fName);
    }
    const std::uint32_t start = archive.GetSize();
    const auto count = static_cast<std::uint32_t>(files.size());
    archive.Add(central.GetText());
    archive.Add32(kEndOfCentral).Add16(0).Add16(0).Add16(count).Add16(count);
    archive.Add32(central.GetSize()).Add32(start).Add16(0);
    return std::move(archive.GetText());
}

} // namespace assay_host
