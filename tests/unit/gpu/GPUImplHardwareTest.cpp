#include "pmutil_gpu/GPUImplHardware.h"

#include <algorithm>
#include <exception>
#include <functional>
#include <numeric>
#include <set>
#include <stdexcept>

#include <boost/make_shared.hpp>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "all/gpu/NewestGLVersion.h"
#include "all/gpu/ScopedGLCurrent.h"
#include "all/gpu/TestShaders.h"
#include "pmutil_gpu/GPUImplWin.h"
#include "support/CapturedLog.h"
#include "support/FakeOpenGL.h"

namespace {

using namespace assay_test;
using pmutil::GPUImplWin;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

constexpr std::uint32_t kUnknownName = 0x87FC;

// The text of the standard exception that `query` throws.
std::string Thrown(const std::function<void()>& query)
{
    try {
        query();
    } catch (const std::exception& error) {
        return error.what();
    }
    return "nothing was thrown";
}

class GPUImplHardwareTest : public testing::Test {
protected:
    GPUImplHardwareTest()
    {
        fImpl.context = boost::make_shared<QGF::OGL::ContextOffscreen>(fGL.devices[0].key);
        fGL.calls.clear();
    }

    FakeDevice& Device() { return fGL.devices[0]; }

    // What `query` writes to standard error.
    static std::string StandardErrorOf(const std::function<void()>& query)
    {
        testing::internal::CaptureStderr();
        try {
            query();
        } catch (const std::exception&) { // other tests check the text
        }
        return testing::internal::GetCapturedStderr();
    }

    CapturedLog fLog{pmutil::gGPUAssay};
    FakeOpenGL fGL{2};
    GPUImplWin fImpl;
};

TEST_F(GPUImplHardwareTest, AQueryIsFollowedByOneErrorCheckInsideTheDevicesContext)
{
    EXPECT_EQ(fImpl.GetGLVendor(), "Fake Vendor");
    EXPECT_THAT(fGL.calls, ElementsAre("makeCurrent fake0", "glGetString(0x1F00)", "glGetError()",
                                       "release fake0"));
    EXPECT_EQ(QGF::OGL::Context::Current(), nullptr);
    EXPECT_THAT(fLog.Lines(), IsEmpty());
}

TEST_F(GPUImplHardwareTest, ThePreviousContextIsRestored)
{
    QGF::OGL::ContextOffscreen other(fGL.devices[1].key);
    other.makeCurrent();
    fGL.calls.clear();
    EXPECT_EQ(fImpl.GetGLRenderer(), "Fake Renderer 0");
    EXPECT_EQ(QGF::OGL::Context::Current(), &other);
    EXPECT_THAT(fGL.calls, ElementsAre("makeCurrent fake0", "glGetString(0x1F01)", "glGetError()",
                                       "makeCurrent fake1"));
}

TEST_F(GPUImplHardwareTest, ThePreviousContextIsRestoredAfterAFailure)
{
    QGF::OGL::ContextOffscreen other(fGL.devices[1].key);
    other.makeCurrent();
    EXPECT_THROW(fImpl.GLGetString(kUnknownName), std::runtime_error);
    EXPECT_EQ(QGF::OGL::Context::Current(), &other);
    Device().onMakeCurrent = [] { throw QGF::LogicalException("lost"); };
    EXPECT_THROW(fImpl.GLGetString(kGLVendor), QGF::LogicalException);
    EXPECT_EQ(QGF::OGL::Context::Current(), &other);
}

TEST_F(GPUImplHardwareTest, ResultsAreNotCached)
{
    EXPECT_EQ(fImpl.GetGLVendor(), "Fake Vendor");
    Device().strings[kGLVendor] = "Another";
    EXPECT_EQ(fImpl.GetGLVendor(), "Another");
}

TEST_F(GPUImplHardwareTest, NameAndRendererAreTheRendererText)
{
    EXPECT_EQ(fImpl.GetGLRenderer(), "Fake Renderer 0");
    EXPECT_EQ(fImpl.GetGLName(), ""); // the adapter's description; there is no adapter
    EXPECT_STREQ(fImpl.GLGetString(kGLVersion), "4.1 Fake");
}

TEST_F(GPUImplHardwareTest, ANullTextIsReturnedAndFailsTheStringQueries)
{
    Device().strings[kGLVendor] = std::nullopt;
    Device().strings[kGLRenderer] = std::nullopt;
    EXPECT_EQ(fImpl.GLGetString(kGLVendor), nullptr);
    EXPECT_THROW(fImpl.GetGLVendor(), std::logic_error);
    EXPECT_THROW(fImpl.GetGLRenderer(), std::logic_error);
    EXPECT_EQ(QGF::OGL::Context::Current(), nullptr);
}

TEST_F(GPUImplHardwareTest, AStringNameThatOpenGLRejectsIsLoggedInDecimalAndThrows)
{
    EXPECT_EQ(Thrown([this] { fImpl.GLGetString(kUnknownName); }),
              "Failed requirement: glStatus == GL_NO_ERROR");
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("GPUImplHardware::DoGLGetString(34812): glGetError() returns 1280"));
}

