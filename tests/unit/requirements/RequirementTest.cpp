#include "requirements/Requirement.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>

using namespace assay_host;

namespace {

std::string FindFailure(const std::string& text)
{
    try {
        ParseRequirement(text);
    } catch (const std::runtime_error& failure) {
        return failure.what();
    }
    return "none";
}

TEST(Requirement, HasASubjectARelationAndAValue)
{
    const Requirement memory = ParseRequirement("GLMemoryMB>=2048");
    EXPECT_EQ(memory.fText, "GLMemoryMB>=2048");
    EXPECT_EQ(std::get<const KnownKey*>(memory.fSubject),
              FindKnownKey(DeviceKind::kOpenGL, "GLMemoryMB"));
    EXPECT_EQ(memory.fScope, Scope::kAny);
    EXPECT_EQ(memory.fRelation, Relation::kGreaterOrEqual);
    EXPECT_EQ(std::get<double>(memory.fWanted), 2048);
}

TEST(Requirement, Relations)
{
    const struct {
        const char* fText;
        Relation fRelation;
    } rows[] = {{"==", Relation::kEqual},         {"=", Relation::kEqual},
                {"!=", Relation::kNotEqual},      {"<", Relation::kLess},
                {"<=", Relation::kLessOrEqual},   {">", Relation::kGreater},
                {">=", Relation::kGreaterOrEqual}};
    for (const auto& row : rows)
        EXPECT_EQ(ParseRequirement(std::string("CLCompute") + row.fText + "1").fRelation,
                  row.fRelation)
            << row.fText;
    const auto holds = [](Relation relation) {
        return std::string() + (Holds(relation, 1, 2) ? 'y' : 'n') +
               (Holds(relation, 2, 2) ? 'y' : 'n') + (Holds(relation, 3, 2) ? 'y' : 'n');
    };
    EXPECT_EQ(holds(Relation::kEqual), "nyn");
    EXPECT_EQ(holds(Relation::kNotEqual), "yny");
    EXPECT_EQ(holds(Relation::kLess), "ynn");
    EXPECT_EQ(holds(Relation::kLessOrEqual), "yyn");
    EXPECT_EQ(holds(Relation::kGreater), "nny");
    EXPECT_EQ(holds(Relation::kGreaterOrEqual), "nyy");
}

TEST(Requirement, MayNameTheDevices)
{
    EXPECT_EQ(ParseRequirement("any GLVersion>=3.3").fScope, Scope::kAny);
    EXPECT_EQ(ParseRequirement(" all\tGLVersion >= 3.3 ").fScope, Scope::kAll);
    const Requirement one = ParseRequirement("clgpu[3].CLName==x");
    EXPECT_EQ(one.fScope, Scope::kOne);
    ASSERT_TRUE(one.fDevice);
    EXPECT_EQ(one.fDevice->fKind, DeviceKind::kOpenCL);
    EXPECT_EQ(one.fDevice->fIndex, 3U);
}

TEST(Requirement, TheKeyDecidesTheTypeOfTheValue)
{
    const auto wanted = [](const char* text) { return ParseRequirement(text).fWanted; };
    EXPECT_EQ(std::get<double>(wanted("CLBandwidth>=200e9")), 200e9);
    EXPECT_EQ(std::get<double>(wanted("GLVendorID==0x10DE")), 4318);
    EXPECT_EQ(std::get<double>(wanted("GLVendorID==4318")), 4318);
    EXPECT_EQ(std::get<double>(wanted("GLVendorID==0xABCDEF01")), 0xABCDEF01);
    EXPECT_EQ(std::get<double>(wanted("GLVendorID==0xabcdef89")), 0xABCDEF89);
    EXPECT_EQ(std::get<double>(wanted("GLVendorID==0x234567")), 0x234567);
    EXPECT_EQ(std::get<double>(wanted("NumGLGPUs>=1")), 1);
    EXPECT_EQ(std::get<double>(wanted("glGetIntegerv[GL_MAX_DRAW_BUFFERS]>=8")), 8);
    EXPECT_EQ(std::get<double>(wanted("opengl.devices>=8")), 8);
    for (const char* text : {"1", "true", "yes"})
        EXPECT_EQ(std::get<double>(wanted(("GLFrameBufferOK==" + std::string(text)).c_str())), 1);
    for (const char* text : {"0", "false", "no"})
        EXPECT_EQ(std::get<double>(wanted(("QGFCoreInitialized==" + std::string(text)).c_str())),
                  0);
    EXPECT_EQ(std::get<Version>(wanted("GLVersion>=3.3")), (Version{3, 3}));
    EXPECT_EQ(std::get<Version>(wanted("glGetString[GL_SHADING_LANGUAGE_VERSION]>=4.50")),
              (Version{4, 50}));
    EXPECT_EQ(std::get<Version>(wanted("CUDAVersion>=12")), Version{12});
    EXPECT_EQ(std::get<std::string>(wanted("GLVendor==Some  words ")), "Some  words");
    EXPECT_EQ(std::get<std::string>(wanted(R"(GLVendor == " \"a\\ ")")), R"( "a\ )");
    EXPECT_EQ(std::get<std::string>(wanted("GLDriverDate>=2024-01-01")), "2024-01-01");
    EXPECT_EQ(std::get<Usability>(wanted("opencl.usable!=broken")), Usability::kBroken);
}

TEST(Requirement, SaysWhatIsWrong)
{
    const struct {
        const char* fText;
        const char* fFailure;
    } rows[] = {
        {"", R"("": a key is missing)"},
        {" >= 1", R"(" >= 1": a key is missing)"},
        {"all", R"("all": there is no key "all")"},
        {"all==1", R"("all==1": there is no key "all")"},
        {"any >= 1", R"("any >= 1": there is no key "any")"},
        {"any!=1", R"("any!=1": there is no key "any")"},
        {"all<1", R"("all<1": there is no key "all")"},
        {"GLName", R"("GLName": one of ==, !=, <, <=, > and >= must follow the key)"},
        {"GLName x == y", R"("GLName x == y": one of ==, !=, <, <=, > and >= must follow the key)"},
        {"GLName!x", R"("GLName!x": one of ==, !=, <, <=, > and >= must follow the key)"},
        {"GLName==", R"("GLName==": a value is missing)"},
        {"GLName==\"x", R"("GLName=="x": the closing quote is missing)"},
        {"GLName==\"x\"y", R"("GLName=="x"y": text follows the closing quote)"},
        {"GLMemoryMb>=1",
         R"("GLMemoryMb>=1": there is no key "GLMemoryMb"; did you mean GLMemoryMB?)"},
        {"GLMemory>=1", R"("GLMemory>=1": there is no key "GLMemory"; did you mean GLMemoryMB?)"},
        {"opengl.device>=1",
         R"("opengl.device>=1": there is no key "opengl.device"; did you mean opengl.devices?)"},
        {"Bogus>=1", R"("Bogus>=1": there is no key "Bogus")"},
        {"\x1B[2J>=1", R"("\x1B[2J>=1": there is no key "\x1B[2J")"},
        {"clgpu[0].GLName==x", R"("clgpu[0].GLName==x": clgpu[0] has no key GLName)"},
        {"glgpu[0]==x", R"("glgpu[0]==x": there is no key "glgpu[0]")"},
        {"all glgpu[0].GLName==x",
         R"("all glgpu[0].GLName==x": "all" and "any" don't go with glgpu[0])"},
        {"all NumGLGPUs==1",
         R"("all NumGLGPUs==1": "all" and "any" don't go with NumGLGPUs, which isn't of a device)"},
        {"any opencl.usable==hardware",
         R"("any opencl.usable==hardware": "all" and "any" don't go with opencl.usable, which isn't of a device)"},
        {"GLName>=x", R"("GLName>=x": GLName has no order: only == and != apply)"},
        {"GLFrameBufferOK>=1",
         R"("GLFrameBufferOK>=1": a flag has no order: only == and != apply)"},
        {"GLFrameBufferOK==2", R"("GLFrameBufferOK==2": "2" is neither 0 nor 1)"},
        {"GLMemoryMB>=2 GB", R"("GLMemoryMB>=2 GB": "2 GB" is no number)"},
        {"GLVendorID==0x", R"("GLVendorID==0x": "0x" is no number)"},
        {"GLVendorID==0x1g", R"("GLVendorID==0x1g": "0x1g" is no number)"},
        {"GLVendorID==0x123456789", R"("GLVendorID==0x123456789": "0x123456789" is no number)"},
        {"GLVersion>=new", R"("GLVersion>=new": "new" has no version number)"},
        {"opengl.usable==good",
         R"("opengl.usable==good": "good" is none of hardware, software, broken, absent and unknown)"},
        {"opengl.usable>hardware",
         R"("opengl.usable>hardware": whether an interface can be used has no order: only == and != apply)"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(FindFailure(row.fText), row.fFailure);
    EXPECT_EQ(FindFailure("GLName==" + std::string(992, 'x')), "none");
    EXPECT_THAT(FindFailure("GLName==" + std::string(993, 'x')),
                testing::EndsWith(": is longer than 1000 bytes"));
}

TEST(Requirement, EveryKeyCanBeRequired)
{
    for (const KnownKey& key : GetKnownKeys()) {
        const Requirement requirement = ParseRequirement(key.fKey + "==1");
        EXPECT_EQ(std::get<const KnownKey*>(requirement.fSubject), &key);
    }
}

TEST(Version, IsTheFirstOneInAText)
{
    const struct {
        const char* fText;
        std::optional<Version> fVersion;
    } rows[] = {{"3.3", Version{3, 3}},
                {"4.50 NVIDIA", Version{4, 50}},
                {"OpenCL 1.2 (r3)", Version{1, 2}},
                {"535.183.01", Version{535, 183, 1}},
                {"3.0.0", Version{3}},
                {"0", Version{}},
                {"1..2", Version{1}},
                {"1.", Version{1}},
                {"1x5", Version{1}},
                {"1 5", Version{1}},
                {"22.3-beta", Version{22, 3}},
                {"18446744073709551615", Version{18446744073709551615U}},
                {"18446744073709551616", std::nullopt},
                {"1.18446744073709551616", std::nullopt},
                {"", std::nullopt},
                {"unknown", std::nullopt}};
    for (const auto& row : rows)
        EXPECT_EQ(ReadVersion(row.fText), row.fVersion) << row.fText;
    EXPECT_LT(*ReadVersion("4.6"), *ReadVersion("4.50"));
    EXPECT_LT(*ReadVersion("3"), *ReadVersion("3.1"));
    EXPECT_EQ(*ReadVersion("3"), *ReadVersion("3.0"));
}

} // namespace
