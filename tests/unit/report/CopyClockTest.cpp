#include "report/CopyClock.h"

#include <gtest/gtest.h>

#include <string>

#include "Lines.h"

namespace assay_host {
namespace {

constexpr char kStart[] = "GPUImplHardware::checkBandwidthCL: 0 of 100, totalSeconds=0";
constexpr char kNext[] = "GPUImplHardware::checkBandwidthCL: 10 of 100, totalSeconds=0.1";
constexpr char kEnd[] = "GPUImplHardware::checkBandwidthCL: seconds=0.1";
constexpr double kBatch = 335544320;

std::string Log(const std::string& time, const std::string& text)
{
    return "# 00009.2026.11.22_" + time + "(+00.000)[tid=1] " + text + "\n";
}

std::vector<LowerBound> GetBounds(const std::string& text)
{
    CopyClock clock;
    const Report report = ReadReport(text);
    for (const ReportLine& line : report.GetLines())
        clock.Add(line);
    return clock.GetBounds();
}

// Returns the only bound.
double GetBound(const std::string& text)
{
    const std::vector<LowerBound> bounds = GetBounds(text);
    EXPECT_EQ(bounds.size(), 1U);
    return bounds.empty() ? 0 : bounds.front().fValue;
}

TEST(CopyClock, DividesByTheTimeOfAllBatches)
{
    const std::vector<LowerBound> bounds = GetBounds(
        Log("10:00:00.100", kStart) + Log("10:00:00.200", kEnd) + Log("10:00:00.200", kNext) +
        Log("10:00:00.499", kEnd) + Log("10:00:09.000", "END x") + "clgpu[1].CLBandwidth=1e+09\n");
    ASSERT_EQ(bounds.size(), 1U);
    EXPECT_EQ(bounds[0].fKey, "clgpu[1].CLBandwidth");
    EXPECT_DOUBLE_EQ(bounds[0].fValue, 2 * kBatch / 0.4);
}

TEST(CopyClock, AddsTheResolutionOfTheTimes)
{
    EXPECT_DOUBLE_EQ(GetBound(Log("10:00:00.100", kStart) + Log("10:00:00.100", kEnd) +
                              "clgpu[0].CLBandwidth=0\n"),
                     kBatch / 0.001);
}

TEST(CopyClock, RunsPastMinutesHoursAndMidnight)
{
    EXPECT_DOUBLE_EQ(GetBound(Log("10:59:59.999", kStart) + Log("11:00:00.998", kEnd) +
                              "clgpu[0].CLBandwidth=0\n"),
                     kBatch);
    EXPECT_DOUBLE_EQ(GetBound(Log("23:59:59.500", kStart) + Log("00:00:00.499", kEnd) +
                              "clgpu[0].CLBandwidth=0\n"),
                     kBatch);
}

TEST(CopyClock, TimesEachDevice)
{
    const std::string first = Log("10:00:00.000", kStart) + Log("10:00:00.999", kEnd);
    const std::string second = Log("10:00:02.000", kStart) + Log("10:00:03.999", kEnd);
    const std::vector<LowerBound> bounds =
        GetBounds(first + "clgpu[0].CLBandwidth=1\n" + second + "clgpu[1].CLBandwidth=2\n");
    ASSERT_EQ(bounds.size(), 2U);
    EXPECT_DOUBLE_EQ(bounds[0].fValue, kBatch);
    EXPECT_DOUBLE_EQ(bounds[1].fValue, kBatch / 2);
    EXPECT_EQ(GetBounds(first + "clgpu[0].CLBandwidth=1\n" + Log("10:00:04.000", kEnd) +
                        "clgpu[1].CLBandwidth=2\n")
                  .size(),
              1U);
    // A line in between is of another test.
    EXPECT_DOUBLE_EQ(GetBound(Log("10:00:00.000", kStart) + "clgpu[1].CLCompute=1\n" +
                              Log("10:00:00.999", kEnd) + "clgpu[0].CLBandwidth=1\n"),
                     kBatch);
    // The first device fails.
    EXPECT_DOUBLE_EQ(GetBound(first + second + "clgpu[1].CLBandwidth=2\n"), kBatch / 2);
}

TEST(CopyClock, HasNoBoundWithoutAWholeBatch)
{
    const std::string value = "clgpu[0].CLBandwidth=1\n";
    for (const std::string& log :
         {std::string(), Log("10:00:00.000", kStart), Log("10:00:00.000", kEnd),
          "# 00009 " + std::string(kStart) + "\n# 00009 " + kEnd + "\n",
          Log("10:00:00.000", kStart) + Log("10:00:00.001", "x seconds=1"),
          Log("10:00:00.000", kStart) +
              Log("10:00:00.001", "GPUImplHardware::checkBandwidthXY: seconds=1"),
          std::string("#\n# short\n"),
          Log("10:00:00.000", kStart) + Log("10:00:00.001", kEnd) + "clgpu[0].CLBandwidth=1\n"})
        EXPECT_EQ(GetBounds(log + value).size(),
                  log.find("CLBandwidth=") == std::string::npos ? 0U : 1U)
            << log;
    EXPECT_EQ(GetBounds(Log("10:00:00.000", kStart) + Log("10:00:00.001", kEnd) + "CLBandwidth=1\n")
                  .size(),
              0U);
}

} // namespace
} // namespace assay_host