TEST_F(GPUImplHardwareTest, AnIntegerNameThatOpenGLRejectsIsLoggedInDecimalAndThrows)
{
    std::int32_t result = 7;
    EXPECT_EQ(Thrown([&] { fImpl.GLGetIntegerv(kUnknownName, &result); }),
              "Failed requirement: glStatus == GL_NO_ERROR");
    EXPECT_EQ(result, 7);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("GPUImplHardware::DoGLGetIntegerv(34812): glGetError() returns 1280"));
}

TEST_F(GPUImplHardwareTest, AProgramCodeThatOpenGLRejectsIsLoggedInDecimalAndThrows)
{
    std::int32_t result = 7;
    EXPECT_EQ(Thrown([&] { fImpl.GLGetProgramivARB(0x8804, 0x880B, &result); }),
              "Failed requirement: glStatus == GL_NO_ERROR");
    EXPECT_THAT(fLog.Lines(), ElementsAre("GPUImplHardware::DoGLGetProgramivARB(target=34820, "
                                          "code=34827): glGetError() returns 1280"));
}

TEST_F(GPUImplHardwareTest, NamesAreLoggedSignedAndTheStatusUnsigned)
{
    Device().strings[0xFFFFFFFF] = "x";
    Device().errors = {0xFFFFFFFF};
    EXPECT_THROW(fImpl.GLGetString(0xFFFFFFFF), std::runtime_error);
    Device().errors = {0xFFFFFFFE};
    Device().integers[0x80000000] = {1};
    std::int32_t result = 0;
    EXPECT_THROW(fImpl.GLGetIntegerv(0x80000000, &result), std::runtime_error);
    Device().errors = {0x80000000};
    EXPECT_THROW(fImpl.GLGetProgramivARB(0xFFFFFFFD, 0xFFFFFFFC, &result), std::runtime_error);
    EXPECT_THAT(
        fLog.Lines(),
        ElementsAre("GPUImplHardware::DoGLGetString(-1): glGetError() returns 4294967295",
                    "GPUImplHardware::DoGLGetIntegerv(-2147483648): glGetError() returns "
                    "4294967294",
                    "GPUImplHardware::DoGLGetProgramivARB(target=-3, code=-4): glGetError() "
                    "returns 2147483648"));
}

TEST_F(GPUImplHardwareTest, TheFailureIsReportedWithoutFileAndLine)
{
    EXPECT_EQ(StandardErrorOf([this] { fImpl.GLGetString(kUnknownName); }),
              "Failed requirement: glStatus == GL_NO_ERROR\n");
}

TEST_F(GPUImplHardwareTest, WithLoggingOffOnlyTheLineIsMissing)
{
    fLog.SetOn(false);
    std::int32_t result = 0;
    EXPECT_THROW(fImpl.GLGetString(kUnknownName), std::runtime_error);
    EXPECT_THROW(fImpl.GLGetIntegerv(kUnknownName, &result), std::runtime_error);
    EXPECT_THROW(fImpl.GLGetProgramivARB(1, 2, &result), std::runtime_error);
    EXPECT_EQ(fLog.Text(), "");
}

