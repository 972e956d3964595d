#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include <elf.h>
#include <link.h>
#include <unistd.h>

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

// Bytes of a note: its name with the zero byte, then its text, each filled up to four bytes.
std::string MakeNote(const std::string& owner, std::uint32_t type, std::string text)
{
    std::string name(owner.c_str(), owner.size() + 1);
    const std::uint32_t sizes[] = {static_cast<std::uint32_t>(name.size()),
                                   static_cast<std::uint32_t>(text.size()), type};
    name.resize((name.size() + 3) / 4 * 4, '#');
    text.resize((text.size() + 3) / 4 * 4, '#');
    return std::string(reinterpret_cast<const char*>(sizes), sizeof sizes) + name + text;
}

struct Segment {
    std::uint32_t fType;
    std::string fBytes;
};

// A file of this machine's kind with these segments.
std::string MakeFile(const std::vector<Segment>& segments)
{
    ElfW(Ehdr) header{};
    std::copy_n(ELFMAG, SELFMAG, header.e_ident);
    header.e_ident[EI_CLASS] = sizeof(void*) == 8 ? ELFCLASS64 : ELFCLASS32;
    header.e_ident[EI_DATA] = ELFDATA2LSB;
    header.e_phoff = sizeof header;
    header.e_phentsize = sizeof(ElfW(Phdr));
    header.e_phnum = static_cast<ElfW(Half)>(segments.size());
    std::string file(reinterpret_cast<const char*>(&header), sizeof header);
    std::string rest;
    for (const Segment& segment : segments) {
        ElfW(Phdr) entry{};
        entry.p_type = segment.fType;
        entry.p_offset = sizeof header + segments.size() * sizeof entry + rest.size();
        entry.p_filesz = segment.fBytes.size();
        file.append(reinterpret_cast<const char*>(&entry), sizeof entry);
        rest += segment.fBytes;
    }
    return file + rest;
}

TEST(ElfNotes, AreFoundByOwnerAndType)
{
    const std::string notes = MakeNote("own", 1, "one") + MakeNote("owner", 2, "three") +
                              MakeNote("own", 2, "four") + MakeNote("own", 2, "last");
    const std::string file = MakeFile({{PT_NOTE, notes}});
    EXPECT_EQ(Find(file, "own", 1), "one");
    EXPECT_EQ(Find(file, "owner", 2), "three");
    EXPECT_EQ(Find(file, "own", 2), "four") << "the first one";
    EXPECT_EQ(Find(file, "owner", 1), "");
    EXPECT_EQ(Find(file, "ow", 1), "");
    EXPECT_EQ(Find(file, "own", 3), "");
}

TEST(ElfNotes, AreReadFromSegmentsOfNotesOnly)
{
    const std::string note = MakeNote("own", 1, "text");
    EXPECT_EQ(Find(MakeFile({{PT_LOAD, note}}), "own", 1), "");
    EXPECT_EQ(Find(MakeFile({{PT_LOAD, "x"}, {PT_NOTE, note}}), "own", 1), "text");
    EXPECT_EQ(Find(MakeFile({{PT_NOTE, MakeNote("other", 1, "x")}, {PT_NOTE, note}}), "own", 1),
              "text");
    EXPECT_EQ(Find(MakeFile({{PT_NOTE, ""}, {PT_NOTE, note}}), "own", 1), "text");
}

TEST(ElfNotes, AreFoundAfterASegmentThatTheFileLacks)
{
    std::string file = MakeFile({{PT_NOTE, "x"}, {PT_NOTE, MakeNote("own", 1, "text")}});
    ElfW(Phdr) first{};
    std::copy_n(file.data() + sizeof(ElfW(Ehdr)), sizeof first, reinterpret_cast<char*>(&first));
    first.p_offset = file.size();
    std::copy_n(reinterpret_cast<const char*>(&first), sizeof first,
                file.data() + sizeof(ElfW(Ehdr)));
    EXPECT_EQ(Find(file, "own", 1), "text");
}

