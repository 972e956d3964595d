#include "supervise/Position.h"

#include <gtest/gtest.h>

#include "Reports.h"

namespace assay_host {
namespace {

// The key of a group's answer; empty for a group without one.
std::string GetKey(const std::vector<std::string>& group)
{
    return group.empty() ? std::string() : group.back().substr(0, group.back().find('='));
}

void Feed(Position& position, const std::vector<std::string>& lines)
{
    const Report report = ReadReport(lines);
    for (const ReportLine& line : report.GetLines())
        position.Add(line);
}

TEST(Position, NamesTheNextKeyThroughoutARun)
{
    Position position;
    EXPECT_EQ(position.GetNextKey(), "Tester");
    EXPECT_EQ(position.GetSteps(), 0U);
    const auto run = MakeWholeRun(2, 2);
    for (std::size_t index = 1; index < run.size(); ++index) {
        if (run[index].empty())
            continue;
        EXPECT_EQ(position.GetNextKey(), GetKey(run[index]));
        Feed(position, run[index]);
    }
    EXPECT_EQ(position.GetNextKey(), "");
    EXPECT_EQ(position.GetSteps(), 9 + 1 + 2 * 35 + 2 * 12 - 1U); // the last one shows no line
}

TEST(Position, PassesOverADeviceThatDroppedOut)
{
    Position position;
    auto run = MakeWholeRun(2, -1);
    for (std::size_t index = 0; index < 9; ++index)
        Feed(position, run[index]); // both GLVersion
    Feed(position, run[10]);        // glgpu[1].IsIntegratedGLGPU
    EXPECT_EQ(position.GetNextKey(), "glgpu[1].GLMemoryMB");
}

TEST(Position, IgnoresWhatIsForgedOrForeign)
{
    Position position;
    Feed(position, {"Tester=\"x\"", "NumGLGPUs=99999999999", "# Tester=", "glgpu[7].GLNews=1",
                    "Tester=\"again\""});
    EXPECT_EQ(position.GetNextKey(), "glgpu[0].GLVersion");
    Feed(position, {"assayEnd=\"x\""});
    EXPECT_EQ(position.GetNextKey(), "");
}

} // namespace
} // namespace assay_host