TEST_F(GPUImplHardwareTest, OneErrorIsReadPerQuery)
{
    Device().errors = {0x501, 0x502};
    EXPECT_THROW(fImpl.GetGLVendor(), std::runtime_error);
    EXPECT_THAT(Device().errors, ElementsAre(0x502U));
}

TEST_F(GPUImplHardwareTest, IntegersAndProgramLimitsAreRead)
{
    Device().integers[0x0D33] = {-5};
    Device().programIntegers[{0x8804, 0x880B}] = 4096;
    std::int32_t result = 0;
    fImpl.GLGetIntegerv(0x0D33, &result);
    EXPECT_EQ(result, -5);
    fImpl.GLGetProgramivARB(0x8804, 0x880B, &result);
    EXPECT_EQ(result, 4096);
    EXPECT_THAT(fGL.callsOf("gl"), ElementsAre("glGetIntegerv(0xD33)", "glGetError()",
                                               "glGetProgramivARB(0x8804,0x880B)", "glGetError()"));
}

TEST_F(GPUImplHardwareTest, TheRectangleTextureSizeIsUnsigned)
{
    EXPECT_EQ(fImpl.GetGLRectTextureSize(), 16384U);
    Device().integers[kGLMaxRectangleTextureSize] = {-1};
    EXPECT_EQ(fImpl.GetGLRectTextureSize(), 4294967295U);
}

TEST_F(GPUImplHardwareTest, ARejectedRectangleTextureSizeThrows)
{
    Device().integers.clear();
    EXPECT_EQ(Thrown([this] { fImpl.GetGLRectTextureSize(); }),
              "Failed requirement: glStatus == GL_NO_ERROR");
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("GPUImplHardware::DoGLGetIntegerv(34040): glGetError() returns 1280"));
}

TEST_F(GPUImplHardwareTest, TheInterceptorGetsTheModule)
{
    const auto module = HasSubstr("(called from pmutil/sources/all/GPUImplHardware:");
    std::int32_t result = 0;
    Device().missing = {"glGetString", "glGetIntegerv", "glGetProgramivARB", "glGetError",
                        "glClearColor"};
    // The table is filled by the first makeCurrent.
    fImpl.context = boost::make_shared<QGF::OGL::ContextOffscreen>(Device().key);
    EXPECT_THAT(Thrown([&] { fImpl.GLGetString(kGLVendor); }),
                AllOf(StartsWith("glGetString is not offered"), module));
    EXPECT_THAT(Thrown([&] { fImpl.GLGetIntegerv(1, &result); }),
                AllOf(StartsWith("glGetIntegerv is not offered"), module));
    EXPECT_THAT(Thrown([&] { fImpl.GLGetProgramivARB(1, 2, &result); }),
                AllOf(StartsWith("glGetProgramivARB is not offered"), module));
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_THAT(
        fLog.Lines(),
        ElementsAre(AllOf(StartsWith("DoGLFramebufferOK: glClearColor is not offered"), module)));
    Device().missing = {"glGetError"};
    fImpl.context = boost::make_shared<QGF::OGL::ContextOffscreen>(Device().key);
    EXPECT_THAT(Thrown([&] { fImpl.GLGetString(kGLVendor); }),
                AllOf(StartsWith("glGetError is not offered"), module));
}

TEST_F(GPUImplHardwareTest, ExtensionsAreThoseOfTheDevicesContext)
{
    Device().strings[kGLVersion] = "1.2";
    Device().extensions = {"GL_ARB_vertex_program"};
    EXPECT_TRUE(fImpl.GLIsExtensionSupported(QGF::OGL::GL_ARB_VERTEX_PROGRAM));
    EXPECT_FALSE(fImpl.GLIsExtensionSupported(QGF::OGL::GL_ARB_FRAGMENT_PROGRAM));
    EXPECT_EQ(QGF::OGL::Context::Current(), nullptr);
    EXPECT_EQ(fGL.calls.front(), "makeCurrent fake0");
    EXPECT_EQ(fGL.calls.back(), "release fake0");
}

