#include <gtest/gtest.h>

#include <string>

#include <dlfcn.h>

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

std::string FailToOpen(const char* const* names)
{
    try {
        QGF::Core::OpenLibrary(names);
    } catch (const QGF::LogicalException& failure) {
        return failure.what();
    }
    return {};
}

TEST(OpenLibrary, NamesEachThatCannotBeOpened)
{
    const char* const none[] = {nullptr};
    EXPECT_EQ(FailToOpen(none), "No library was named");
    const char* const names[] = {"no-such-1.so", "no-such-2.so", nullptr};
    const std::string reason = ": cannot open shared object file: No such file or directory)";
    EXPECT_EQ(FailToOpen(names), "no-such-1.so can't be opened (no-such-1.so" + reason +
                                     "; no-such-2.so can't be opened (no-such-2.so" + reason);
}

TEST(OpenLibrary, ClosesItAtTheEnd)
{
    const char* const names[] = {"libanl.so.1", nullptr};
    const auto isLoaded = [&] {
        void* const handle = dlopen(names[0], RTLD_LAZY | RTLD_NOLOAD);
        if (handle != nullptr)
            dlclose(handle);
        return handle != nullptr;
    };
    if (isLoaded())
        GTEST_SKIP() << "the test program has it already";
    void* const first = dlopen(names[0], RTLD_LAZY);
    if (first == nullptr)
        GTEST_SKIP() << "this C library comes without it";
    dlclose(first);
    {
        const auto library = QGF::Core::OpenLibrary(names);
        EXPECT_TRUE(isLoaded());
    }
    EXPECT_FALSE(isLoaded());
}

} // namespace
