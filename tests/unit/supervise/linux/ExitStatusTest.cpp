#include "supervise/ExitStatus.h"

#include <limits>

#include <gtest/gtest.h>

namespace assay_host {
namespace {

TEST(GetReportedStatus, IsTheLowByte)
{
    EXPECT_EQ(GetReportedStatus(0), 0);
    EXPECT_EQ(GetReportedStatus(255), 255);
    EXPECT_EQ(GetReportedStatus(256), 0);
    EXPECT_EQ(GetReportedStatus(0x107), 7);
    EXPECT_EQ(GetReportedStatus(-1), 255);
    EXPECT_EQ(GetReportedStatus(std::numeric_limits<std::int32_t>::max()), 255);
    EXPECT_EQ(GetReportedStatus(std::numeric_limits<std::int32_t>::min()), 0);
}

} // namespace
} // namespace assay_host
