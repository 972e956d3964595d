#include "bugreport/Archive.h"

#include <gtest/gtest.h>

namespace assay_host {
namespace {

std::string Bytes(std::initializer_list<int> bytes)
{
    std::string text;
    for (const int byte : bytes)
        text += static_cast<char>(byte);
    return text;
}

// Written down from the format's description; the checksum of "123456789" is the published one.
TEST(Archive, HasTheBytesOfTheFormat)
{
    const std::string fields = Bytes({20,   0, 0, 8, 0, 0, 0x2D, 0x73, 0x76, 0x5D, 0x26, 0x39, 0xF4,
                                      0xCB, 9, 0, 0, 0, 9, 0,    0,    0,    1,    0,    0,    0});
    const std::string local = "PK\x03\x04" + fields + "a123456789";
    const std::string central = "PK\x01\x02" + Bytes({20, 3}) + fields +
                                Bytes({0, 0, 0, 0, 0, 0, 0, 0, 0xA4, 0x81, 0, 0, 0, 0}) + "a";
    const std::string end =
        "PK\x05\x06" + Bytes({0, 0, 0, 0, 1, 0, 1, 0, 47, 0, 0, 0, 40, 0, 0, 0, 0, 0});
    EXPECT_EQ(MakeArchive({{"a", "123456789"}}, "2026-11-22T14:25:26Z"), local + central + end);
}

// Sizes, offsets and the number of files with all of their bytes.
TEST(Archive, OfManyFiles)
{
    std::vector<ArchiveFile> files(258, {"b", ""});
    files[0] = {"name", std::string(0x30201, 'x')};
    const std::string archive = MakeArchive(files, "");
    EXPECT_EQ(archive.substr(18, 12), Bytes({1, 2, 3, 0, 1, 2, 3, 0, 4, 0, 0, 0}));
    // A header has 30 bytes, and 46 in the directory.
    const std::size_t second = 30 + 4 + 0x30201;
    EXPECT_EQ(archive.substr(second, 4), "PK\x03\x04");
    const std::size_t start = second + 257 * 31;
    const std::size_t next = start + 46 + 4;
    EXPECT_EQ(archive.substr(next, 4), "PK\x01\x02");
    EXPECT_EQ(archive.substr(next + 42, 5), Bytes({0x23, 2, 3, 0, 'b'}));
    const std::size_t end = next + 257 * 47;
    EXPECT_EQ(archive.substr(end), "PK\x05\x06" + Bytes({0, 0, 0, 0, 2, 1, 2, 1, 0x61, 0x2F, 0, 0,
                                                         0x42, 0x21, 3, 0, 0, 0}));
}

TEST(Archive, OfTheFirstYear)
{
    EXPECT_EQ(MakeArchive({{"a", ""}}, "1980-02-03T04:05:07Z").substr(10, 4),
              Bytes({0xA3, 0x20, 0x43, 0}));
}

TEST(Archive, OfATimeThatItCantHave)
{
    const std::string first = Bytes({0, 0, 0x21, 0});
    for (const char* const time : {"", "now", "1979-12-31T23:59:59Z", "2026-11-22T14:25",
                                   "2026-11-22 14:25:26Z", "2026/11-22T14:25:26Z"})
        EXPECT_EQ(MakeArchive({{"a", ""}}, time).substr(10, 4), first) << time;
}

TEST(Archive, OfNoFile)
{
    EXPECT_EQ(MakeArchive({}, ""), "PK\x05\x06" + std::string(18, '\0'));
}

} // namespace
} // namespace assay_host
