#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <sstream>
#include <string>

#include <elf.h>

#include "facts/FileVersion.h"
#include "facts/linux/ElfNotes.h"

namespace assay_host {
namespace {

std::string ReadSelf()
{
    std::ifstream file("/proc/self/exe", std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

std::string Find(const std::string& bytes, const std::string& owner, std::uint32_t type)
{
    std::istringstream file(bytes);
    return FindElfNote(file, owner, type);
}

// Every program of the system's compiler has the note of its system's ABI: four numbers.
TEST(ElfNotes, HaveTheSystemsOwn)
{
    const std::string self = ReadSelf();
    EXPECT_EQ(Find(self, "GNU", NT_GNU_ABI_TAG).size(), 16U);
    EXPECT_EQ(Find(self, "GN", NT_GNU_ABI_TAG), "");
    EXPECT_EQ(Find(self, "GNU", 12345), "");
    EXPECT_EQ(Find(self, "assay", 1), "");
}

TEST(ElfNotes, AreNoneInOtherFiles)
{
    EXPECT_EQ(Find("", "GNU", 1), "");
    EXPECT_EQ(Find("#!/bin/sh\n", "GNU", 1), "");
    EXPECT_EQ(Find(std::string(4096, '\xFF'), "GNU", 1), "");
}

TEST(ElfNotes, SurviveDamage)
{
    const std::string self = ReadSelf().substr(0, 4096);
    for (std::size_t size = 0; size < self.size(); size += 7)
        Find(self.substr(0, size), "GNU", NT_GNU_ABI_TAG);
    for (std::size_t at = 0; at < 1024; ++at) {
        std::string damaged = self;
        damaged[at] = static_cast<char>(~damaged[at]);
        Find(damaged, "GNU", NT_GNU_ABI_TAG);
    }
}

TEST(FileVersion, IsUnknownForOtherFiles)
{
    EXPECT_EQ(GetFileVersion("/no/such/file").fReason, "its file can't be read");
    EXPECT_EQ(GetFileVersion("/proc/self/exe").fReason, "its file has none");
    EXPECT_EQ(GetFileVersion("/").fReason, "its file has none");
}

} // namespace
} // namespace assay_host
