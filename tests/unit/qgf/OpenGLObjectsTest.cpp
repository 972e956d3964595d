#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/OGL.h"
#include "support/FakeOpenGL.h"

namespace {

using namespace QGF::OGL;
using assay_test::FakeOpenGL;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::SizeIs;

const char* const kSource[] = {"one", "", "two "};

// The text of the LogicalException that `action` throws.
std::string FailureOf(const std::function<void()>& action)
{
    try {
        action();
    } catch (const QGF::LogicalException& exception) {
        return exception.message();
    }
    return "no failure";
}

class OpenGLObjects : public testing::Test {
protected:
    OpenGLObjects() : context(Context::PrimaryDisplayDevice())
    {
        context.makeCurrent();
        gl.calls.clear();
    }

    assay_test::FakeDevice& device() { return gl.devices[0]; }

    static std::string compileFailure()
    {
        return FailureOf([] {
            Program program;
            program.loadFragmentShader(3, kSource, nullptr);
        });
    }

    FakeOpenGL gl;
    ContextOffscreen context;
};

TEST_F(OpenGLObjects, ProgramCompilesAttachesAndLinks)
{
    {
        Program program;
        program.loadVertexShader(3, kSource, nullptr);
        EXPECT_THAT(device().shaderSource, ElementsAre("one", "", "two "));
        program.loadFragmentShader(3, kSource, nullptr);
        program.link(true);
    }
    EXPECT_THAT(gl.calls,
                ElementsAre("glCreateProgram()", "glCreateShader(0x8B31)", "glShaderSource(2,3)",
                            "glCompileShader(2)", "glGetShaderiv(2,0x8B81)", "glAttachShader(1,2)",
                            "glDeleteShader(2)", "glCreateShader(0x8B30)", "glShaderSource(3,3)",
                            "glCompileShader(3)", "glGetShaderiv(3,0x8B81)", "glAttachShader(1,3)",
                            "glDeleteShader(3)", "glLinkProgram(1)", "glGetProgramiv(1,0x8B82)",
                            "glDeleteProgram(1)"));
    EXPECT_EQ(device().objects, 0);
}

TEST_F(OpenGLObjects, LengthsAreUsed)
{
    const std::int32_t lengths[] = {2, 0, -1};
    Program program;
    program.loadVertexShader(3, kSource, lengths);
    EXPECT_THAT(device().shaderSource, ElementsAre("on", "", "two "));
}

TEST_F(OpenGLObjects, VertexShaderFailureHasTheLog)
{
    device().vertexCompiles = false;
    device().log = "0:1: error\n0:2: error\n";
    EXPECT_EQ(FailureOf([] { Program().loadVertexShader(3, kSource, nullptr); }),
              "The vertex shader doesn't compile: 0:1: error | 0:2: error");
    EXPECT_EQ(device().objects, 0);
}

TEST_F(OpenGLObjects, FragmentShaderFailureHasTheLog)
{
    device().fragmentCompiles = false;
    EXPECT_EQ(compileFailure(), "The fragment shader doesn't compile: fake log");
    EXPECT_EQ(device().objects, 0);
    EXPECT_THAT(gl.callsOf("glAttachShader"), SizeIs(0));
}

TEST_F(OpenGLObjects, LinkFailureHasTheLog)
{
    device().links = false;
    EXPECT_EQ(FailureOf([] {
                  Program program;
                  program.loadVertexShader(3, kSource, nullptr);
                  program.loadFragmentShader(3, kSource, nullptr);
                  program.link(true);
              }),
              "The program doesn't link: fake log");
    EXPECT_EQ(device().objects, 0);
}

TEST_F(OpenGLObjects, IncompleteProgramThrowsWithoutADriverCall)
{
    EXPECT_EQ(FailureOf([] { Program().link(true); }), "The program has no vertex shader to link");
    EXPECT_EQ(FailureOf([] {
                  Program program;
                  program.loadVertexShader(3, kSource, nullptr);
                  program.link(true);
              }),
              "The program has no fragment shader to link");
    EXPECT_THAT(gl.callsOf("glLinkProgram"), SizeIs(0));
    EXPECT_EQ(FailureOf([] { Program().link(false); }), "no failure");
    EXPECT_THAT(gl.callsOf("glLinkProgram"), SizeIs(1));
}

TEST_F(OpenGLObjects, EmptyOrInvalidLogIsReportedAsNone)
{
    device().fragmentCompiles = false;
    const std::string none = "The fragment shader doesn't compile: the driver returns no log";
    for (const std::int32_t length : {0, 1, -1, -2147483647}) {
        device().logLength = length;
        EXPECT_EQ(compileFailure(), none) << length;
    }
    EXPECT_THAT(gl.callsOf("glGetShaderInfoLog"), SizeIs(0));
    device().logLength.reset();
    device().log = " \r\n";
    EXPECT_EQ(compileFailure(), none);
    device().log = "";
    device().logLength = 100;
    EXPECT_EQ(compileFailure(), none);
}

TEST_F(OpenGLObjects, ALogIsOneLine)
{
    const std::pair<const char*, const char*> rows[] = {
        {"x", "x"},          {"one\r\ntwo", "one | two"}, {"one\n\n\rtwo\r", "one | two"},
        {"\none", " | one"}, {" one \n\t", " one"},       {"one\ttwo", "one\ttwo"}};
    device().fragmentCompiles = false;
    for (const auto& [log, text] : rows) {
        device().log = log;
        EXPECT_EQ(compileFailure(), std::string("The fragment shader doesn't compile: ") + text);
    }
}

// The file is a part of the text for a driver that lacks a function.
TEST_F(OpenGLObjects, FailuresNameTheirSourceFile)
{
    const struct {
        const char* file;
        const char* function;
        std::function<void()> action;
    } rows[] = {
        {"Program", "glLinkProgram", [] { Program().link(false); }},
        {"Texture2D", "glTexImage2D",
         [] { Texture2D(InternalFormat::RGBA8, 1, 1, false, nullptr, Type::Default); }},
        {"Framebuffer", "glGenFramebuffers", [] { Framebuffer(); }},
        {"ExtensionManager", "glGetString", [] { ExtensionManager::Instance(); }},
    };
    for (const auto& row : rows) {
        FakeOpenGL driver;
        driver.devices[0].missing = {row.function};
        ContextOffscreen other(Context::PrimaryDisplayDevice());
        other.makeCurrent();
        EXPECT_THAT(FailureOf(row.action),
                    testing::StartsWith(std::string(row.function) +
                                        " is not offered by this OpenGL driver (called from "
                                        "qgf/source/qgf/qgf_ogl/" +
                                        row.file + ":"));
    }
}

TEST_F(OpenGLObjects, HugeLogIsTruncated)
{
    device().fragmentCompiles = false;
    device().logLength = 2147483647;
    EXPECT_EQ(compileFailure(), "The fragment shader doesn't compile: fake log");
    EXPECT_THAT(gl.callsOf("glGetShaderInfoLog("), ElementsAre(HasSubstr(",65536)")));

    device().log = std::string(1000000, 'x');
    device().logLength.reset();
    EXPECT_LT(compileFailure().size(), 66000U);
    EXPECT_GT(compileFailure().size(), 65000U);
}

TEST_F(OpenGLObjects, ObjectsThatAreNotCreatedThrow)
{
    Program program;
    Texture2D texture(InternalFormat::RGBA8, 1, 1, false, nullptr, Type::Default);
    device().makesObjects = false;
    EXPECT_EQ(FailureOf([] { Program(); }), "glCreateProgram returned no program");
    EXPECT_EQ(FailureOf([&] { program.loadVertexShader(3, kSource, nullptr); }),
              "glCreateShader returned no vertex shader");
    EXPECT_EQ(
        FailureOf([] { Texture2D(InternalFormat::RGBA8, 1, 1, false, nullptr, Type::Default); }),
        "glGenTextures returned no texture");
    EXPECT_EQ(FailureOf([] { Framebuffer(); }), "glGenFramebuffers returned no framebuffer");
}

TEST_F(OpenGLObjects, TextureHasOneLevel)
{
    {
        const Texture2D texture(InternalFormat::RGBA8, 32, 16, false, nullptr, Type::Default);
        EXPECT_EQ(texture.id(), 1U);
    }
    EXPECT_THAT(gl.calls, ElementsAre("glGenTextures(1)", "glBindTexture(0xDE1,1)",
                                      "glTexParameteri(0xDE1,0x2801,0x2601)",
                                      "glTexImage2D(0xDE1,0,0x8058,32,16,0,0x1908,0x1401)",
                                      "glBindTexture(0xDE1,0)", "glDeleteTextures(1,1)"));
}

TEST_F(OpenGLObjects, MipmapsAreGeneratedOnDemand)
{
    const Texture2D texture(InternalFormat::RGBA8, 32, 32, true, nullptr, Type::Default);
    EXPECT_THAT(gl.callsOf("glGenerateMipmap"), ElementsAre("glGenerateMipmap(0xDE1)"));
    EXPECT_THAT(gl.callsOf("glTexParameteri"), ElementsAre("glTexParameteri(0xDE1,0x2801,0x2703)"));
}

TEST_F(OpenGLObjects, InvalidTextureArgumentsThrow)
{
    EXPECT_EQ(FailureOf([] {
                  Texture2D(static_cast<InternalFormat>(35), 1, 1, false, nullptr, Type::Default);
              }),
              "Unknown texture format 35");
    EXPECT_EQ(FailureOf([] {
                  Texture2D(InternalFormat::RGBA8, 1, 1, false, nullptr, static_cast<Type>(0));
              }),
              "Unknown texture data type 0");
    EXPECT_EQ(
        FailureOf([] { Texture2D(InternalFormat::RGBA8, 0, 4, false, nullptr, Type::Default); }),
        "Bad texture size 0 x 4");
    EXPECT_EQ(
        FailureOf([] { Texture2D(InternalFormat::RGBA8, 4, 0, false, nullptr, Type::Default); }),
        "Bad texture size 4 x 0");
    EXPECT_EQ(
        FailureOf([] { Texture2D(InternalFormat::RGBA8, 4, -1, false, nullptr, Type::Default); }),
        "Bad texture size 4 x -1");
    EXPECT_EQ(device().objects, 0);
}

TEST_F(OpenGLObjects, FailedTextureIsDeleted)
{
    device().onCall["glTexImage2D"] = [] { throw QGF::LogicalException("stop"); };
    EXPECT_EQ(
        FailureOf([] { Texture2D(InternalFormat::RGBA8, 4, 4, false, nullptr, Type::Default); }),
        "stop");
    EXPECT_EQ(device().objects, 0);
}

TEST_F(OpenGLObjects, FramebufferBindsAttachesAndUnbinds)
{
    {
        const Texture2D texture(InternalFormat::RGBA8, 32, 32, false, nullptr, Type::Default);
        gl.calls.clear();
        Framebuffer framebuffer;
        framebuffer.bind();
        framebuffer.attach(texture, 0, 0);
        framebuffer.attach(texture, 2, 1);
        framebuffer.unbind();
    }
    EXPECT_THAT(gl.calls,
                ElementsAre("glGenFramebuffers(1)", "glBindFramebuffer(0x8D40,2)",
                            "glFramebufferTexture2D(0x8D40,0x8CE0,0xDE1,1,0)",
                            "glCheckFramebufferStatus(0x8D40)",
                            "glFramebufferTexture2D(0x8D40,0x8CE2,0xDE1,1,1)",
                            "glCheckFramebufferStatus(0x8D40)", "glBindFramebuffer(0x8D40,0)",
                            "glDeleteFramebuffers(1,2)", "glDeleteTextures(1,1)"));
    EXPECT_EQ(device().objects, 0);
}

TEST_F(OpenGLObjects, IncompleteFramebufferIsNamed)
{
    const Texture2D texture(InternalFormat::RGBA8, 32, 32, false, nullptr, Type::Default);
    Framebuffer framebuffer;
    framebuffer.bind();
    device().framebufferStatus = 0x8CDD;
    EXPECT_EQ(FailureOf([&] { framebuffer.attach(texture, 0, 0); }),
              "The framebuffer is not complete: GL_FRAMEBUFFER_UNSUPPORTED");
    device().framebufferStatus = 0;
    EXPECT_EQ(FailureOf([&] { framebuffer.attach(texture, 0, 0); }),
              "The framebuffer is not complete: 0x0000");
}

TEST_F(OpenGLObjects, EachStatusOfAFramebufferHasItsName)
{
    const Texture2D texture(InternalFormat::RGBA8, 32, 32, false, nullptr, Type::Default);
    Framebuffer framebuffer;
    const std::pair<std::uint32_t, const char*> rows[] = {
        {0x8218, "0x8218"},
        {0x8219, "GL_FRAMEBUFFER_UNDEFINED"},
        {0x8CD6, "GL_FRAMEBUFFER_INCOMPLETE_ATTACHMENT"},
        {0x8CD7, "GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT"},
        {0x8CD8, "0x8CD8"},
        {0x8CD9, "GL_FRAMEBUFFER_INCOMPLETE_DIMENSIONS"},
        {0x8CDA, "GL_FRAMEBUFFER_INCOMPLETE_FORMATS"},
        {0x8CDB, "GL_FRAMEBUFFER_INCOMPLETE_DRAW_BUFFER"},
        {0x8CDC, "GL_FRAMEBUFFER_INCOMPLETE_READ_BUFFER"},
        {0x8CDD, "GL_FRAMEBUFFER_UNSUPPORTED"},
        {0x8D56, "GL_FRAMEBUFFER_INCOMPLETE_MULTISAMPLE"},
        {0xFFFFFFFF, "0xFFFFFFFF"},
    };
    for (const auto& [status, name] : rows) {
        device().framebufferStatus = status;
        EXPECT_EQ(FailureOf([&] { framebuffer.attach(texture, 0, 0); }),
                  std::string("The framebuffer is not complete: ") + name);
    }
}

TEST_F(OpenGLObjects, ErrorOfATextureIsReportedByTheFramebuffer)
{
    device().onCall["glTexImage2D"] = [this] {
        device().errors = {0x505};
        device().framebufferStatus = 0x8CD6;
    };
    const Texture2D texture(InternalFormat::RGBA8, 32, 32, false, nullptr, Type::Default);
    EXPECT_THAT(gl.callsOf("glGetError"), SizeIs(0));
    Framebuffer framebuffer;
    framebuffer.bind();
    EXPECT_EQ(FailureOf([&] { framebuffer.attach(texture, 0, 0); }),
              "The framebuffer is not complete: GL_FRAMEBUFFER_INCOMPLETE_ATTACHMENT, "
              "after OpenGL error 0x0505");
    EXPECT_THAT(gl.callsOf("glGetError"), SizeIs(1));
    EXPECT_THAT(device().errors, SizeIs(0));
}

TEST_F(OpenGLObjects, InvalidAttachmentsThrow)
{
    const Texture2D texture(InternalFormat::RGBA8, 32, 32, false, nullptr, Type::Default);
    Framebuffer framebuffer;
    EXPECT_NO_THROW(framebuffer.attach(texture, 31, 0x7FFFFFFF));
    EXPECT_THAT(gl.callsOf("glFramebufferTexture2D"),
                ElementsAre("glFramebufferTexture2D(0x8D40,0x8CFF,0xDE1,1,2147483647)"));
    gl.calls.clear();
    EXPECT_EQ(FailureOf([&] { framebuffer.attach(texture, 32, 0); }),
              "There is no colour attachment 32");
    EXPECT_EQ(FailureOf([&] { framebuffer.attach(texture, 0, 0x80000000U); }),
              "There is no texture level 2147483648");
    EXPECT_THAT(gl.calls, SizeIs(0));
}

TEST_F(OpenGLObjects, DestructorsNeverThrow)
{
    device().onCall["glDeleteProgram"] = [] { throw 1; };
    device().onCall["glDeleteShader"] = [] { throw 1; };
    device().onCall["glDeleteTextures"] = [] { throw 1; };
    device().onCall["glDeleteFramebuffers"] = [] { throw 1; };
    EXPECT_NO_THROW({
        Program program;
        program.loadVertexShader(3, kSource, nullptr);
        const Texture2D texture(InternalFormat::RGBA8, 1, 1, false, nullptr, Type::Default);
        const Framebuffer framebuffer;
    });
}

TEST(OpenGLObjectsWithoutContext, CannotBeCreated)
{
    EXPECT_EQ(FailureOf([] { Program(); }), "No OpenGL context is current on this thread");
    EXPECT_EQ(FailureOf([] { Framebuffer(); }), "No OpenGL context is current on this thread");
    EXPECT_EQ(
        FailureOf([] { Texture2D(InternalFormat::RGBA8, 1, 1, false, nullptr, Type::Default); }),
        "No OpenGL context is current on this thread");
}

} // namespace