TEST(ElfNotes, AreReadFromAsManySegmentsAsTheFileCounts)
{
    std::string file = MakeFile({{PT_LOAD, "x"}, {PT_NOTE, MakeNote("own", 1, "text")}});
    ASSERT_EQ(Find(file, "own", 1), "text");
    file[offsetof(ElfW(Ehdr), e_phnum)] = 1;
    EXPECT_EQ(Find(file, "own", 1), "");
}

TEST(ElfNotes, MayBeAnyLengthThatTheirSegmentHolds)
{
    for (const std::size_t size : {0U, 1U, 3U, 4U, 5U, 8U}) {
        const std::string text(size, 't');
        const std::string notes = MakeNote("o", 1, text) + MakeNote("behind", 1, "x");
        EXPECT_EQ(Find(MakeFile({{PT_NOTE, notes}}), "o", 1), text) << size;
        EXPECT_EQ(Find(MakeFile({{PT_NOTE, notes}}), "behind", 1), "x") << size;
    }
    const std::string note = MakeNote("own", 1, "text");
    for (std::size_t size = 0; size < note.size(); ++size)
        EXPECT_EQ(Find(MakeFile({{PT_NOTE, note.substr(0, size)}}), "own", 1), "") << size;
}

TEST(ElfNotes, AreReadUpTo64KiBOfASegment)
{
    const std::string note = MakeNote("own", 1, "text");
    const std::string before = MakeNote("o", 1, std::string(65536 - 16 - note.size(), 'x'));
    EXPECT_EQ(Find(MakeFile({{PT_NOTE, before + note}}), "own", 1), "text");
    EXPECT_EQ(Find(MakeFile({{PT_NOTE, MakeNote("o", 1, "") + before + note}}), "own", 1), "");
}

TEST(ElfNotes, AreReadFromThisMachinesKindOfFileOnly)
{
    const std::string file = MakeFile({{PT_NOTE, MakeNote("own", 1, "text")}});
    ASSERT_EQ(Find(file, "own", 1), "text");
    for (const int byte : {0, 1, 2, 3, EI_CLASS, EI_DATA}) {
        std::string other = file;
        char& changed = other[static_cast<std::size_t>(byte)];
        changed = static_cast<char>(changed ^ 3);
        EXPECT_EQ(Find(other, "own", 1), "") << byte;
    }
    std::string other = file;
    ++other[offsetof(ElfW(Ehdr), e_phentsize)];
    EXPECT_EQ(Find(other, "own", 1), "");
    for (std::size_t size = 0; size < sizeof(ElfW(Ehdr)) + sizeof(ElfW(Phdr)); ++size)
        EXPECT_EQ(Find(file.substr(0, size), "own", 1), "") << size;
}

TEST(MakeHexText, HasTwoDigitsOfEachByte)
{
    EXPECT_EQ(MakeHexText(""), "");
    EXPECT_EQ(MakeHexText("\x01\x23\x45\x67\x89\xAB\xCD\xEF"), "0123456789abcdef");
    EXPECT_EQ(MakeHexText(std::string("\x10\x00\xFF", 3)), "1000ff");
}

TEST(FileVersion, IsTheTextOfTheNoteUpToItsZero)
{
    const std::string path = testing::TempDir() + "assay-note-" + std::to_string(::getpid());
    const auto version = [&](const std::string& text) {
        std::ofstream(path, std::ios::binary)
            << MakeFile({{PT_NOTE, MakeNote("assay", 2, "other") + MakeNote("assay", 1, text)}});
        return GetFileVersion(path);
    };
    EXPECT_EQ(version(std::string("1.2\0x", 5)).fValue, "1.2");
    EXPECT_EQ(version("1.2").fValue, "1.2");
    EXPECT_EQ(version("1.2").fReason, "");
    EXPECT_EQ(version(std::string("\0", 1)).fReason, "its file has none");
    std::remove(path.c_str());
}

TEST(FileVersion, IsUnknownForOtherFiles)
{
    EXPECT_EQ(GetFileVersion("/no/such/file").fReason, "its file can't be read");
    EXPECT_EQ(GetFileVersion("/proc/self/exe").fReason, "its file has none");
    EXPECT_EQ(GetFileVersion("/").fReason, "its file has none");
}

} // namespace
} // namespace assay_host
