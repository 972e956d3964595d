#include "report/LineForm.h"

#include <gtest/gtest.h>

namespace assay_host {
namespace {

TEST(LineForm, ReadsADevicesTag)
{
    const auto gl = ReadDeviceTag("glgpu[0]");
    ASSERT_TRUE(gl);
    EXPECT_EQ(gl->fKind, DeviceKind::kOpenGL);
    EXPECT_EQ(gl->fIndex, 0U);
    const auto cl = ReadDeviceTag("clgpu[123456789]");
    ASSERT_TRUE(cl);
    EXPECT_EQ(cl->fKind, DeviceKind::kOpenCL);
    EXPECT_EQ(cl->fIndex, 123456789U);
}

TEST(LineForm, ReadsNoTagFromAnotherText)
{
    for (const char* text :
         {"", "glgpu", "glgpu[", "glgpu[]", "glgpu[0", "glgpu0]", "glgpu[00]", "glgpu[-1]",
          "glgpu[a]", "glgpu[1234567890]", "gpu[0]", " glgpu[0]", "glgpu[0] ", "glgpu[0].",
          "glgpu[0].GLName", "glgpu[0][1]", "glgpu(0]", "glgpu[0)", "glgpu]"})
        EXPECT_FALSE(ReadDeviceTag(text)) << text;
}

TEST(LineForm, FindsTheTagInFrontOfAKey)
{
    EXPECT_EQ(GetDeviceTag("glgpu[0].GLName"), "glgpu[0]");
    EXPECT_EQ(GetDeviceTag("clgpu[17].a.b"), "clgpu[17]");
    EXPECT_EQ(GetDeviceTag("glgpu[0]."), "glgpu[0]");
    for (const char* key : {"", ".", "glgpu[0]", "glgpu[0]GLName", "glgpu[01].GLName",
                            "gputag.GL_X", "NumGLGPUs", "xglgpu[0].GLName"})
        EXPECT_FALSE(GetDeviceTag(key)) << key;
}

TEST(LineForm, KnowsWholeValuesAndStamps)
{
    const struct {
        const char* fText;
        const char* fEnd;
        bool fIsCut;
        bool fIsWhole;
        bool fIsStamp;
    } rows[] = {
        {"a=1", "\n", false, true, false},      {"a=\"1\"", "\n", false, true, true},
        {"a=\"1\"", "\r\n", false, true, true}, {"a=1", "", false, false, false},
        {"a=\"1\"", "", false, false, false},   {"a=1", "\n", true, false, false},
        {"a=\"1", "\n", true, false, false},    {"# a", "\n", false, false, false},
        {"a", "\n", false, false, false},
    };
    for (const auto& row : rows) {
        const ReportLine line = ReadLine(row.fText, row.fEnd, row.fIsCut);
        EXPECT_EQ(IsWholeValue(line), row.fIsWhole) << row.fText;
        EXPECT_EQ(IsStamp(line), row.fIsStamp) << row.fText;
    }
    EXPECT_FALSE(ReportLine().fCut);
}

} // namespace
} // namespace assay_host
