#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <string>
#include <vector>

#include "FakeElf.h"
#include "MachineTree.h"
#include "identity/linux/ElfFile.h"

namespace assay_host {
namespace {

using Names = std::vector<std::string>;

ElfFile Read(const std::string& bytes)
{
    const MachineTree tree;
    tree.Write("/lib/x.so", bytes);
    return ReadElfFile(tree.GetRoot() + "/lib/x.so", "/lib");
}

TEST(ElfFile, HasNamesAndBuildId)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1", std::string(300, 'x'), "libtwo.so"};
    fake.fBuildId = std::string("\x00\xAB\x7f", 3);
    const ElfFile elf = Read(fake.Make());
    EXPECT_EQ(elf.fNeeded, (Names{"libone.so.1", std::string(300, 'x'), "libtwo.so"}));
    EXPECT_EQ(elf.fBuildId, "00ab7f");
    EXPECT_EQ(elf.fRunPath, Names());
    EXPECT_FALSE(elf.fIsRunPathFirst);
}

TEST(ElfFile, HasFoldersToSearch)
{
    FakeElf fake;
    fake.fRunPath = "/one:$ORIGIN/two:${ORIGIN}:relative::$LIB/three:/four/$PLATFORM";
    fake.fFirstPath = "/first";
    const ElfFile elf = Read(fake.Make());
    EXPECT_EQ(elf.fRunPath, (Names{"/one", "/lib/two", "/lib"}));
    EXPECT_FALSE(elf.fIsRunPathFirst);

    fake.fRunPath.clear();
    const ElfFile first = Read(fake.Make());
    EXPECT_EQ(first.fRunPath, Names{"/first"});
    EXPECT_TRUE(first.fIsRunPathFirst);
}

// Changes the type of a segment: 0 holds the names, 1 the notes, 2 the entries.
std::string ChangeType(std::string file, std::size_t segment, std::uint32_t type)
{
    std::memcpy(&file[sizeof(ElfW(Ehdr)) + segment * sizeof(ElfW(Phdr))], &type, sizeof type);
    return file;
}

TEST(ElfFile, HasEachPartInItsKindOfSegment)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1"};
    const std::string file = fake.Make();
    EXPECT_EQ(Read(file).fNeeded, fake.fNeeded);
    EXPECT_EQ(Read(file).fBuildId, "1234");
    EXPECT_EQ(Read(ChangeType(file, 0, PT_GNU_RELRO)).fNeeded, Names());
    EXPECT_EQ(Read(ChangeType(file, 1, PT_LOAD)).fBuildId, "");
    EXPECT_EQ(Read(ChangeType(file, 2, PT_NULL)).fNeeded, Names());
}

TEST(ElfFile, IsEmptyForAnotherFile)
{
    EXPECT_EQ(Read("").fBuildId, "");
    EXPECT_EQ(Read("\177ELF").fNeeded, Names());
    EXPECT_EQ(Read("INPUT(libx.so)").fBuildId, "");
    EXPECT_EQ(ReadElfFile("/nonexistent", "/").fNeeded, Names());
    std::string other = FakeElf().Make();
    other[EI_CLASS] = 0;
    EXPECT_EQ(Read(other).fBuildId, "");
}

TEST(ElfFile, IsOfThisMachinesForm)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1"};
    const std::string file = fake.Make();
    for (const std::size_t place :
         {std::size_t{EI_MAG0}, std::size_t{EI_MAG3}, std::size_t{EI_CLASS}, std::size_t{EI_DATA},
          offsetof(ElfW(Ehdr), e_phentsize)}) {
        std::string other = file;
        ++other[place];
        EXPECT_EQ(Read(other).fBuildId, "") << place;
        EXPECT_EQ(Read(other).fNeeded, Names()) << place;
    }
}

TEST(ElfFile, HasAtMost256Segments)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1"};
    fake.fEmptySegments = 253;
    EXPECT_EQ(Read(fake.Make()).fNeeded, fake.fNeeded);
    fake.fEmptySegments = 254;
    EXPECT_EQ(Read(fake.Make()).fNeeded, Names());
    EXPECT_EQ(Read(fake.Make()).fBuildId, "1234");
}

