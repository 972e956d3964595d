#include "requirements/RequirementCheck.h"

#include <gtest/gtest.h>

#include <string>

#include "report/Report.h"
#include "report/ReportReader.h"

using namespace assay_host;

namespace {

Report Read(const std::string& text)
{
    ReportReader reader;
    Report report;
    report.Add(reader.Feed(text));
    report.Add(reader.Finish());
    return report;
}

std::string FindUnmetIn(const std::string& text, const std::string& requirement,
                        Verdict verdict = Verdict::kComplete)
{
    const Report report = Read(text);
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    return FindUnmet(ParseRequirement(requirement), GetAnswers(report), outcome);
}

const std::string kTwoCards = "Tester=\"x\"\n"
                              "NumGLGPUs=2\n"
                              "glgpu[0].GLVersion=\"4.1\"\n"
                              "glgpu[0].GLMemoryMB=1024\n"
                              "glgpu[0].GLName=\"Old \x1B card\"\n"
                              "glgpu[0].GLFrameBufferOK=1\n"
                              "glgpu[0].glGetIntegerv[GL_MAX_DRAW_BUFFERS]=[8]\n"
                              "glgpu[1].GLVersion=\"3.2\"\n"
                              "glgpu[1].GLMemoryMB=4096\n"
                              "glgpu[1].GLName=\"New card\"\n"
                              "glgpu[1].GLFrameBufferOK=0\n"
                              "glgpu[1].glGetIntegerv[GL_MAX_DRAW_BUFFERS]=[4]\n"
                              "NumCLGPUs=0\n"
                              "assayEnd=\"y\"\n";

TEST(RequirementCheck, OneDeviceMeetsItUnlessAllMust)
{
    const struct {
        const char* fRequirement;
        const char* fUnmet;
    } rows[] = {
        {"GLMemoryMB>=2048", ""},
        {"GLMemoryMB>=4096", ""},
        {"GLMemoryMB>4096", "glgpu[0] 1024, glgpu[1] 4096"},
        {"all GLMemoryMB>=2048", "glgpu[0] 1024"},
        {"all GLMemoryMB>=1024", ""},
        {"glgpu[0].GLMemoryMB>=2048", "glgpu[0] 1024"},
        {"glgpu[1].GLMemoryMB>=2048", ""},
        {"glgpu[2].GLMemoryMB>=2048", "there is no glgpu[2]"},
        {"GLVersion>=4.1", ""},
        {"all GLVersion>=3.10", "glgpu[1] 3.2"},
        {"all GLFrameBufferOK==1", "glgpu[1] 0"},
        {"all GLFrameBufferOK!=0", "glgpu[1] 0"},
        {"GLName==New card", ""},
        {"glgpu[0].GLName==New card", "glgpu[0] Old \\x1B card"},
        {"all glGetIntegerv[GL_MAX_DRAW_BUFFERS]>=8", "glgpu[1] [4]"},
        {"NumGLGPUs>=2", ""},
        {"NumGLGPUs>2", "2"},
        {"opengl.devices>=8", "2"},
        {"opencl.devices>=1", "0"},
        {"opencl.devices==0", ""},
        {"CLCompute>=1", "there is no OpenCL device"},
        {"all CLCompute>=1", "there is no OpenCL device"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(FindUnmetIn(kTwoCards, row.fRequirement), row.fUnmet) << row.fRequirement;
}

TEST(RequirementCheck, WhatIsNotKnownMeetsNothing)
{
    const std::string text = "Tester=\"x\"\nNumGLGPUs=1\nglgpu[0].GLVersion=\"4.1\"\n"
                             "glgpu[0].GLMemoryMB=0\nglgpu[0].GLDriverVersion=\"?\"\n";
    for (const std::string relation : {"==", "!=", "<", ">="}) {
        EXPECT_EQ(FindUnmetIn(text, "GLMemoryMB" + relation + "0").substr(0, 20),
                  "glgpu[0] not known (")
            << relation;
        EXPECT_EQ(FindUnmetIn(text, "GLDriverVersion" + relation + "0").substr(0, 20),
                  "glgpu[0] not known (")
            << relation;
    }
    EXPECT_EQ(FindUnmetIn(text, "GLMemoryMB>=1"), "glgpu[0] not known (no source has the value)");
    EXPECT_EQ(FindUnmetIn(text, "GLFrameBufferOK!=1"), "glgpu[0] not known (run ended before)");
    EXPECT_EQ(FindUnmetIn(text, "opencl.devices==0"), "not known (run ended before)");
    EXPECT_EQ(
        FindUnmetIn("Tester=\"x\"\nNumGLGPUs=1\nglgpu[0].GLVersion=\"none\"\n", "GLVersion!=1"),
        "glgpu[0] none");
}

TEST(RequirementCheck, AListThatIsNotWholeIsNoNumber)
{
    for (const std::string list : {"8]", "[8", "[8]]", "[]", "[", "]", "x8x"}) {
        const std::string text = "Tester=\"x\"\nNumGLGPUs=1\n"
                                 "glgpu[0].glGetIntegerv[GL_MAX_DRAW_BUFFERS]=" +
                                 list + "\n";
        EXPECT_EQ(FindUnmetIn(text, "glGetIntegerv[GL_MAX_DRAW_BUFFERS]>=0").substr(0, 9),
                  "glgpu[0] ")
            << list;
    }
}

TEST(RequirementCheck, WithoutALibraryThereAreNoDevices)
{
    const std::string text = "Tester=\"x\"\nNumGLGPUs=0\nassayEnd=\"y\"\n";
    EXPECT_EQ(FindUnmetIn(text, "opencl.devices==0"), "");
    EXPECT_EQ(FindUnmetIn(text, "opencl.devices>=1"), "0 (no OpenCL)");
    EXPECT_EQ(FindUnmetIn(text, "opencl.usable==absent"), "");
    EXPECT_EQ(FindUnmetIn(text, "opencl.usable!=absent"),
              "absent (There is no OpenCL library that can be used.)");
    EXPECT_EQ(FindUnmetIn(text, "opencl.usable==hardware"),
              "absent (There is no OpenCL library that can be used.)");
    EXPECT_EQ(FindUnmetIn(text, "opencl.usable!=hardware"), "");
}

TEST(RequirementCheck, DevicesAreNotKnownBeforeTheirNumber)
{
    EXPECT_EQ(FindUnmetIn("Tester=\"x\"\n", "GLVersion>=1"), "not known (run ended before)");
    EXPECT_EQ(FindUnmetIn("Tester=\"x\"\n", "glgpu[0].GLVersion>=1"),
              "not known (run ended before)");
    EXPECT_EQ(FindUnmetIn("Tester=\"x\"\nNumGLGPUs=0\nassayEnd=\"y\"\n", "CLCompute>=1"),
              "there is no OpenCL device");
}

TEST(RequirementCheck, NamesTheFirstDevices)
{
    std::string text = "Tester=\"x\"\nNumGLGPUs=10\n";
    for (int device = 0; device < 10; ++device)
        text +=
            "glgpu[" + std::to_string(device) + "].GLMemoryMB=" + std::to_string(device + 1) + "\n";
    EXPECT_EQ(FindUnmetIn(text, "GLMemoryMB>10"),
              "glgpu[0] 1, glgpu[1] 2, glgpu[2] 3, glgpu[3] 4, glgpu[4] 5, glgpu[5] 6, glgpu[6] 7, "
              "glgpu[7] 8 and 2 more");
}

TEST(RequirementCheck, MemoryHasOnlyWhatCanBeUsed)
{
    const RememberedInterface opengl = {Usability::kHardware, "It works."};
    const RememberedInterface opencl = {Usability::kUnknown, "It was not tried."};
    const struct {
        const char* fRequirement;
        const char* fUnmet;
    } rows[] = {
        {"opengl.usable==hardware", ""},
        {"opengl.usable!=broken", ""},
        {"opengl.usable!=hardware", "hardware (It works.)"},
        {"opengl.usable==software", "hardware (It works.)"},
        {"opengl.usable==unknown", "hardware (It works.)"},
        {"opencl.usable==hardware", "not known (It was not tried.)"},
        {"opencl.usable!=hardware", "not known (It was not tried.)"},
        {"opencl.usable==unknown", "not known (It was not tried.)"},
        {"opengl.devices>=0", "not kept in the state; check without --state"},
        {"opencl.devices==0", "not kept in the state; check without --state"},
        {"NumGLGPUs>=0", "not kept in the state; check without --state"},
        {"GLVersion>=1", "not kept in the state; check without --state"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(FindUnmetInMemory(ParseRequirement(row.fRequirement), opengl, opencl), row.fUnmet)
            << row.fRequirement;
}

} // namespace