TEST_F(GPUImplHardwareTest, NonPowerOfTwoSupportFollowsTheExtension)
{
    Device().strings[kGLVersion] = "1.5";
    EXPECT_FALSE(fImpl.HasGLNPOTSupport());
    Device().extensions = {"GL_ARB_texture_non_power_of_two"};
    fImpl.context = boost::make_shared<QGF::OGL::ContextOffscreen>(Device().key);
    EXPECT_TRUE(fImpl.HasGLNPOTSupport());
}

TEST_F(GPUImplHardwareTest, NonPowerOfTwoSupportIsCoreFromVersionTwoOn)
{
    const std::pair<const char*, bool> rows[] = {
        {"1.2", false}, {"1.5", false}, {"2.0", true}, {"2.1", true},
        {"3.0", true},  {"3.3", true},  {"4.1", true}, {"4.6", true},
    };
    for (const auto& [version, expected] : rows) {
        Device().strings[kGLVersion] = version;
        fImpl.context = boost::make_shared<QGF::OGL::ContextOffscreen>(Device().key);
        EXPECT_EQ(fImpl.HasGLNPOTSupport(), expected) << version;
    }
}

TEST_F(GPUImplHardwareTest, AMissingExtensionManagerThrows)
{
    const std::string standardError = StandardErrorOf([] {
        EXPECT_EQ(Thrown([] { pmutil::RequireExtensions(nullptr); }),
                  "QGF::OGL::ExtensionManager::Instance() returned NULL");
    });
    EXPECT_EQ(standardError, "QGF::OGL::ExtensionManager::Instance() returned NULL\n");
}

struct VersionCase {
    const char* driver;
    const char* reported;
};

void PrintTo(const VersionCase& version, std::ostream* out)
{
    *out << version.driver;
}

class GLVersionTest : public GPUImplHardwareTest,
                      public testing::WithParamInterface<VersionCase> {};

TEST_P(GLVersionTest, TheNewestSupportedVersionIsReported)
{
    Device().strings[kGLVersion] = GetParam().driver;
    EXPECT_EQ(fImpl.GetGLVersion(), GetParam().reported);
}

INSTANTIATE_TEST_SUITE_P(Ladder, GLVersionTest,
                         testing::Values(VersionCase{"1.2", "1.2"}, VersionCase{"1.3", "1.3"},
                                         VersionCase{"1.4", "1.4"}, VersionCase{"1.5.8", "1.5"},
                                         VersionCase{"2.0", "2.0"},
                                         VersionCase{"2.1 Driver 9", "2.1"},
                                         VersionCase{"3.0", "3.0"}, VersionCase{"3.1", "3.1"},
                                         VersionCase{"3.2", "3.2"}, VersionCase{"3.3", "3.3"},
                                         VersionCase{"4.0", "4.0"}, VersionCase{"4.1", "4.1"},
                                         VersionCase{"4.6 (Compatibility Profile)", "4.1"}));

// A newer version doesn't imply an older one.
TEST(NewestGLVersionTest, TheFirstSupportedVersionIsReturned)
{
    const std::pair<std::set<int>, const char*> rows[] = {
        {{12}, "4.1"},  {{11}, "4.0"},       {{10}, "3.3"},    {{9}, "3.2"},    {{8}, "3.1"},
        {{7}, "3.0"},   {{6}, "2.1"},        {{5}, "2.0"},     {{4}, "1.5"},    {{3}, "1.4"},
        {{2}, "1.3"},   {{0}, "1.2"},        {{2, 12}, "4.1"}, {{0, 2}, "1.3"}, {{0, 1}, "1.2"},
        {{1}, nullptr}, {{13, 56}, nullptr}, {{}, nullptr},
    };
    for (const auto& [supported, expected] : rows) {
        std::vector<int> queried;
        const char* const text =
            pmutil::NewestGLVersion([&, &all = supported](QGF::OGL::OpenGLExtension version) {
                queried.push_back(static_cast<int>(version));
                return all.count(queried.back()) != 0;
            });
        SCOPED_TRACE(testing::PrintToString(supported));
        EXPECT_STREQ(text, expected);
        EXPECT_TRUE(std::is_sorted(queried.rbegin(), queried.rend()));
        EXPECT_EQ(queried.front(), 12);
        EXPECT_EQ(std::count(queried.begin(), queried.end(), 1), 0);
    }
}

