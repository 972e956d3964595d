#include <cstdint>
#include <functional>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/OGL.h"
#include "support/FakeOpenGL.h"

namespace {

using namespace QGF::OGL;

struct CallCase {
    const char* name;
    std::function<void(const OpenGLInterceptor&)> call;
    const char* recorded; // the call as the fake driver records it
};

std::int32_t gInteger = 0;
std::uint32_t gID = 7;
char gText[8];

const std::vector<CallCase> kCalls = {
    {"glGetString", [](auto& gl) { gl.glGetString("f.cpp", 12, 0x1F00); }, "glGetString(0x1F00)"},
    {"glGetError", [](auto& gl) { gl.glGetError("f.cpp", 12); }, "glGetError()"},
    {"glGetIntegerv", [](auto& gl) { gl.glGetIntegerv("f.cpp", 12, 0x84F8, &gInteger); },
     "glGetIntegerv(0x84F8)"},
    {"glGetProgramivARB",
     [](auto& gl) { gl.glGetProgramivARB("f.cpp", 12, 0x8620, 0x88B4, &gInteger); },
     "glGetProgramivARB(0x8620,0x88B4)"},
    {"glClearColor", [](auto& gl) { gl.glClearColor("f.cpp", 12, 1, 2, 3, 255); },
     "glClearColor(1,2,3,255)"},
    {"glClear", [](auto& gl) { gl.glClear("f.cpp", 12, 0x4000); }, "glClear(0x4000)"},
    {"glCreateShader", [](auto& gl) { gl.glCreateShader("f.cpp", 12, 0x8B31); },
     "glCreateShader(0x8B31)"},
    {"glShaderSource", [](auto& gl) { gl.glShaderSource("f.cpp", 12, 3, 0, nullptr, nullptr); },
     "glShaderSource(3,0)"},
    {"glCompileShader", [](auto& gl) { gl.glCompileShader("f.cpp", 12, 3); }, "glCompileShader(3)"},
    {"glGetShaderiv", [](auto& gl) { gl.glGetShaderiv("f.cpp", 12, 3, 0x8B81, &gInteger); },
     "glGetShaderiv(3,0x8B81)"},
    {"glGetShaderInfoLog",
     [](auto& gl) { gl.glGetShaderInfoLog("f.cpp", 12, 3, 8, &gInteger, gText); },
     "glGetShaderInfoLog(3,8)"},
    {"glDeleteShader", [](auto& gl) { gl.glDeleteShader("f.cpp", 12, 3); }, "glDeleteShader(3)"},
    {"glCreateProgram", [](auto& gl) { gl.glCreateProgram("f.cpp", 12); }, "glCreateProgram()"},
    {"glAttachShader", [](auto& gl) { gl.glAttachShader("f.cpp", 12, 4, 3); },
     "glAttachShader(4,3)"},
    {"glLinkProgram", [](auto& gl) { gl.glLinkProgram("f.cpp", 12, 4); }, "glLinkProgram(4)"},
    {"glGetProgramiv", [](auto& gl) { gl.glGetProgramiv("f.cpp", 12, 4, 0x8B82, &gInteger); },
     "glGetProgramiv(4,0x8B82)"},
    {"glGetProgramInfoLog",
     [](auto& gl) { gl.glGetProgramInfoLog("f.cpp", 12, 4, 8, &gInteger, gText); },
     "glGetProgramInfoLog(4,8)"},
    {"glDeleteProgram", [](auto& gl) { gl.glDeleteProgram("f.cpp", 12, 4); }, "glDeleteProgram(4)"},
    {"glGenTextures", [](auto& gl) { gl.glGenTextures("f.cpp", 12, 1, &gID); }, "glGenTextures(1)"},
    {"glBindTexture", [](auto& gl) { gl.glBindTexture("f.cpp", 12, 0xDE1, 5); },
     "glBindTexture(0xDE1,5)"},
    {"glTexParameteri", [](auto& gl) { gl.glTexParameteri("f.cpp", 12, 0xDE1, 0x2801, 0x2601); },
     "glTexParameteri(0xDE1,0x2801,0x2601)"},
    {"glTexImage2D",
     [](auto& gl) {
         gl.glTexImage2D("f.cpp", 12, 0xDE1, 1, 0x8058, 2, 3, 4, 0x1908, 0x1401, nullptr);
     },
     "glTexImage2D(0xDE1,1,0x8058,2,3,4,0x1908,0x1401)"},
    {"glGenerateMipmap", [](auto& gl) { gl.glGenerateMipmap("f.cpp", 12, 0xDE1); },
     "glGenerateMipmap(0xDE1)"},
    {"glDeleteTextures", [](auto& gl) { gl.glDeleteTextures("f.cpp", 12, 1, &gID); },
     "glDeleteTextures(1,9)"},
    {"glGenFramebuffers", [](auto& gl) { gl.glGenFramebuffers("f.cpp", 12, 1, &gID); },
     "glGenFramebuffers(1)"},
    {"glBindFramebuffer", [](auto& gl) { gl.glBindFramebuffer("f.cpp", 12, 0x8D40, 6); },
     "glBindFramebuffer(0x8D40,6)"},
    {"glFramebufferTexture2D",
     [](auto& gl) { gl.glFramebufferTexture2D("f.cpp", 12, 0x8D40, 0x8CE0, 0xDE1, 5, 1); },
     "glFramebufferTexture2D(0x8D40,0x8CE0,0xDE1,5,1)"},
    {"glCheckFramebufferStatus", [](auto& gl) { gl.glCheckFramebufferStatus("f.cpp", 12, 0x8D40); },
     "glCheckFramebufferStatus(0x8D40)"},
    {"glDeleteFramebuffers", [](auto& gl) { gl.glDeleteFramebuffers("f.cpp", 12, 1, &gID); },
     "glDeleteFramebuffers(1,9)"},
};

class InterceptorCall : public testing::TestWithParam<CallCase> {};

TEST_P(InterceptorCall, ReachesTheDriverWithItsArguments)
{
    const assay_test::FakeOpenGL gl;
    ContextOffscreen context(Context::PrimaryDisplayDevice());
    context.makeCurrent();
    gID = 9;
    GetParam().call(OpenGLInterceptor::Instance());
    EXPECT_EQ(gl.calls.back(), GetParam().recorded);
}

TEST_P(InterceptorCall, MissingEntryPointThrowsItsNameAndTheCaller)
{
    assay_test::FakeOpenGL gl;
    gl.devices[0].missing = {GetParam().name};
    ContextOffscreen context(Context::PrimaryDisplayDevice());
    context.makeCurrent();
    try {
        GetParam().call(OpenGLInterceptor::Instance());
        FAIL() << "called";
    } catch (const QGF::LogicalException& exception) {
        EXPECT_EQ(exception.what(),
                  std::string(GetParam().name) +
                      " is not offered by this OpenGL driver (called from f.cpp:12)");
    }
}

INSTANTIATE_TEST_SUITE_P(All, InterceptorCall, testing::ValuesIn(kCalls),
                         [](const testing::TestParamInfo<CallCase>& test) {
                             return std::string(test.param.name);
                         });

TEST(OpenGLInterceptor, ResultsAreReturned)
{
    assay_test::FakeOpenGL gl;
    gl.devices[0].errors = {1282};
    ContextOffscreen context(Context::PrimaryDisplayDevice());
    context.makeCurrent();
    const OpenGLInterceptor& table = OpenGLInterceptor::Instance();
    EXPECT_STREQ(reinterpret_cast<const char*>(table.glGetString("", 0, 0x1F00)), "Fake Vendor");
    EXPECT_EQ(table.glGetError("", 0), 1282U);
    std::int32_t size = 0;
    table.glGetIntegerv("", 0, 0x84F8, &size);
    EXPECT_EQ(size, 16384);
}

TEST(OpenGLInterceptor, MissingIndexedStringsAreNull)
{
    const OpenGLInterceptor table([](void*, const char*) -> QGF::Core::Proc { return nullptr; },
                                  nullptr);
    EXPECT_EQ(table.glGetStringi("", 0, 0x1F03, 0), nullptr);
}

TEST(OpenGLInterceptor, NullFileNameIsAccepted)
{
    const OpenGLInterceptor table([](void*, const char*) -> QGF::Core::Proc { return nullptr; },
                                  nullptr);
    EXPECT_THROW(table.glClear(nullptr, 0, 0), QGF::LogicalException);
}

void GenerateMipmapEXT(std::uint32_t target)
{
    gID = target;
}

TEST(OpenGLInterceptor, MissingCoreFunctionFallsBackToTheExtension)
{
    static std::set<std::string> requested;
    requested.clear();
    const OpenGLInterceptor table(
        [](void*, const char* name) -> QGF::Core::Proc {
            requested.insert(name);
            return std::string(name) == "glGenerateMipmapEXT"
                       ? reinterpret_cast<QGF::Core::Proc>(GenerateMipmapEXT)
                       : nullptr;
        },
        nullptr);
    table.glGenerateMipmap("", 0, 77);
    EXPECT_EQ(gID, 77U);
    for (const char* const name :
         {"glGenerateMipmapEXT", "glGenFramebuffersEXT", "glBindFramebufferEXT",
          "glFramebufferTexture2DEXT", "glCheckFramebufferStatusEXT", "glDeleteFramebuffersEXT"})
        EXPECT_EQ(requested.count(name), 1U) << name;
}

} // namespace
