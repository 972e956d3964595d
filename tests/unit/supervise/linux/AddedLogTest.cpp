// The option that asks a child for the log with the causes of its failures.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "LongTimes.h"
#include "supervise/ChildLauncher.h"
#include "supervise/ChildRun.h"

namespace assay_host {
namespace {

class LastLine : public RunObserver {
public:
    void OnLine(const ReportLine& line, double /*seconds*/) override { fText = line.fText; }

    std::string fText;
};

// Returns the arguments that a child is started with.
std::string GetArguments(bool keepCauses, std::vector<std::string> args)
{
    ChildOptions options;
    options.fProgram = "/bin/echo";
    options.fArgs = std::move(args);
    options.fTimeoutSeconds = 0;
    options.fKeepCauses = keepCauses;
    LastLine line;
    pmutil::StopRequest stop;
    const pmutil::LongShortWait shortWait;
    RunChild(options, line, stop, MakeChildLauncher(), GetLongTimes());
    return line.fText;
}

TEST(AddedLog, IsAskedForBeforeAllArguments)
{
    EXPECT_EQ(GetArguments(true, {}), "-verbose=0x101");
    EXPECT_EQ(GetArguments(true, {"one", "two"}), "-verbose=0x101 one two");
    EXPECT_EQ(GetArguments(false, {"one", "two"}), "one two");
}

TEST(AddedLog, IsNotAskedForIfAnArgumentSetsTheLog)
{
    EXPECT_EQ(GetArguments(true, {"one", "-verbose=1"}), "one -verbose=1");
    EXPECT_EQ(GetArguments(true, {"-verbose=0"}), "-verbose=0");
    EXPECT_EQ(GetArguments(true, {"x-verbose=0"}), "-verbose=0x101 x-verbose=0");
}

} // namespace
} // namespace assay_host
