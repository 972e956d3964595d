// The code of docs/console-children.md, which the build extracts, with a child that crashes. Only
// the program, its arguments and the timeout are replaced.
#include <string>
#include <string_view>
#include <vector>

#include <boost/make_shared.hpp>
#include <boost/nowide/convert.hpp>
#include <gtest/gtest.h>

#include "TestChild.h"
#include "ThreadsEnd.h"
#include "pmutil/ChildCommand.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/OutputPump.h"
#include "pmutil/RunProgram.h"
#include "pmutil/StartAwareApp.h"
#include "support/Waits.h"

namespace {

constexpr int kRounds = 40;
const double kTimeout = pmutil::kLong;
const std::string kProgram = boost::nowide::narrow(TEST_CHILD);

class ConsoleChildrenPage : public testing::Test {
protected:
    const pmutil::ThreadsEnd fThreadsEnd;
    const pmutil::LongShortWait fLongShortWait;
    const std::vector<std::string> fCrash{"out", "begun", "abort"};
    const std::vector<std::string> fGood{"out", "begun"};
};

TEST_F(ConsoleChildrenPage, OneCallSurvivesACrash)
{
    std::string used;
    const auto Use = [&](const std::string& text) { used = text; };
    const auto call = [&](const std::vector<std::string>& kArguments) {
#include "snippets/one_call.inc"
        return run.fEnd;
    };
    for (int round = 0; round < kRounds; ++round)
        ASSERT_EQ(call(fCrash), pmutil::State::kCrashed) << "round " << round;
    EXPECT_EQ(used, "");
    EXPECT_EQ(call(fGood), pmutil::State::kFinished);
    EXPECT_EQ(used.substr(0, 5), "begun");
}

TEST_F(ConsoleChildrenPage, TheClassesSurviveACrash)
{
    std::string output;
    const pmutil::TakeBytes takeOutput = [&](std::string_view block) { output += block; };
    const pmutil::TakeBytes takeErrors = [](std::string_view) {};
    const auto call = [&](const std::vector<std::string>& kArguments) {
#include "snippets/classes.inc"
        return end;
    };
    for (int round = 0; round < kRounds; ++round) {
        output.clear();
        ASSERT_EQ(call(fCrash), pmutil::State::kCrashed) << "round " << round;
        EXPECT_EQ(output.substr(0, 5), "begun");
    }
    EXPECT_EQ(call(fGood), pmutil::State::kFinished);
}

} // namespace
