#include "pmutil/Requirement.h"

#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>

namespace pmutil {
namespace {

using testing::ElementsAre;

std::vector<std::string> gTold;

void Remember(const char* text)
{
    gTold.emplace_back(text != nullptr ? text : "null");
}

class RequirementTest : public testing::Test {
protected:
    void SetUp() override
    {
        gTold.clear();
        SetFailureHandler(Remember);
    }
    void TearDown() override { SetFailureHandler(nullptr); }
};

TEST_F(RequirementTest, TellsPlaceAndMessageLikeACompiler)
{
    RequirementFailed("dir/file.cpp", 17, "Failed requirement: buf != NULL", false);
    RequirementFailed("f", -3, "m", false);
    EXPECT_THAT(gTold,
                ElementsAre("dir/file.cpp(17): Failed requirement: buf != NULL", "f(-3): m"));
}

TEST_F(RequirementTest, LeavesThePlaceOutWithoutAFile)
{
    RequirementFailed(nullptr, 17, "message", false);
    RequirementFailed(kNoFile, 0, "message", false);
    EXPECT_THAT(gTold, ElementsAre("message", "message"));
}

TEST_F(RequirementTest, NullMessageIsToldAsNULL)
{
    RequirementFailed(nullptr, 0, nullptr, false);
    RequirementFailed("f", 1, nullptr, false);
    EXPECT_THAT(gTold, ElementsAre("<NULL>", "f(1): <NULL>"));
}

TEST_F(RequirementTest, ThrowsTheSameTextAfterTellingIt)
{
    try {
        RequirementFailed("f", 1, "m", true);
        FAIL() << "nothing thrown";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "f(1): m");
        EXPECT_THAT(gTold, ElementsAre("f(1): m"));
    }
}

TEST_F(RequirementTest, ReturnsWhenNotToldToThrow)
{
    EXPECT_NO_THROW(RequirementFailed("f", 1, "m", false));
}

TEST_F(RequirementTest, HandlerIsReplacedAndGivenBack)
{
    EXPECT_EQ(GetFailureHandler(), Remember);
    const FailureHandler other = [](const char*) {};
    EXPECT_EQ(SetFailureHandler(other), Remember);
    EXPECT_EQ(GetFailureHandler(), other);
    EXPECT_EQ(SetFailureHandler(nullptr), other);
    EXPECT_NE(GetFailureHandler(), nullptr);
    EXPECT_NE(GetFailureHandler(), other);
}

TEST_F(RequirementTest, CallFailureHandlerCallsTheHandlerInForce)
{
    CallFailureHandler("text");
    CallFailureHandler(nullptr);
    EXPECT_THAT(gTold, ElementsAre("text", "null"));
}

TEST_F(RequirementTest, DefaultHandlerWritesALineToStandardError)
{
    SetFailureHandler(nullptr);
    testing::internal::CaptureStderr();
    CallFailureHandler("text");
    CallFailureHandler(nullptr);
    RequirementFailed("f", 1, "m", false);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "text\n<NULL>\nf(1): m\n");
}

} // namespace
} // namespace pmutil