TEST_F(GPUImplHardwareTest, TheImagingSubsetIsNotAVersion)
{
    Device().strings[kGLVersion] = "1.1";
    Device().extensions = {"GL_ARB_imaging"};
    EXPECT_TRUE(fImpl.GLIsExtensionSupported(QGF::OGL::GL_IMAGING_1_2));
    EXPECT_EQ(Thrown([this] { fImpl.GetGLVersion(); }), "Cannot determine OGL version");
    EXPECT_EQ(QGF::OGL::Context::Current(), nullptr);
}

TEST_F(GPUImplHardwareTest, TheLibrarysOwnExceptionsPassThrough)
{
    Device().onMakeCurrent = [] { throw QGF::LogicalException("lost"); };
    EXPECT_THROW(fImpl.GetGLVersion(), QGF::LogicalException);
    EXPECT_THROW(fImpl.GetGLVendor(), QGF::LogicalException);
    EXPECT_THROW(fImpl.HasGLNPOTSupport(), QGF::LogicalException);
}

// The tests by trial: shaders and framebuffer.

std::size_t TextSize(const char* const* texts, int count)
{
    return std::accumulate(texts, texts + count, std::size_t{0},
                           [](std::size_t size, const char* text) {
                               return size + std::char_traits<char>::length(text);
                           });
}

// FNV-1a over the entries, each with its terminating zero.
std::uint64_t TextHash(const char* const* texts, int count)
{
    std::uint64_t hash = 0xcbf29ce484222325;
    for (int i = 0; i < count; ++i) {
        const std::string text = texts[i];
        for (std::size_t k = 0; k <= text.size(); ++k) // with the terminating zero
            hash = (hash ^ static_cast<unsigned char>(text.c_str()[k])) * 0x100000001b3;
    }
    return hash;
}

TEST(TestShadersTest, TheEntriesAreUnchanged)
{
    EXPECT_EQ(std::size(pmutil::kTestVertexShader), 13U);
    EXPECT_EQ(std::size(pmutil::kTestFragmentShader), 76U);
    EXPECT_EQ(TextSize(pmutil::kTestVertexShader, pmutil::kTestVertexShaderCount), 288U);
    EXPECT_EQ(TextSize(pmutil::kTestFragmentShader, pmutil::kTestFragmentShaderCount), 2642U);
    EXPECT_EQ(TextHash(pmutil::kTestVertexShader, pmutil::kTestVertexShaderCount),
              0xa9a3be823819509a);
    EXPECT_EQ(TextHash(pmutil::kTestFragmentShader, pmutil::kTestFragmentShaderCount),
              0x64464cb2400ba59);
    EXPECT_STREQ(pmutil::kTestFragmentShader[4], "uniform float sample_scale; ");
    EXPECT_STREQ(pmutil::kTestFragmentShader[43],
                 "sum_wt += weight[6];tex_coord = gl_TexCoord[0].st + sample_scale * offset_y[7] "
                 "* duvdy;");
}

TEST_F(GPUImplHardwareTest, BothShadersAreCompiledAndLinkedAndNothingIsDrawn)
{
    std::vector<std::vector<std::string>> sources;
    std::vector<bool> lengths;
    Device().onCall["glCompileShader"] = [&] {
        sources.push_back(Device().shaderSource);
        lengths.push_back(Device().shaderLengthsGiven);
    };
    EXPECT_TRUE(fImpl.CompileProgramGLSL());
    ASSERT_EQ(sources.size(), 2U);
    EXPECT_THAT(lengths, ElementsAre(false, false));
    EXPECT_THAT(sources[0], testing::ElementsAreArray(pmutil::kTestVertexShader));
    EXPECT_THAT(sources[1], testing::ElementsAreArray(pmutil::kTestFragmentShader));
    EXPECT_THAT(fGL.calls,
                ElementsAre("makeCurrent fake0", "glCreateProgram()", "glCreateShader(0x8B31)",
                            "glShaderSource(2,13)", "glCompileShader(2)", "glGetShaderiv(2,0x8B81)",
                            "glAttachShader(1,2)", "glDeleteShader(2)", "glCreateShader(0x8B30)",
                            "glShaderSource(3,76)", "glCompileShader(3)", "glGetShaderiv(3,0x8B81)",
                            "glAttachShader(1,3)", "glDeleteShader(3)", "glLinkProgram(1)",
                            "glGetProgramiv(1,0x8B82)", "glDeleteProgram(1)", "release fake0"));
    EXPECT_EQ(Device().objects, 0);
    EXPECT_THAT(fLog.Lines(), IsEmpty());
}

