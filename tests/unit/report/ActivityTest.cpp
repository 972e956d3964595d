#include <gtest/gtest.h>

#include <string>

#include "report/Activity.h"
#include "report/KnownKeys.h"

namespace assay_host {
namespace {

TEST(Activity, OfTheLineThatComesNext)
{
    EXPECT_EQ(GetActivityText("Tester"), "starting (Tester)");
    EXPECT_EQ(GetActivityText("NumGLGPUs"),
              "creating an OpenGL context on each display device (NumGLGPUs)");
    EXPECT_EQ(GetActivityText("glgpu[12].CanCompileProgramGLSL"),
              "compiling shaders (glgpu[12].CanCompileProgramGLSL)");
    EXPECT_EQ(GetActivityText("clgpu[0].CLBandwidth"),
              "measuring the copy bandwidth (clgpu[0].CLBandwidth)");
    EXPECT_EQ(GetActivityText("glgpu[0].GLName"), "reading facts of a device (glgpu[0].GLName)");
    EXPECT_EQ(GetActivityText("gputag.GL_MAX_TEXTURE_UNITS"),
              "reading facts of a device (gputag.GL_MAX_TEXTURE_UNITS)");
}

// None but a device's line is about facts of a device.
TEST(Activity, EveryLineOfTheRunHasItsOwn)
{
    for (const KnownKey* const key : GetReportKeys())
        EXPECT_EQ(GetActivityText(key->fKey).find("reading facts"), std::string::npos) << key->fKey;
}

} // namespace
} // namespace assay_host
