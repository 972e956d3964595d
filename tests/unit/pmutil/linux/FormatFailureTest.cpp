#include <gtest/gtest.h>

#include "pmutil/Format.h"

namespace pmutil {
namespace {

// A character that no locale can encode. The C library of Windows omits it.
TEST(FormatFailureTest, GivesAnEmptyText)
{
    const wchar_t bad[] = {0xDC00, 0};
    EXPECT_EQ(FormatString("text %ls", bad), "");
}

} // namespace
} // namespace pmutil