// The compile test doesn't call glGetError, so the next query reports the driver's error.
TEST_F(GPUImplHardwareTest, AnErrorOfTheCompileTestStaysInTheQueue)
{
    Device().onCall["glLinkProgram"] = [this] { Device().errors = {0x502}; };
    EXPECT_TRUE(fImpl.CompileProgramGLSL());
    EXPECT_THAT(Device().errors, ElementsAre(0x502U));
    EXPECT_THAT(fLog.Lines(), IsEmpty());
    EXPECT_THROW(fImpl.GLGetString(kGLVendor), std::runtime_error);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("GPUImplHardware::DoGLGetString(7936): glGetError() returns 1282"));
}

TEST_F(GPUImplHardwareTest, ARejectedFragmentShaderIsFalseAndLogged)
{
    Device().fragmentCompiles = false;
    Device().log = "0:7: syntax error";
    EXPECT_EQ(StandardErrorOf([this] { EXPECT_FALSE(fImpl.CompileProgramGLSL()); }), "");
    EXPECT_THAT(fLog.Lines(), ElementsAre(AllOf(StartsWith("DoCompileProgramGLSL: "),
                                                HasSubstr("0:7: syntax error"))));
    EXPECT_EQ(QGF::OGL::Context::Current(), nullptr);
    EXPECT_EQ(Device().objects, 0);
    EXPECT_EQ(fImpl.GetGLVendor(), "Fake Vendor"); // further queries work
}

TEST_F(GPUImplHardwareTest, ARejectedVertexShaderIsFalse)
{
    Device().vertexCompiles = false;
    EXPECT_FALSE(fImpl.CompileProgramGLSL());
    EXPECT_EQ(fGL.callsOf("glCompileShader").size(), 1U);
}

TEST_F(GPUImplHardwareTest, AFailedLinkIsFalseAndLogged)
{
    Device().links = false;
    Device().log = "too many instructions";
    EXPECT_FALSE(fImpl.CompileProgramGLSL());
    EXPECT_THAT(fLog.Lines(), ElementsAre(AllOf(StartsWith("DoCompileProgramGLSL: "),
                                                HasSubstr("too many instructions"))));
}

TEST_F(GPUImplHardwareTest, TestsPrintNothingWithLoggingOff)
{
    fLog.SetOn(false);
    Device().framebufferStatus = 0;
    for (bool FakeDevice::*works :
         {&FakeDevice::vertexCompiles, &FakeDevice::fragmentCompiles, &FakeDevice::links}) {
        Device().*works = false;
        const std::string standardError = StandardErrorOf([this] {
            testing::internal::CaptureStdout();
            EXPECT_NO_THROW(EXPECT_FALSE(fImpl.CompileProgramGLSL()));
            EXPECT_NO_THROW(EXPECT_FALSE(fImpl.GLFramebufferOK()));
            EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
        });
        Device().*works = true;
        EXPECT_EQ(standardError, "");
    }
    EXPECT_EQ(fLog.Text(), "");
}

TEST_F(GPUImplHardwareTest, ALostContextFailsBothTests)
{
    Device().onMakeCurrent = [] { throw QGF::LogicalException("lost"); };
    EXPECT_FALSE(fImpl.CompileProgramGLSL());
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_THAT(fLog.Lines(), ElementsAre("DoCompileProgramGLSL: lost", "DoGLFramebufferOK: lost"));
}

