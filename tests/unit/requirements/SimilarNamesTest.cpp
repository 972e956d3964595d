// The name that a message suggests for one that isn't known.
#include "requirements/Requirement.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>

namespace assay_host {
namespace {

// Returns the suggestion; empty if there is none.
std::string Suggest(const std::string& name)
{
    try {
        ParseRequirement(name + ">=1");
    } catch (const std::runtime_error& failure) {
        const std::string text = failure.what();
        const std::string mark = "did you mean ";
        const std::size_t at = text.find(mark);
        return at == std::string::npos
                   ? ""
                   : text.substr(at + mark.size(), text.size() - at - mark.size() - 1);
    }
    return "known";
}

TEST(SimilarNames, DifferByTwoBytes)
{
    EXPECT_EQ(Suggest("GLNa"), "GLName") << "two are missing";
    EXPECT_EQ(Suggest("GLN"), "") << "three are missing";
    EXPECT_EQ(Suggest("GLNamexx"), "GLName") << "two more";
    EXPECT_EQ(Suggest("nGLNam"), "GLName") << "one more, one is missing";
    EXPECT_EQ(Suggest("CLNmae"), "CLName") << "two are others";
    EXPECT_EQ(Suggest("GLMemo"), "");
}

TEST(SimilarNames, DifferByAThirdOfALongName)
{
    EXPECT_EQ(Suggest("GLNamexxx"), "GLName") << "three of nine";
    EXPECT_EQ(Suggest("ompileProgramGLS"), "CanCompileProgramGLSL") << "five of sixteen";
    EXPECT_EQ(Suggest("canCompileProgr"), "") << "six of fifteen";
}

TEST(SimilarNames, AreTheNearestAndOfAnyCase)
{
    EXPECT_EQ(Suggest("glname"), "GLName");
    EXPECT_EQ(Suggest("CLNAM"), "CLName");
    EXPECT_EQ(Suggest("xLName"), "GLName") << "the first of equally near ones";
    EXPECT_EQ(Suggest("opengl.usabl"), "opengl.usable");
    EXPECT_EQ(Suggest("opencl.usabl"), "opencl.usable");
    EXPECT_EQ(Suggest("opengl.device"), "opengl.devices");
    EXPECT_EQ(Suggest("opencl.device"), "opencl.devices");
}

} // namespace
} // namespace assay_host
