#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/OGL.h"
#include "support/FakeOpenGL.h"

namespace {

using namespace QGF::OGL;
using assay_test::FakeOpenGL;
using assay_test::kGLExtensions;
using assay_test::kGLNumExtensions;
using assay_test::kGLVersion;
using testing::ElementsAre;
using testing::IsEmpty;

// A current context of one device.
class Driver {
public:
    explicit Driver(const std::string& version,
                    const std::vector<std::optional<std::string>>& extensions = {})
    {
        device().strings[kGLVersion] = version;
        device().extensions = extensions;
        fContext = std::make_unique<ContextOffscreen>(Context::PrimaryDisplayDevice());
        fContext->makeCurrent();
        gl.calls.clear();
    }

    assay_test::FakeDevice& device() { return gl.devices[0]; }

    bool supports(int id) const
    {
        return ExtensionManager::Instance()->isSupported(static_cast<OpenGLExtension>(id));
    }

    FakeOpenGL gl;

private:
    std::unique_ptr<ContextOffscreen> fContext;
};

struct Row {
    int id;
    const char* version; // null if no core version has it
    const char* versionBefore;
    std::vector<std::string> names;
};

const std::vector<Row> kRows = {
    {0, "1.2", "1.1", {}},
    {1, nullptr, "4.6", {"GL_ARB_imaging"}},
    {2, "1.3", "1.2", {}},
    {3, "1.4", "1.3", {}},
    {4, "1.5", "1.4", {}},
    {5, "2.0", "1.5", {}},
    {6, "2.1", "2.0", {}},
    {7, "3.0", "2.1", {}},
    {8, "3.1", "3.0", {}},
    {9, "3.2", "3.1", {}},
    {10, "3.3", "3.2", {}},
    {11, "4.0", "3.3", {}},
    {12, "4.1", "4.0", {}},
    {27, nullptr, "4.6", {"GL_ARB_fragment_program"}},
    {28, "2.0", "1.5", {"GL_ARB_fragment_shader"}},
    {37, "1.5", "1.4", {"GL_ARB_occlusion_query"}},
    {47, nullptr, "4.6", {"GL_ARB_shader_texture_lod"}},
    {53, nullptr, "4.6", {"GL_ARB_texture_float", "GL_ATI_texture_float"}},
    {56, "2.0", "1.5", {"GL_ARB_texture_non_power_of_two"}},
    {58,
     "3.1",
     "3.0",
     {"GL_ARB_texture_rectangle", "GL_EXT_texture_rectangle", "GL_NV_texture_rectangle"}},
    {68, "1.5", "1.4", {"GL_ARB_vertex_buffer_object"}},
    {69, nullptr, "4.6", {"GL_ARB_vertex_program"}},
    {70, "2.0", "1.5", {"GL_ARB_vertex_shader"}},
    {81, "3.0", "2.1", {"GL_EXT_framebuffer_object", "GL_ARB_framebuffer_object"}},
};

class ExtensionRow : public testing::TestWithParam<Row> {};

TEST_P(ExtensionRow, IsSupportedByItsVersionAndByEachOfItsNames)
{
    const Row& row = GetParam();
    EXPECT_FALSE(Driver(row.versionBefore).supports(row.id));
    EXPECT_FALSE(Driver(row.versionBefore, {"GL_OTHER"}).supports(row.id));
    EXPECT_EQ(Driver("4.6").supports(row.id), row.version != nullptr);
    if (row.version != nullptr)
        EXPECT_TRUE(Driver(row.version).supports(row.id));
    for (const std::string& name : row.names) {
        EXPECT_TRUE(Driver("1.1", {"GL_A", name, "GL_Z"}).supports(row.id)) << name;
        EXPECT_TRUE(Driver(row.versionBefore, {name}).supports(row.id)) << name;
        EXPECT_FALSE(Driver("1.1", {name + "_2", "X" + name}).supports(row.id)) << name;
    }
}

INSTANTIATE_TEST_SUITE_P(All, ExtensionRow, testing::ValuesIn(kRows),
                         [](const testing::TestParamInfo<Row>& test) {
                             return "Id" + std::to_string(test.param.id);
                         });

TEST(ExtensionManager, UnknownIdIsNotSupported)
{
    const Driver driver("4.6", {"GL_ARB_imaging"});
    EXPECT_FALSE(driver.supports(-1));
    EXPECT_FALSE(driver.supports(13));
    EXPECT_FALSE(driver.supports(82));
    EXPECT_FALSE(driver.supports(2147483647));
}

TEST(ExtensionManager, ImagingIsNotAVersion)
{
    const Driver driver("1.1", {"GL_ARB_imaging"});
    EXPECT_TRUE(driver.supports(1));
    EXPECT_FALSE(driver.supports(0));
}

struct VersionText {
    const char* text;
    bool is21;
    bool is30;
};

class VersionTexts : public testing::TestWithParam<VersionText> {};

TEST_P(VersionTexts, AreParsed)
{
    const Driver driver(GetParam().text);
    EXPECT_EQ(driver.supports(GL_VERSION_2_1), GetParam().is21);
    EXPECT_EQ(driver.supports(GL_VERSION_3_0), GetParam().is30);
}

INSTANTIATE_TEST_SUITE_P(
    All, VersionTexts,
    testing::Values(VersionText{"2.1", true, false}, VersionText{"2.1.7", true, false},
                    VersionText{"2.10", true, false}, VersionText{"10.0", true, true},
                    VersionText{"4.6.0 NVIDIA 535.1", true, true},
                    VersionText{"4.5 (Compatibility Profile) Mesa", true, true},
                    VersionText{"OpenGL ES 3.2 Mesa", false, false}, VersionText{"", false, false},
                    VersionText{"3", false, false}, VersionText{"3.", false, false},
                    VersionText{".1", false, false}, VersionText{"3.x", false, false},
                    VersionText{" 3.1", false, false}, VersionText{"-3.1", false, false},
                    VersionText{"99999999999999999999.0", true, true}));

TEST(ExtensionManager, VersionBeforeThreeReadsTheList)
{
    const Driver driver("2.1", {"GL_ARB_imaging"});
    EXPECT_TRUE(driver.supports(1));
    EXPECT_THAT(driver.gl.calls, ElementsAre("glGetString(0x1F02)", "glGetString(0x1F03)"));
}

TEST(ExtensionManager, VersionThreeReadsNameByName)
{
    const Driver driver("3.0", {"GL_X", "GL_ARB_imaging"});
    EXPECT_TRUE(driver.supports(1));
    EXPECT_THAT(driver.gl.calls, ElementsAre("glGetString(0x1F02)", "glGetIntegerv(0x821D)",
                                             "glGetStringi(0x1F03,0)", "glGetStringi(0x1F03,1)"));
}

TEST(ExtensionManager, IsReadOnce)
{
    Driver driver("3.0");
    EXPECT_TRUE(driver.supports(0));
    driver.gl.calls.clear();
    EXPECT_TRUE(driver.supports(0));
    EXPECT_THAT(driver.gl.calls, IsEmpty());
}

TEST(ExtensionManager, ListMayHaveBlanksAnywhere)
{
    Driver driver("1.1");
    driver.device().strings[kGLExtensions] = "  GL_A   GL_ARB_imaging  ";
    EXPECT_TRUE(driver.supports(1));
}

TEST(ExtensionManager, NullTextsSupportNothing)
{
    Driver driver("1.1");
    driver.device().strings[kGLVersion] = std::nullopt;
    driver.device().strings[kGLExtensions] = std::nullopt;
    EXPECT_FALSE(driver.supports(0));
    EXPECT_FALSE(driver.supports(1));
}

TEST(ExtensionManager, FailedQueriesLeaveNoError)
{
    Driver driver("1.1");
    driver.device().strings.erase(kGLVersion); // glGetString returns null and raises an error
    EXPECT_FALSE(driver.supports(0));
    EXPECT_THAT(driver.device().errors, IsEmpty());
}

TEST(ExtensionManager, AFailedQueryOfTheListLeavesNoError)
{
    Driver driver("1.1");
    driver.device().strings.erase(kGLExtensions);
    EXPECT_FALSE(driver.supports(1));
    EXPECT_THAT(driver.device().errors, IsEmpty());
}

TEST(ExtensionManager, CallersErrorsStay)
{
    Driver driver("4.1", {"GL_ARB_imaging"});
    driver.device().errors = {1280, 1281};
    EXPECT_TRUE(driver.supports(1));
    EXPECT_THAT(driver.device().errors, ElementsAre(1280, 1281));
    EXPECT_THAT(driver.gl.callsOf("glGetError"), IsEmpty());
}

TEST(ExtensionManager, ErrorsOfABrokenDriverAreReadAtMost16Times)
{
    Driver driver("1.1");
    driver.device().strings.erase(kGLVersion);
    driver.device().errors.assign(1000, 1286);
    EXPECT_FALSE(driver.supports(0));
    EXPECT_EQ(driver.gl.callsOf("glGetError").size(), 16U);
}

TEST(ExtensionManager, CountOutOfRangeFallsBackToTheList)
{
    for (const std::int32_t count : {-1, -2147483647, 65537, 2147483647}) {
        Driver driver("3.0", {"GL_ARB_imaging"});
        driver.device().integers[kGLNumExtensions] = {count};
        EXPECT_TRUE(driver.supports(1)) << count; // from the list
        EXPECT_THAT(driver.gl.callsOf("glGetStringi"), IsEmpty()) << count;
    }
}

TEST(ExtensionManager, AnUnansweredCountFallsBackToTheList)
{
    Driver driver("3.0", {"GL_ARB_imaging"});
    driver.device().integers[kGLNumExtensions] = {};
    EXPECT_TRUE(driver.supports(1));
    EXPECT_THAT(driver.gl.callsOf("glGetStringi"), IsEmpty());
}

TEST(ExtensionManager, CountsUpTo65536AreReadNameByName)
{
    Driver none("3.0");
    EXPECT_FALSE(none.supports(1));
    EXPECT_THAT(none.gl.calls, ElementsAre("glGetString(0x1F02)", "glGetIntegerv(0x821D)"));
    Driver most("3.0", {std::nullopt});
    most.device().integers[kGLNumExtensions] = {65536};
    EXPECT_FALSE(most.supports(1));
    EXPECT_THAT(most.gl.callsOf("glGetStringi"), ElementsAre("glGetStringi(0x1F03,0)"));
}

TEST(ExtensionManager, NullNameFallsBackToTheList)
{
    Driver driver("3.0", {"GL_X", "GL_ARB_imaging"});
    driver.device().extensions[0] = std::nullopt;
    EXPECT_TRUE(driver.supports(1));
}

TEST(ExtensionManager, DriverWithoutIndexedStringsFallsBackToTheList)
{
    FakeOpenGL gl;
    gl.devices[0].missing = {"glGetStringi"};
    gl.devices[0].extensions = {"GL_ARB_imaging"};
    ContextOffscreen context(Context::PrimaryDisplayDevice());
    context.makeCurrent();
    EXPECT_TRUE(ExtensionManager::Instance()->isSupported(GL_IMAGING_1_2));
    EXPECT_TRUE(ExtensionManager::Instance()->isSupported(GL_VERSION_4_1));
}

TEST(ExtensionManager, DriverWithoutStringsThrows)
{
    FakeOpenGL gl;
    gl.devices[0].missing = {"glGetString"};
    ContextOffscreen context(Context::PrimaryDisplayDevice());
    context.makeCurrent();
    EXPECT_THROW(ExtensionManager::Instance(), QGF::LogicalException);
}

} // namespace
