#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/Lines.h"
#include "report/Samples.h"
#include "supervise/Position.h"
#include "supervise/TestSequence.h"

namespace assay_host {
namespace {

// The report is read with one table of its keys and predicted with another.
TEST(KnownKeys, AreThoseOfTheTestSequence)
{
    const auto check = [](const std::vector<assay_host::Test>& tests, Table<KnownKey> keys,
                          const std::string& tag) {
        ASSERT_EQ(tests.size(), keys.size());
        for (std::size_t key = 0; key < keys.size(); ++key) {
            EXPECT_EQ(tests[key].GetKey(tag), tag + "." + keys[key].fKey);
            EXPECT_EQ(tests[key].fMayBeSilent, keys[key].fKey == kOptionalKey);
        }
    };
    check(GetGLTests(), GetDeviceKeys(DeviceKind::kOpenGL), MakeGLTag(3));
    check(GetCLTests(), GetDeviceKeys(DeviceKind::kOpenCL), MakeCLTag(3));
    const Table<const char*> keys = GetReportKeys();
    const std::vector<GlobalKey>& first = GetFirstKeys();
    ASSERT_LT(first.size(), keys.size());
    for (std::size_t key = 0; key < first.size(); ++key)
        EXPECT_STREQ(first[key].fName, keys[key]);
}

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
