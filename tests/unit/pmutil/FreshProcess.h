// Runs checks in a new process, in which logging hasn't started and no debug value is resolved.
#pragma once

#include <cstdio>
#include <cstdlib>

#include <gtest/gtest.h>

namespace pmutil {

// Ends the process with a failure that names the condition.
inline void RequireSo(bool holds, const char* condition)
{
    if (holds)
        return;
    std::fprintf(stderr, "Not so: %s\n", condition);
    std::_Exit(1);
}
#define REQUIRE_SO(condition) ::pmutil::RequireSo((condition), #condition)

// Runs `checks` in a new process. Must be the first thing that the test does.
template <typename Checks>
void ExpectInFreshProcess(const Checks& checks)
{
    testing::GTEST_FLAG(death_test_style) = "threadsafe";
    EXPECT_EXIT((checks(), std::_Exit(0)), testing::ExitedWithCode(0), "^$");
}

} // namespace pmutil
