#include "memory/Choice.h"

#include <gtest/gtest.h>

namespace assay_host {
namespace {

TEST(ChoiceTest, ReadsWords)
{
    const auto software = ReadChoiceWord("opengl=software");
    ASSERT_TRUE(software);
    EXPECT_EQ(software->fKind, DeviceKind::kOpenGL);
    EXPECT_EQ(software->fUsability, Usability::kSoftware);
    const auto automatic = ReadChoiceWord("opencl=auto");
    ASSERT_TRUE(automatic);
    EXPECT_EQ(automatic->fKind, DeviceKind::kOpenCL);
    EXPECT_EQ(automatic->fUsability, std::nullopt);
    EXPECT_EQ(ReadChoiceWord("opengl=hardware")->fUsability, Usability::kHardware);
    EXPECT_EQ(ReadChoiceWord("opengl=absent")->fUsability, Usability::kAbsent);
    for (const char* const word :
         {"", "=", "opengl", "opengl=", "opengl=broken", "opengl=unknown", "OpenGL=auto",
          "vulkan=auto", "opengl=auto ", "opengl=auto=auto"})
        EXPECT_FALSE(ReadChoiceWord(word)) << word;
}

TEST(ChoiceTest, ReadsWhatItWrote)
{
    Choice choice;
    EXPECT_TRUE(choice.IsEmpty());
    EXPECT_TRUE(ReadChoiceJson(MakeChoiceJson(choice)).IsEmpty());
    choice.fOpenCL = {Usability::kAbsent, 1234};
    const Choice read = ReadChoiceJson(MakeChoiceJson(choice));
    EXPECT_FALSE(read.fOpenGL);
    ASSERT_TRUE(read.fOpenCL);
    EXPECT_EQ(read.fOpenCL->fUsability, Usability::kAbsent);
    EXPECT_EQ(read.fOpenCL->fTime, 1234);
    auto json = MakeChoiceJson(choice);
    json["choice"]["opencl"]["answer"] = "broken";
    EXPECT_ANY_THROW(ReadChoiceJson(json));
    json["choice"].erase("opencl");
    EXPECT_TRUE(ReadChoiceJson(json).IsEmpty());
}

} // namespace
} // namespace assay_host
