#include "all/gpu/ModuleList.h"

#include <cerrno>

#include <gtest/gtest.h>

namespace {

TEST(ModuleList, HasOnlyPaths)
{
    for (const std::string& path : pmutil::ListModules())
        EXPECT_EQ(path.front(), '/') << path;
}

TEST(LastError, IsKept)
{
    errno = ERANGE;
    {
        const pmutil::LastError kept;
        errno = EINVAL;
    }
    EXPECT_EQ(errno, ERANGE);
}

} // namespace
