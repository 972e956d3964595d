#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "report/Activity.h"
#include "report/KnownKeys.h"

namespace assay_host {
namespace {

TEST(Activity, OfTheLineThatComesNext)
{
    const std::pair<const char*, const char*> rows[] = {
        {"Tester", "starting"},
        {"assayStart", "starting"},
        {"QGFCoreInitialized", "initializing the graphics library"},
        {"QGFOGLInitialized", "loading OpenGL"},
        {"OGLContextCreated", "creating a first OpenGL context"},
        {"NumGLGPUs", "creating an OpenGL context on each display device"},
        {"glgpu[12].CanCompileProgramGLSL", "compiling shaders"},
        {"glgpu[0].GLFrameBufferOK", "drawing to a framebuffer"},
        {"NumCLGPUs", "loading OpenCL and listing its devices"},
        {"clgpu[0].CLBandwidth", "measuring the copy bandwidth"},
        {"clgpu[0].CLCompute", "measuring the compute speed"},
        {"assayEnd", "ending the tests"},
    };
    for (const auto& [key, text] : rows)
        EXPECT_EQ(GetActivityText(key), std::string(text) + " (" + key + ")");
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
