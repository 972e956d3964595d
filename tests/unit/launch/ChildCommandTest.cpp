#include "pmutil/ChildCommand.h"

#include <gmock/gmock.h>

#include <boost/nowide/convert.hpp>

#include "HexLines.h"
#include "TestChild.h"
#include "Throws.h"
#include "pmutil/RunProgram.h"

using namespace pmutil;

namespace {

const std::string kChild = boost::nowide::narrow(TEST_CHILD);

std::vector<std::string> GetReceived(const std::vector<std::string>& args)
{
    std::vector<std::string> all = args;
    all.insert(all.begin(), "args");
    const RunResult run = RunProgram(kChild, all);
    EXPECT_EQ(run.fEnd, State::kFinished);
    return DecodeHexLines(run.fOutput);
}

TEST(ChildCommand, ArgumentsArriveAsTheyAre)
{
    const std::vector<std::string> args = {"",
                                           " ",
                                           "\t",
                                           "\"",
                                           "\\",
                                           "a\\",
                                           "a\"b",
                                           "a\\\"b",
                                           "\\\\\"",
                                           "'a'\"b\"",
                                           "-stdout=a\\",
                                           "-exit=5",
                                           "%PATH%",
                                           "^&|<>",
                                           "\u00e9",
                                           "\u65e5\U0001F600",
                                           "*",
                                           "a\nb",
                                           "C:\\My Folder\\"};
    EXPECT_EQ(GetReceived(args), args);
}

TEST(ChildCommand, ZeroBytesAreRefused)
{
    const std::string zero("a\0b", 3);
    EXPECT_TRUE(
        ThrowsInvalidArgument("ChildCommand: zero byte", [&] { MakeChildCommand(zero, {}); }));
    EXPECT_TRUE(ThrowsInvalidArgument("ChildCommand: zero byte", [&] {
        MakeChildCommand("p", {"a", zero});
    }));
}

} // namespace
