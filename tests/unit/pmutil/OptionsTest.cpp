#include "pmutil/Options.h"

#include <gtest/gtest.h>

namespace pmutil {
namespace {

std::string Show(const std::string& argument)
{
    const std::optional<Option> option = SplitOption(argument);
    return option ? option->fName + "|" + option->fValue : "none";
}

TEST(SplitOption, CutsAtTheFirstSign)
{
    EXPECT_EQ(Show("-name=value"), "name|value");
    EXPECT_EQ(Show("-name=a=b"), "name|a=b");
    EXPECT_EQ(Show("-name="), "name|");
    EXPECT_EQ(Show("-="), "|");
    EXPECT_EQ(Show("--name=value"), "-name|value");
}

TEST(SplitOption, LeavesWhatIsNoOption)
{
    for (const char* argument : {"", "-", "-name", "name=value", "=", " -name=value"})
        EXPECT_EQ(Show(argument), "none") << argument;
}

TEST(SplitOption, TakesOnePairOfQuotesOff)
{
    EXPECT_EQ(Show("-name=\"a b\""), "name|a b");
    EXPECT_EQ(Show("-name=\"\""), "name|");
    EXPECT_EQ(Show("-name=\""), "name|\"");
    EXPECT_EQ(Show("-name=\"\"a\"\""), "name|\"a\"");
    EXPECT_EQ(Show("-name=\"a"), "name|\"a");
}

} // namespace
} // namespace pmutil
