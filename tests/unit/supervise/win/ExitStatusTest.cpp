#include "supervise/ExitStatus.h"

#include <limits>

#include <gtest/gtest.h>

namespace assay_host {
namespace {

TEST(GetReportedStatus, IsTheWholeNumber)
{
    EXPECT_EQ(GetReportedStatus(0), 0);
    EXPECT_EQ(GetReportedStatus(255), 255);
    EXPECT_EQ(GetReportedStatus(256), 256);
    EXPECT_EQ(GetReportedStatus(-1), 0xFFFFFFFF);
    EXPECT_EQ(GetReportedStatus(std::numeric_limits<std::int32_t>::max()), 0x7FFFFFFF);
    EXPECT_EQ(GetReportedStatus(std::numeric_limits<std::int32_t>::min()), 0x80000000);
}

} // namespace
} // namespace assay_host
