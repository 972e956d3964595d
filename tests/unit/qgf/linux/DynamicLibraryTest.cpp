#include <gtest/gtest.h>

#include "qgf/Core.h"

namespace {

TEST(OpenLibrary, OpensTheFirstThatExists)
{
    const char* const names[] = {"no-such-library.so", "libm.so.6", nullptr};
    const auto library = QGF::Core::OpenLibrary(names);
    ASSERT_NE(library, nullptr);
    const auto function = reinterpret_cast<double (*)(double)>(library->getProc("floor"));
    ASSERT_NE(function, nullptr);
    EXPECT_EQ(function(1.5), 1.0);
    EXPECT_EQ(library->getProc("no_such_function"), nullptr);
}

} // namespace
