#include <memory>
#include <optional>
#include <stdexcept>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/OGL.h"
#include "qgf/OGLPlatform.h"
#include "support/FakeOpenGL.h"

namespace {

using namespace QGF::OGL;
using assay_test::FakeOpenGL;
using testing::ElementsAre;
using testing::IsEmpty;

DisplayDeviceKey Key(int index)
{
    DisplayDeviceKey key;
    EXPECT_TRUE(Context::DisplayDevice(index, key));
    return key;
}

TEST(Devices, AreListedInThePlatformsOrder)
{
    const FakeOpenGL gl(3);
    EXPECT_EQ(Context::NumDisplayDevice(), 3);
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(Key(i).deviceName(), "fake" + std::to_string(i));
        EXPECT_EQ(Key(i).deviceString(), "Fake GPU " + std::to_string(i));
        EXPECT_EQ(Key(i).displayID(), "0000:0" + std::to_string(i) + ":00.0");
    }
}

TEST(Devices, FirstIsThePrimary)
{
    const FakeOpenGL gl(2);
    EXPECT_EQ(Context::PrimaryDisplayDevice().deviceName(), "fake0");
}

TEST(Devices, IndexOutOfRangeReturnsFalse)
{
    const FakeOpenGL gl(1);
    DisplayDeviceKey key("before", "", "");
    EXPECT_FALSE(Context::DisplayDevice(-1, key));
    EXPECT_FALSE(Context::DisplayDevice(1, key));
    EXPECT_EQ(key.deviceName(), "before");
}

TEST(Devices, NamelessDeviceCountsButHasNoKey)
{
    FakeOpenGL gl(2);
    gl.devices[0].key = DisplayDeviceKey();
    DisplayDeviceKey key;
    EXPECT_EQ(Context::NumDisplayDevice(), 2);
    EXPECT_FALSE(Context::DisplayDevice(0, key));
    EXPECT_TRUE(Context::DisplayDevice(1, key));
    EXPECT_EQ(Context::PrimaryDisplayDevice().deviceName(), "fake1");
}

TEST(Devices, AreListedByThePlatformOnce)
{
    const FakeOpenGL gl(1);
    Library::Initialize(Library::InitOptions());
    Library::Initialize(Library::InitOptions());
    Context::PrimaryDisplayDevice();
    EXPECT_EQ(Context::NumDisplayDevice(), 1);
    EXPECT_THAT(gl.calls, ElementsAre("displayDevices"));
}

TEST(Devices, InitializeThrowsWithoutOne)
{
    const FakeOpenGL gl(0);
    EXPECT_THROW(Library::Initialize(Library::InitOptions()), QGF::LogicalException);
    EXPECT_THROW(Context::PrimaryDisplayDevice(), QGF::LogicalException);
    EXPECT_EQ(Context::NumDisplayDevice(), 0);
}

TEST(Devices, FailedListingIsRetried)
{
    FakeOpenGL gl(1);
    gl.onDisplayDevices = [] { throw QGF::LogicalException("no binding"); };
    EXPECT_THROW(Library::Initialize(Library::InitOptions()), QGF::LogicalException);
    EXPECT_EQ(Context::NumDisplayDevice(), 0);
    DisplayDeviceKey key;
    EXPECT_FALSE(Context::DisplayDevice(0, key));
    gl.onDisplayDevices = nullptr;
    EXPECT_NO_THROW(Library::Initialize(Library::InitOptions()));
    EXPECT_EQ(Context::NumDisplayDevice(), 1);
}

TEST(ContextOffscreen, IsMadeOnItsDeviceAndNotMadeCurrent)
{
    const FakeOpenGL gl(2);
    const DisplayDeviceKey key = Key(1);
    {
        const ContextOffscreen context(key);
        EXPECT_EQ(gl.devices[1].contexts, 1);
        EXPECT_EQ(gl.current, nullptr);
        EXPECT_EQ(Context::Current(), nullptr);
    }
    EXPECT_THAT(gl.calls, ElementsAre("displayDevices", "create fake1", "destroy fake1"));
}

