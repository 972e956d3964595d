// Every file of a tree must be one that a real driver writes: the tree's notes name the source.
#include <algorithm>
#include <filesystem>
#include <set>
#include <sstream>

#include <fnmatch.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/AdapterTree.h"

namespace pmutil {
namespace {

namespace fs = std::filesystem;

// A line of notes.txt; tests/data/adapters/README.md describes the form.
struct Note {
    std::string pattern;
    std::vector<std::string> source; // driver, source file, function, version
};

std::vector<std::string> Split(const std::string& line)
{
    static const std::string gSeparator = " | ";
    std::vector<std::string> parts;
    std::size_t begin = 0;
    for (std::size_t end = 0; end != std::string::npos; begin = end + gSeparator.size()) {
        end = line.find(gSeparator, begin);
        parts.push_back(line.substr(begin, end - begin));
    }
    return parts;
}

std::vector<Note> ReadNotes(const std::string& tree)
{
    std::vector<Note> notes;
    std::istringstream text(ReadAdapterData(tree, "notes.txt"));
    for (std::string line; std::getline(text, line);) {
        std::vector<std::string> parts = Split(line);
        notes.push_back({parts.front(), {parts.begin() + 1, parts.end()}});
    }
    return notes;
}

bool Covers(const Note& note, const std::string& path)
{
    return fnmatch(note.pattern.c_str(), path.c_str(), 0) == 0;
}

// The files, links and empty folders below the root.
std::vector<std::string> Entries(const std::string& root)
{
    std::vector<std::string> paths;
    for (const auto& entry : fs::recursive_directory_iterator(root))
        if (entry.is_symlink() || !entry.is_directory() || fs::is_empty(entry.path()))
            paths.push_back(entry.path().string().substr(root.size() + 1));
    return paths;
}

class AdapterNotesTest : public ::testing::TestWithParam<std::string> {};

TEST_P(AdapterNotesTest, EveryFileHasANoteAndEveryNoteAFile)
{
    const AdapterTree tree(GetParam());
    const std::vector<Note> notes = ReadNotes(GetParam());
    const std::vector<std::string> paths = Entries(tree.root());
    for (const std::string& path : paths) {
        EXPECT_TRUE(std::any_of(notes.begin(), notes.end(),
                                [&](const Note& note) { return Covers(note, path); }))
            << path << " has no note";
    }
    for (const Note& note : notes) {
        EXPECT_TRUE(std::any_of(paths.begin(), paths.end(),
                                [&](const std::string& path) { return Covers(note, path); }))
            << note.pattern << " covers nothing";
    }
}

TEST_P(AdapterNotesTest, EveryNoteNamesDriverFileFunctionAndVersion)
{
    for (const Note& note : ReadNotes(GetParam())) {
        ASSERT_EQ(note.source.size(), 4U) << note.pattern;
        for (const std::string& part : note.source)
            EXPECT_NE(part, "") << note.pattern;
        EXPECT_NE(note.source[3].find_first_of("0123456789"), std::string::npos) << note.pattern;
        // A note that covers everything is useless.
        EXPECT_FALSE(Covers(note, "sys/devices/pci0000:00/0000:00:02.0/lmem_total_bytes"))
            << note.pattern;
    }
}

INSTANTIATE_TEST_SUITE_P(Trees, AdapterNotesTest, ::testing::ValuesIn(AdapterTreeNames()),
                         [](const auto& tree) {
                             std::string name = tree.param;
                             std::replace(name.begin(), name.end(), '-', '_');
                             return name;
                         });

} // namespace
} // namespace pmutil
