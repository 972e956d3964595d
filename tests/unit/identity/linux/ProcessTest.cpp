// The state of this process.
#include "identity/linux/Process.h"

#include <gtest/gtest.h>

#include <filesystem>

#include <stdlib.h>

namespace assay_host {
namespace {

using Names = std::vector<std::string>;

TEST(Process, HasTheVariablesAndTheFolder)
{
    ::setenv("ASSAY_TEST_VARIABLE", "a=b", 1);
    ::setenv("ASSAY_TEST_EMPTY", "", 1);
    const Process process = GetThisProcess();
    ::unsetenv("ASSAY_TEST_VARIABLE");
    ::unsetenv("ASSAY_TEST_EMPTY");
    EXPECT_EQ(process.Get("ASSAY_TEST_VARIABLE"), "a=b");
    EXPECT_EQ(process.fVariables.count("ASSAY_TEST_EMPTY"), 1U);
    EXPECT_EQ(process.Get("ASSAY_TEST_EMPTY"), "");
    EXPECT_EQ(process.fVariables.count("ASSAY_TEST_NONE"), 0U);
    EXPECT_EQ(process.Get("ASSAY_TEST_NONE"), "");
    EXPECT_EQ(process.fFolder, std::filesystem::current_path().string());
    EXPECT_EQ(process.fProgram, "");
}

TEST(Process, MakesPathsAbsolute)
{
    Process process;
    process.fFolder = "/home/me";
    EXPECT_EQ(process.MakeAbsolute("x/y"), "/home/me/x/y");
    EXPECT_EQ(process.MakeAbsolute("/x"), "/x");
    EXPECT_EQ(process.MakeAbsolute(""), "");
}

TEST(SplitPaths, LeavesOutWhatIsEmpty)
{
    EXPECT_EQ(SplitPaths(""), Names());
    EXPECT_EQ(SplitPaths(":"), Names());
    EXPECT_EQ(SplitPaths("a"), Names{"a"});
    EXPECT_EQ(SplitPaths(":a::bc:"), (Names{"a", "bc"}));
    EXPECT_EQ(SplitPaths("a:b;c", ';'), (Names{"a:b", "c"}));
}

} // namespace
} // namespace assay_host