TEST(ContextOffscreen, UnknownKeyThrows)
{
    const FakeOpenGL gl(1);
    EXPECT_THROW(ContextOffscreen{DisplayDeviceKey{}}, QGF::LogicalException);
}

TEST(ContextOffscreen, ExceptionOfThePlatformPropagates)
{
    FakeOpenGL gl(1);
    const DisplayDeviceKey key = Key(0);
    gl.devices[0].onCreate = [] { throw QGF::LogicalException("no"); };
    EXPECT_THROW(ContextOffscreen{key}, QGF::LogicalException);
    gl.devices[0].onCreate = [] { throw std::runtime_error("no"); };
    EXPECT_THROW(ContextOffscreen{key}, std::runtime_error);
    gl.devices[0].onCreate = [] { throw 1; };
    EXPECT_THROW(ContextOffscreen{key}, int);
    EXPECT_EQ(gl.devices[0].contexts, 0);
}

class NullPlatform : public Platform {
public:
    std::vector<DisplayDeviceKey> displayDevices() override { return {{"null", "", ""}}; }
    std::unique_ptr<PlatformContext> createOffscreen(const DisplayDeviceKey&) override
    {
        return nullptr;
    }
};

TEST(ContextOffscreen, NullContextOfThePlatformThrows)
{
    ReplacePlatform(std::make_unique<NullPlatform>());
    try {
        const ContextOffscreen context(Context::PrimaryDisplayDevice());
        ADD_FAILURE() << "nothing was thrown";
    } catch (const QGF::LogicalException& failure) {
        EXPECT_STREQ(failure.what(), "The platform made no context on display device null");
    }
    ReplacePlatform(nullptr);
}

class TwoContexts : public testing::Test {
protected:
    FakeOpenGL gl{2};
    std::unique_ptr<ContextOffscreen> a = std::make_unique<ContextOffscreen>(Key(0));
    std::unique_ptr<ContextOffscreen> b = std::make_unique<ContextOffscreen>(Key(1));

    TwoContexts() { gl.calls.clear(); }
};

TEST_F(TwoContexts, MakeCurrentMakesCurrent)
{
    a->makeCurrent();
    EXPECT_EQ(Context::Current(), a.get());
    EXPECT_EQ(gl.current, &gl.devices[0]);
    b->makeCurrent();
    EXPECT_EQ(Context::Current(), b.get());
    b->makeCurrent();
    EXPECT_THAT(gl.calls, ElementsAre("makeCurrent fake0", "makeCurrent fake1"));
}

TEST_F(TwoContexts, FailedMakeCurrentKeepsThePreviousContext)
{
    a->makeCurrent();
    gl.devices[1].onMakeCurrent = [] { throw QGF::LogicalException("lost"); };
    EXPECT_THROW(b->makeCurrent(), QGF::LogicalException);
    EXPECT_EQ(Context::Current(), a.get());
}

TEST_F(TwoContexts, DestructorReleasesTheCurrentContext)
{
    a->makeCurrent();
    a.reset();
    EXPECT_EQ(Context::Current(), nullptr);
    EXPECT_THAT(gl.calls, ElementsAre("makeCurrent fake0", "release fake0", "destroy fake0"));
}

TEST_F(TwoContexts, DestructorOfANonCurrentContextReleasesNothing)
{
    a->makeCurrent();
    b.reset();
    EXPECT_EQ(Context::Current(), a.get());
    EXPECT_THAT(gl.calls, ElementsAre("makeCurrent fake0", "destroy fake1"));
}

TEST_F(TwoContexts, CurrentContextIsPerThread)
{
    a->makeCurrent();
    Context* elsewhere = a.get();
    std::thread([&] { elsewhere = Context::Current(); }).join();
    EXPECT_EQ(elsewhere, nullptr);
    EXPECT_EQ(Context::Current(), a.get());
}