TEST_F(GPUImplHardwareTest, AnUnknownExceptionPassesThroughTheTests)
{
    Device().onCall["glCreateProgram"] = [] { throw 1; };
    Device().onCall["glClear"] = [] { throw 2; };
    EXPECT_THROW(fImpl.CompileProgramGLSL(), int);
    EXPECT_THROW(fImpl.GLFramebufferOK(), int);
    EXPECT_EQ(QGF::OGL::Context::Current(), nullptr);
    EXPECT_EQ(Device().objects, 0);
}

TEST_F(GPUImplHardwareTest, TheFramebufferIsClearedUnboundAndCheckedOnce)
{
    EXPECT_TRUE(fImpl.GLFramebufferOK());
    EXPECT_EQ(Device().objects, 0);
    EXPECT_THAT(fLog.Lines(), IsEmpty());
    EXPECT_THAT(fGL.calls,
                ElementsAre("makeCurrent fake0", "glGenTextures(1)", "glBindTexture(0xDE1,1)",
                            "glTexParameteri(0xDE1,0x2801,0x2601)",
                            "glTexImage2D(0xDE1,0,0x8058,32,32,0,0x1908,0x1401)",
                            "glBindTexture(0xDE1,0)", "glGenFramebuffers(1)",
                            "glBindFramebuffer(0x8D40,2)",
                            "glFramebufferTexture2D(0x8D40,0x8CE0,0xDE1,1,0)",
                            "glCheckFramebufferStatus(0x8D40)", "glClearColor(255,255,255,255)",
                            "glClear(0x4000)", "glBindFramebuffer(0x8D40,0)", "glGetError()",
                            "glDeleteFramebuffers(1,2)", "glDeleteTextures(1,1)", "release fake0"));
}

TEST_F(GPUImplHardwareTest, AnErrorOfTheClearIsReportedAsTheFirstInTheQueue)
{
    Device().onCall["glClear"] = [this] { Device().errors = {0x506, 0x501}; };
    EXPECT_EQ(StandardErrorOf([this] { EXPECT_FALSE(fImpl.GLFramebufferOK()); }), "");
    EXPECT_THAT(fLog.Lines(), ElementsAre("DoGLFramebufferOK: glGetError() returns 1286"));
    EXPECT_THAT(Device().errors, ElementsAre(0x501U));
    EXPECT_EQ(Device().objects, 0);
}

TEST_F(GPUImplHardwareTest, AnErrorOfTheClearColorIsReportedAfterTheUnbind)
{
    Device().onCall["glClearColor"] = [this] { Device().errors = {0x502}; };
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_THAT(fLog.Lines(), ElementsAre("DoGLFramebufferOK: glGetError() returns 1282"));
}

TEST_F(GPUImplHardwareTest, TheFramebufferStatusIsLoggedSigned)
{
    Device().onCall["glClear"] = [this] { Device().errors = {0xFFFFFFFF}; };
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_THAT(fLog.Lines(), ElementsAre("DoGLFramebufferOK: glGetError() returns -1"));
}

TEST_F(GPUImplHardwareTest, AnIncompleteFramebufferIsFalse)
{
    Device().framebufferStatus = 0x8CDD;
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_THAT(fLog.Lines(), ElementsAre(StartsWith("DoGLFramebufferOK: ")));
    EXPECT_EQ(Device().objects, 0);
}

TEST_F(GPUImplHardwareTest, ARejectedTextureIsFalseAndLeavesNoError)
{
    Device().onCall["glTexImage2D"] = [this] {
        Device().errors = {0x505};
        Device().framebufferStatus = 0x8CD6;
    };
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_EQ(fGL.callsOf("glGetError").size(), 1U);
    EXPECT_THAT(fLog.Lines(), ElementsAre("DoGLFramebufferOK: The framebuffer is not complete: "
                                          "GL_FRAMEBUFFER_INCOMPLETE_ATTACHMENT, after OpenGL "
                                          "error 0x0505"));
    EXPECT_NO_THROW(fImpl.GLGetString(kGLVendor));
}

