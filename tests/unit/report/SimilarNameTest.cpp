#include <gtest/gtest.h>

#include "report/SimilarName.h"

namespace assay_host {
namespace {

TEST(SimilarName, IsTheNearestRegardlessOfCase)
{
    const std::vector<std::string> names = {"GLMemoryMB", "CLMemoryMB", "GLVersion"};
    EXPECT_EQ(FindSimilarName("glmemorymb", names), "GLMemoryMB");
    EXPECT_EQ(FindSimilarName("CLMemory", names), "CLMemoryMB");
    EXPECT_EQ(FindSimilarName("GLVersoin", names), "GLVersion");
    // Of two, the first.
    EXPECT_EQ(FindSimilarName("LMemoryMB", names), "GLMemoryMB");
}

// Up to a third of the letters may differ, and two in any case.
TEST(SimilarName, IsNotJustAnyName)
{
    EXPECT_EQ(FindSimilarName("abc", {"abcde"}), "abcde");
    EXPECT_EQ(FindSimilarName("abc", {"abcdef"}), "");
    EXPECT_EQ(FindSimilarName("abcdefghi", {"abcdefghixyz"}), "abcdefghixyz");
    EXPECT_EQ(FindSimilarName("abcdefghi", {"abcdefghiwxyz"}), "");
    EXPECT_EQ(FindSimilarName("abc", {}), "");
    // Letters that are inserted, left out and exchanged count the same.
    EXPECT_EQ(FindSimilarName("xbcdefyz", {"abcdefg"}), "");
    EXPECT_EQ(FindSimilarName("xbcdefg", {"abcdef"}), "abcdef");
    EXPECT_EQ(FindSimilarName("bcde", {"abcdef"}), "abcdef");
    EXPECT_EQ(FindSimilarName("bcd", {"abcdef"}), "");
    EXPECT_EQ(FindSimilarName("xyabc", {"abc"}), "abc");
    // The limits of the letters.
    EXPECT_EQ(FindSimilarName("AAAZZZ", {"aaazzz"}), "aaazzz");
    EXPECT_EQ(FindSimilarName("@@@[[[", {"```{{{"}), "");
}

} // namespace
} // namespace assay_host
