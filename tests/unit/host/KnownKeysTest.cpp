#include <gtest/gtest.h>

#include "report/Answers.h"
#include "report/Lines.h"
#include "report/Samples.h"
#include "supervise/Position.h"

namespace assay_host {
namespace {

// What comes next is told while the report arrives, and again from the whole of it.
TEST(Answers, AgreeWithThePositionOnTheNextLine)
{
    Sample samples[] = {
        Sample(2, 2),
        Sample(0, 0),
        Sample(0, 2),
        Sample(2, -1),
        Sample(3, 0).Fail("glgpu[1]", "GLVendor"),
        Sample(1, 2).Set("clgpu[0].CUDASupported", "0").Set("clgpu[0].CUDAVersion", "")};
    for (Sample& sample : samples) {
        Position position;
        Report report;
        EXPECT_EQ(GetAnswers(report).fNext, position.GetNextKey());
        for (const ReportLine& line : ReadLines(sample.GetText())) {
            position.Add(line);
            report.Add(line);
            EXPECT_EQ(GetAnswers(report).fNext, position.GetNextKey()) << "behind " << line.fText;
        }
    }
}

} // namespace
} // namespace assay_host