TEST_F(GPUImplHardwareTest, AFailedTextureIsFalse)
{
    Device().makesObjects = false;
    EXPECT_FALSE(fImpl.GLFramebufferOK());
    EXPECT_FALSE(fImpl.CompileProgramGLSL());
    EXPECT_THAT(fLog.Lines(), ElementsAre(StartsWith("DoGLFramebufferOK: "),
                                          StartsWith("DoCompileProgramGLSL: ")));
}

// The base class without adapter data.

class BareHardware : public pmutil::GPUImplHardware {
private:
    GLGPUs DoGetGPUs() override { return {}; }
    std::uint32_t DoGetGLMemoryMB() override { return 0; }
    std::uint32_t DoGetGLVendorID() override { return 0; }
    std::string DoGetGLDriverVersion() override { return {}; }
    std::uint32_t DoGetGLRendererID() override { return 0; }
};

TEST_F(GPUImplHardwareTest, TheBaseReportsNoDriverAndNoIntegratedDevice)
{
    BareHardware bare;
    EXPECT_EQ(bare.GetGLDriver(), "");
    EXPECT_EQ(bare.GetGLDriverDate(), "");
    EXPECT_EQ(bare.GetGLDriverExtra(), "");
    EXPECT_FALSE(bare.IsIntegratedGLGPU());
    EXPECT_EQ(bare.context, nullptr);
    EXPECT_EQ(bare.device.id(), nullptr);
}

TEST_F(GPUImplHardwareTest, TheBasesNameIsTheRendererText)
{
    BareHardware bare;
    bare.context = fImpl.context;
    EXPECT_EQ(bare.GetGLName(), "Fake Renderer 0");
    EXPECT_EQ(bare.GetGLRenderer(), "Fake Renderer 0");
}

// Queries without a context.

struct GLQuery {
    const char* name;
    void (*run)(pmutil::GPUImpl&);
};

void PrintTo(const GLQuery& query, std::ostream* out)
{
    *out << query.name;
}

class GPUImplHardwareDeathTest : public testing::TestWithParam<GLQuery> {};

TEST_P(GPUImplHardwareDeathTest, ANullContextFailsTheAssertion)
{
    GPUImplWin impl;
    EXPECT_DEATH(GetParam().run(impl), "px != 0");
}

INSTANTIATE_TEST_SUITE_P(
    Questions, GPUImplHardwareDeathTest,
    testing::Values(
        GLQuery{"GLVersion", [](pmutil::GPUImpl& impl) { impl.GetGLVersion(); }},
        GLQuery{"GLVendor", [](pmutil::GPUImpl& impl) { impl.GetGLVendor(); }},
        GLQuery{"GLRenderer", [](pmutil::GPUImpl& impl) { impl.GetGLRenderer(); }},
        GLQuery{"GLRectTextureSize", [](pmutil::GPUImpl& impl) { impl.GetGLRectTextureSize(); }},
        GLQuery{"GLNPOTSupport", [](pmutil::GPUImpl& impl) { impl.HasGLNPOTSupport(); }},
        GLQuery{"CompileProgramGLSL", [](pmutil::GPUImpl& impl) { impl.CompileProgramGLSL(); }},
        GLQuery{"GLFramebufferOK", [](pmutil::GPUImpl& impl) { impl.GLFramebufferOK(); }},
        GLQuery{"GLGetString", [](pmutil::GPUImpl& impl) { impl.GLGetString(kGLVendor); }},
        GLQuery{"GLGetIntegerv",
                [](pmutil::GPUImpl& impl) {
                    std::int32_t result = 0;
                    impl.GLGetIntegerv(1, &result);
                }},
        GLQuery{"GLGetProgramivARB",
                [](pmutil::GPUImpl& impl) {
                    std::int32_t result = 0;
                    impl.GLGetProgramivARB(1, 2, &result);
                }},
        GLQuery{
            "Extension",
            [](pmutil::GPUImpl& impl) { impl.GLIsExtensionSupported(QGF::OGL::GL_VERSION_1_2); }}),
    [](const testing::TestParamInfo<GLQuery>& query) { return query.param.name; });

} // namespace