// The note of another owner, of so many bytes, whose header and name have 16.
std::string MakeNote(std::uint32_t size)
{
    ElfW(Nhdr) header{};
    header.n_namesz = 4;
    header.n_descsz = size - 16;
    header.n_type = NT_GNU_BUILD_ID;
    std::string note(reinterpret_cast<const char*>(&header), sizeof header);
    note.append("ABC", 4);
    note.resize(size);
    return note;
}

// That of a build id of two bytes has 20 bytes.
TEST(ElfFile, HasNotesUpTo4096Bytes)
{
    FakeElf fake;
    fake.fFirstNotes = MakeNote(4076);
    EXPECT_EQ(Read(fake.Make()).fBuildId, "1234");
    fake.fFirstNotes = MakeNote(4080);
    EXPECT_EQ(Read(fake.Make()).fBuildId, "");
}

TEST(ElfFile, HasNoNamesWithoutATable)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1"};
    fake.fHasTable = false;
    EXPECT_EQ(Read(fake.Make()).fNeeded, Names());
}

TEST(ElfFile, HasItsNamesInTheSegmentOfTheirAddress)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1", "libtwo.so"};
    fake.fAreNamesApart = true;
    EXPECT_EQ(Read(fake.Make()).fNeeded, fake.fNeeded);
}

TEST(ElfFile, HasAtMost256Names)
{
    FakeElf fake;
    fake.fNeeded = Names(256, "libx.so");
    EXPECT_EQ(Read(fake.Make()).fNeeded, fake.fNeeded);
    fake.fNeeded.emplace_back("libmore.so");
    EXPECT_EQ(Read(fake.Make()).fNeeded, Names(256, "libx.so"));
}

// The table of the names is the last entry.
TEST(ElfFile, HasAtMost1024Entries)
{
    FakeElf fake;
    fake.fNeeded = Names(1023, "libx.so");
    EXPECT_EQ(Read(fake.Make()).fNeeded.size(), 256U);
    fake.fNeeded.emplace_back("libx.so");
    EXPECT_EQ(Read(fake.Make()).fNeeded, Names());
}

TEST(ElfFile, HasNamesOfLessThan4096Bytes)
{
    FakeElf fake;
    for (const std::size_t size : {127U, 128U, 4095U}) {
        fake.fNeeded = {std::string(size, 'x')};
        EXPECT_EQ(Read(fake.Make()).fNeeded, fake.fNeeded) << size;
    }
    fake.fNeeded = {std::string(4096, 'x'), "libx.so"};
    EXPECT_EQ(Read(fake.Make()).fNeeded, (Names{"", "libx.so"}));
}

// What is left of the file is read; nothing beyond its end.
TEST(ElfFile, MayBeCutAnywhere)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1", "libtwo.so"};
    fake.fRunPath = "/one";
    const std::string whole = fake.Make();
    const MachineTree tree;
    for (std::size_t size = 0; size <= whole.size(); ++size) {
        tree.Write("/x.so", whole.substr(0, size));
        const ElfFile elf = ReadElfFile(tree.GetRoot() + "/x.so", "/");
        EXPECT_LE(elf.fNeeded.size(), 2U) << size;
        if (size == whole.size())
            EXPECT_EQ(elf.fNeeded.size(), 2U);
    }
}

TEST(ElfFile, MayHaveAnyByteChanged)
{
    FakeElf fake;
    fake.fNeeded = {"libone.so.1", "libtwo.so"};
    fake.fRunPath = "/one";
    std::string bytes = fake.Make();
    const MachineTree tree;
    for (char& byte : bytes) {
        const char old = byte;
        byte = static_cast<char>(~old);
        tree.Write("/x.so", bytes);
        EXPECT_LE(ReadElfFile(tree.GetRoot() + "/x.so", "/").fNeeded.size(), 256U);
        byte = old;
    }
}

} // namespace
} // namespace assay_host
