#include "requirements/RequirementFile.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "support/TempPath.h"

using namespace assay_host;

namespace {

std::string FindFailure(const std::string& text)
{
    std::istringstream stream(text);
    try {
        ReadRequirements(stream);
    } catch (const std::runtime_error& failure) {
        return failure.what();
    }
    return "none";
}

TEST(RequirementFile, HasAnArrayOfThem)
{
    std::istringstream text(
        R"({"comment": "of all", "require": ["GLVersion>=3.3", "NumGLGPUs>=1"]})");
    const std::vector<Requirement> requirements = ReadRequirements(text);
    ASSERT_EQ(requirements.size(), 2U);
    EXPECT_EQ(requirements[0].fText, "GLVersion>=3.3");
    EXPECT_EQ(requirements[1].fText, "NumGLGPUs>=1");
}

TEST(RequirementFile, SaysWhatIsWrong)
{
    EXPECT_EQ(FindFailure(""), "not valid JSON");
    EXPECT_EQ(FindFailure("{"), "not valid JSON");
    EXPECT_EQ(FindFailure("[]"), "has no array \"require\"");
    EXPECT_EQ(FindFailure("{}"), "has no array \"require\"");
    EXPECT_EQ(FindFailure(R"({"require": "x"})"), "has no array \"require\"");
    EXPECT_EQ(FindFailure(R"({"require": []})"), "\"require\" is empty");
    EXPECT_EQ(FindFailure(R"({"require": [7]})"),
              "\"require\" has an element that is no string but of the type number");
    EXPECT_EQ(FindFailure(R"({"require": ["x"]})"), R"("x": there is no key "x")");
}

TEST(RequirementFile, IsLoadedByItsPath)
{
    const std::string path = MakeTempPath("requirements-\xC3\xA9");
    std::ofstream(std::filesystem::u8path(path)) << R"({"require": ["GLVersion>=3.3"]})";
    const std::vector<Requirement> requirements = LoadRequirements(path);
    std::filesystem::remove(std::filesystem::u8path(path));
    ASSERT_EQ(requirements.size(), 1U);
    EXPECT_EQ(requirements[0].fText, "GLVersion>=3.3");
}

TEST(RequirementFile, IsNamedInItsFailures)
{
    try {
        LoadRequirements("no-such-file.json");
        FAIL();
    } catch (const std::runtime_error& failure) {
        EXPECT_STREQ(failure.what(), "no-such-file.json: cannot be opened");
    }
}

} // namespace
