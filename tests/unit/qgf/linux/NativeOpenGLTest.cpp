// The library on the machine's own OpenGL. Skipped if there is none.
#include <algorithm>
#include <memory>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/OGL.h"

namespace {

using namespace QGF::OGL;

class NativeOpenGL : public testing::Test {
protected:
    void SetUp() override
    {
        try {
            Library::Initialize(Library::InitOptions());
            fContext = std::make_unique<ContextOffscreen>(Context::PrimaryDisplayDevice());
        } catch (const QGF::LogicalException& exception) {
            GTEST_SKIP() << "This machine has no usable OpenGL: " << exception.message();
        }
        fContext->makeCurrent();
    }

    std::unique_ptr<ContextOffscreen> fContext;
};

TEST_F(NativeOpenGL, EveryDeviceHasAName)
{
    ASSERT_GT(Context::NumDisplayDevice(), 0);
    for (int i = 0; i < Context::NumDisplayDevice(); ++i) {
        DisplayDeviceKey key;
        ASSERT_TRUE(Context::DisplayDevice(i, key));
        EXPECT_NE(key.deviceName(), "");
        EXPECT_NE(key.deviceString(), "");
    }
}

TEST_F(NativeOpenGL, QueriesOfAContextLeaveNoError)
{
    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    EXPECT_NE(gl.glGetString("", 0, 0x1F01), nullptr);
    ASSERT_NE(ExtensionManager::Instance(), nullptr);
    EXPECT_TRUE(ExtensionManager::Instance()->isSupported(GL_VERSION_1_2));
    EXPECT_EQ(gl.glGetError("", 0), 0U);
}

TEST_F(NativeOpenGL, ExtensionQueriesKeepTheCallersError)
{
    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    std::int32_t value = 0;
    gl.glGetIntegerv("", 0, 0xFFFF, &value);
    ExtensionManager::Instance()->isSupported(GL_VERSION_4_1);
    EXPECT_EQ(gl.glGetError("", 0), 0x0500U);
    EXPECT_EQ(gl.glGetError("", 0), 0U);
}

TEST_F(NativeOpenGL, FixedFunctionShaderCompilesAndLinks)
{
    const char* const vertex[] = {"void main(void){gl_TexCoord[0] = gl_MultiTexCoord0;",
                                  "gl_Position = ftransform();}"};
    const char* const fragment[] = {"uniform sampler2D t;",
                                    "void main(void){gl_FragColor = texture2D(t,",
                                    "gl_TexCoord[0].st);}"};
    Program program;
    program.loadVertexShader(2, vertex, nullptr);
    program.loadFragmentShader(3, fragment, nullptr);
    EXPECT_NO_THROW(program.link(true));
}

TEST_F(NativeOpenGL, BrokenShaderHasTheDriversLog)
{
    const char* const vertex[] = {"void main(void){nonsense_name = 1.0;}"};
    Program program;
    try {
        program.loadVertexShader(1, vertex, nullptr);
        FAIL() << "compiled";
    } catch (const QGF::LogicalException& exception) {
        EXPECT_THAT(exception.message(), testing::HasSubstr("nonsense_name"));
    }
}

TEST_F(NativeOpenGL, FramebufferIsClearedWithoutError)
{
    const OpenGLInterceptor& gl = OpenGLInterceptor::Instance();
    {
        const Texture2D texture(InternalFormat::RGBA8, 32, 32, false, nullptr, Type::Default);
        Framebuffer framebuffer;
        framebuffer.bind();
        framebuffer.attach(texture, 0, 0);
        gl.glClearColor("", 0, 255, 255, 255, 255);
        gl.glClear("", 0, 0x4000);
        framebuffer.unbind();
        EXPECT_EQ(gl.glGetError("", 0), 0U);
        const Texture2D levels(InternalFormat::RGBA8, 32, 32, true, nullptr, Type::Default);
        EXPECT_EQ(gl.glGetError("", 0), 0U);
    }
    EXPECT_EQ(gl.glGetError("", 0), 0U);
}

TEST_F(NativeOpenGL, ContextsOfOneDeviceAreIndependent)
{
    auto other = std::make_unique<ContextOffscreen>(Context::PrimaryDisplayDevice());
    other->makeCurrent();
    EXPECT_NE(OpenGLInterceptor::Instance().glGetString("", 0, 0x1F01), nullptr);
    other.reset();
    EXPECT_EQ(Context::Current(), nullptr);
    fContext->makeCurrent();
    EXPECT_NE(OpenGLInterceptor::Instance().glGetString("", 0, 0x1F01), nullptr);
}

TEST_F(NativeOpenGL, UnknownDeviceThrows)
{
    EXPECT_THROW(ContextOffscreen{DisplayDeviceKey("no such device", "", "")},
                 QGF::LogicalException);
}

} // namespace
