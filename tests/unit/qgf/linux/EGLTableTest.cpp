#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/qgf_ogl/linux/EGLTable.h"
#include "support/RecordedCalls.h"

namespace {

using namespace QGF::OGL;
using assay_test::RecordedCalls;
using testing::Each;
using testing::ElementsAre;

void Nothing() {}

EGLint GetError()
{
    return EGL_BAD_ACCESS;
}

// Has no function of an extension.
QGF::Core::Proc GetExtension(const char*)
{
    return nullptr;
}

QGF::Core::Proc GetCore(void*, const char* name)
{
    const std::string text = name;
    if (text == "eglGetProcAddress")
        return reinterpret_cast<QGF::Core::Proc>(GetExtension);
    return text == "eglGetError" ? reinterpret_cast<QGF::Core::Proc>(GetError) : Nothing;
}

// libglvnd loads the drivers when it looks a function up.
TEST(EGLTable, ObservesTheLookUpOfExtensions)
{
    RecordedCalls calls;
    EGLTable table;
    FillEGLTable(table, GetCore, nullptr);
    EXPECT_EQ(calls.Get().size(), 2U * 3U);
    EXPECT_THAT(calls.Get(), Each(testing::EndsWith(" OpenGL")));
}

TEST(EGLTable, ObservesItsCalls)
{
    EGLTable table;
    FillEGLTable(table, GetCore, nullptr);
    ObserveCalls(table);
    EXPECT_EQ(table.eglGetPlatformDisplayEXT, nullptr);
    RecordedCalls calls;
    EXPECT_EQ(table.eglGetError(), EGL_BAD_ACCESS);
    EXPECT_THAT(calls.Get(), ElementsAre("before OpenGL", "after OpenGL"));
}

} // namespace