TEST_F(TwoContexts, WrapperRestoresNone)
{
    {
        const ScopedContextWrapper scope(true);
        a->makeCurrent();
    }
    EXPECT_EQ(Context::Current(), nullptr);
    EXPECT_THAT(gl.calls, ElementsAre("makeCurrent fake0", "release fake0"));
}

TEST_F(TwoContexts, WrapperRestoresThePreviousContext)
{
    a->makeCurrent();
    {
        const ScopedContextWrapper scope(true);
        b->makeCurrent();
    }
    EXPECT_EQ(Context::Current(), a.get());
    EXPECT_EQ(gl.current, &gl.devices[0]);
}

TEST_F(TwoContexts, WrapperRestoresWhenAnExceptionLeavesTheScope)
{
    a->makeCurrent();
    EXPECT_THROW(
        {
            const ScopedContextWrapper scope(true);
            b->makeCurrent();
            throw std::runtime_error("test");
        },
        std::runtime_error);
    EXPECT_EQ(Context::Current(), a.get());
}

TEST_F(TwoContexts, WrapperWithoutRestoreChangesNothing)
{
    {
        const ScopedContextWrapper scope(false);
        a->makeCurrent();
    }
    EXPECT_EQ(Context::Current(), a.get());
}

TEST_F(TwoContexts, WrapperWithNothingToUndoCallsNothing)
{
    a->makeCurrent();
    gl.calls.clear();
    {
        const ScopedContextWrapper scope(true);
    }
    EXPECT_THAT(gl.calls, IsEmpty());
}

TEST_F(TwoContexts, WrapperRestoresNoneIfThePreviousContextIsDestroyed)
{
    a->makeCurrent();
    {
        const ScopedContextWrapper scope(true);
        a.reset();
        b->makeCurrent();
    }
    EXPECT_EQ(Context::Current(), nullptr);
    EXPECT_EQ(gl.current, nullptr);
}

TEST_F(TwoContexts, WrapperNeverThrows)
{
    a->makeCurrent();
    {
        const ScopedContextWrapper scope(true);
        b->makeCurrent();
        gl.devices[0].onMakeCurrent = [] { throw 1; };
    }
    EXPECT_EQ(Context::Current(), nullptr);
    EXPECT_EQ(gl.current, nullptr);
}

TEST_F(TwoContexts, NestedWrappersUndoInOrder)
{
    {
        const ScopedContextWrapper outer(true);
        a->makeCurrent();
        {
            const ScopedContextWrapper inner(true);
            b->makeCurrent();
        }
        EXPECT_EQ(Context::Current(), a.get());
    }
    EXPECT_EQ(Context::Current(), nullptr);
}

TEST_F(TwoContexts, EachHasItsOwnTableAndManager)
{
    a->makeCurrent();
    const OpenGLInterceptor* const tableOfA = &OpenGLInterceptor::Instance();
    const ExtensionManager* const managerOfA = ExtensionManager::Instance();
    EXPECT_EQ(tableOfA, &a->interceptor());
    EXPECT_EQ(managerOfA, &a->extensionManager());
    b->makeCurrent();
    EXPECT_NE(&OpenGLInterceptor::Instance(), tableOfA);
    EXPECT_NE(ExtensionManager::Instance(), managerOfA);
    a->makeCurrent();
    EXPECT_EQ(ExtensionManager::Instance(), managerOfA);
}

TEST_F(TwoContexts, TableExistsAfterTheFirstMakeCurrent)
{
    try {
        a->interceptor();
        ADD_FAILURE() << "nothing was thrown";
    } catch (const QGF::LogicalException& failure) {
        EXPECT_STREQ(failure.what(), "This OpenGL context has not been current yet");
    }
    EXPECT_THROW(a->extensionManager(), QGF::LogicalException);
    a->makeCurrent();
    EXPECT_NO_THROW(a->interceptor());
}

TEST(NoContext, HasNoTableAndNoManager)
{
    EXPECT_EQ(Context::Current(), nullptr);
    EXPECT_EQ(ExtensionManager::Instance(), nullptr);
    EXPECT_THROW(OpenGLInterceptor::Instance(), QGF::LogicalException);
}

} // namespace
