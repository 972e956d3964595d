#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/Core.h"

namespace {

using testing::HasSubstr;

TEST(Exceptions, MessageAndWhatAreEqual)
{
    const QGF::LogicalException exception("no such thing");
    EXPECT_STREQ(exception.what(), "no such thing");
    EXPECT_STREQ(exception.message(), "no such thing");
}

TEST(Exceptions, LogicalAndInternalShareABase)
{
    EXPECT_THROW(throw QGF::LogicalException(""), QGF::ExceptionBase);
    EXPECT_THROW(throw QGF::InternalException("f", 1, "t"), QGF::ExceptionBase);
    EXPECT_THROW(throw QGF::LogicalException(""), std::exception);
}

TEST(Exceptions, InternalExceptionHasFileAndLine)
{
    const QGF::InternalException exception("some/file", 122, "a == b");
    EXPECT_STREQ(exception.what(), "some/file(122): a == b");
    EXPECT_STREQ(exception.message(), "some/file(122): a == b");
    EXPECT_STREQ(exception.file(), "some/file");
    EXPECT_EQ(exception.line(), 122);
    EXPECT_STREQ(exception.text(), "a == b");
}

int gChecks = 0;
bool gCheckFails = false;

void CountingCheck()
{
    ++gChecks;
    if (gCheckFails)
        throw QGF::LogicalException("no loader");
}

class CoreLibrary : public testing::Test {
public:
    CoreLibrary()
    {
        gChecks = 0;
        gCheckFails = false;
        QGF::Core::ReplaceLoaderCheck(CountingCheck);
    }
    ~CoreLibrary() override { QGF::Core::ReplaceLoaderCheck(nullptr); }
    CoreLibrary(const CoreLibrary&) = delete;
    CoreLibrary& operator=(const CoreLibrary&) = delete;
};

TEST_F(CoreLibrary, InitializeChecksOnce)
{
    QGF::Core::Library::Initialize();
    QGF::Core::Library::Initialize();
    EXPECT_EQ(gChecks, 1);
}

TEST_F(CoreLibrary, FailedInitializeIsRetried)
{
    gCheckFails = true;
    EXPECT_THROW(QGF::Core::Library::Initialize(), QGF::LogicalException);
    EXPECT_THROW(QGF::Core::Library::Initialize(), QGF::LogicalException);
    gCheckFails = false;
    EXPECT_NO_THROW(QGF::Core::Library::Initialize());
    EXPECT_EQ(gChecks, 3);
}

TEST_F(CoreLibrary, NativeCheckSucceeds)
{
    QGF::Core::ReplaceLoaderCheck(nullptr);
    EXPECT_NO_THROW(QGF::Core::Library::Initialize());
    EXPECT_EQ(gChecks, 0);
}

TEST(OpenLibrary, FailureNamesEveryLibrary)
{
    const char* const names[] = {"no-such-library-a", "no-such-library-b", nullptr};
    try {
        QGF::Core::OpenLibrary(names);
        FAIL() << "opened";
    } catch (const QGF::LogicalException& exception) {
        EXPECT_THAT(exception.what(), HasSubstr("no-such-library-a can't be opened ("));
        EXPECT_THAT(exception.what(), HasSubstr("; no-such-library-b can't be opened ("));
    }
}

TEST(OpenLibrary, EmptyListThrows)
{
    const char* const names[] = {nullptr};
    EXPECT_THROW(QGF::Core::OpenLibrary(names), QGF::LogicalException);
}

} // namespace
