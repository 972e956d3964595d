#include "pmutil/ChildCommand.h"

#include <windows.h>

#include <gmock/gmock.h>

#include <boost/filesystem/operations.hpp>
#include <boost/nowide/convert.hpp>

#include "TempFolder.h"
#include "TestChild.h"
#include "Throws.h"
#include "pmutil/RunProgram.h"

using namespace pmutil;

namespace {

TEST(ChildCommandWin, HoldsTheWholeCommandLine)
{
    const ChildCommand command = MakeChildCommand("C:\\a folder\\p\u00e9.exe", {"", "a\"b", "c\\"});
    EXPECT_EQ(command.fProgram, L"\"C:\\a folder\\p\u00e9.exe\" \"\" \"a\\\"b\" \"c\\\\\"");
    EXPECT_TRUE(command.fArgs.empty());
}

TEST(ChildCommandWin, RefusesAPathThatWouldOpenItsQuotes)
{
    EXPECT_TRUE(ThrowsInvalidArgument("ChildCommand: quotation mark in the path",
                                      [] { MakeChildCommand("p.exe\" \"other.exe", {}); }));
}

// A program in "My Programs", beside a decoy that a search by the parts of its path would find.
class Decoy : public testing::Test {
protected:
    Decoy()
    {
        wchar_t child[MAX_PATH] = {};
        EXPECT_NE(::SearchPathW(nullptr, TEST_CHILD, nullptr, MAX_PATH, child, nullptr), 0U);
        boost::filesystem::create_directory(fProgram.parent_path());
        boost::filesystem::copy_file(child, fProgram);
        boost::filesystem::copy_file(child, fDecoy);
    }

    static RunResult Run(const std::string& program)
    {
        RunOptions options;
        return RunProgram(program, {"self"}, options);
    }

    const TempFolder fFolder;
    const boost::filesystem::path fProgram = fFolder.Path() / "My Programs" / "assay.exe";
    const boost::filesystem::path fDecoy = fFolder.Path() / "My.exe";
};

TEST_F(Decoy, IsNeverStarted)
{
    const std::string program = boost::nowide::narrow(fProgram.wstring());
    EXPECT_THAT(Run(program).fOutput, testing::HasSubstr("\\My Programs\\assay.exe"));
    boost::filesystem::remove(fProgram);
    EXPECT_THROW(Run(program), consoleapp::Exception) << "nor where there is no other";
}

} // namespace
