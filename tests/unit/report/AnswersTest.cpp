#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/Answers.h"

namespace assay_host {
namespace {

// Returns the key's value, or "- REASON" if it is missing. An empty tag is for a key without one.
std::string Show(const Answers& answers, const std::string& tag, const std::string& key)
{
    const std::vector<Answer>* list = tag.empty() ? &answers.fReport : nullptr;
    for (const DeviceAnswers& device : answers.fDevices)
        if (device.fTag == tag)
            list = &device.fAnswers;
    if (!list)
        return "no device";
    for (const Answer& answer : *list) {
        if (answer.fKey == key)
            return answer.fLine ? answer.fLine->fValue
                                : std::string("- ") + GetMissingText(answer.fMissing);
    }
    return "no key";
}

std::string Next(const std::string& text)
{
    return GetAnswers(ReadReport(text)).fNext;
}

TEST(KnownKeys, AreInTheOrderOfAWholeReport)
{
    const Table<KnownKey> gl = GetDeviceKeys(DeviceKind::kOpenGL);
    ASSERT_EQ(gl.size(), std::size(kSampleGL));
    for (std::size_t key = 0; key < gl.size(); ++key)
        EXPECT_EQ(gl[key].fKey, kSampleGL[key].fKey);
    const Table<KnownKey> cl = GetDeviceKeys(DeviceKind::kOpenCL);
    ASSERT_EQ(cl.size(), std::size(kSampleCL));
    for (std::size_t key = 0; key < cl.size(); ++key)
        EXPECT_EQ(cl[key].fKey, kSampleCL[key].fKey);
    EXPECT_EQ(GetReportKeys().size(), 8U);
}

TEST(Answers, OfAWholeReportHaveAllLines)
{
    const Report report = ReadReport(Sample(2, 1).GetText());
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(answers.fNext, "");
    EXPECT_EQ(answers.fDevicesLeftOut, 0U);
    EXPECT_EQ(answers.fReport.size(), 8U);
    ASSERT_EQ(answers.fDevices.size(), 3U);
    EXPECT_EQ(answers.fDevices[0].fTag, "glgpu[0]");
    EXPECT_EQ(answers.fDevices[1].fTag, "glgpu[1]");
    EXPECT_EQ(answers.fDevices[1].fIndex, 1U);
    EXPECT_EQ(answers.fDevices[2].fTag, "clgpu[0]");
    EXPECT_EQ(answers.fDevices[2].fKind, DeviceKind::kOpenCL);
    for (const DeviceAnswers& device : answers.fDevices) {
        EXPECT_TRUE(device.fComplete);
        EXPECT_FALSE(device.fFailed);
        for (const Answer& answer : device.fAnswers) {
            EXPECT_TRUE(answer.fLine) << answer.fKey;
            EXPECT_TRUE(answer.fKnown) << answer.fKey;
        }
    }
}

TEST(Answers, NameNoFailureOfADeviceWithoutCUDA)
{
    const Report without = ReadReport(
        Sample(0, 1).Set("clgpu[0].CUDASupported", "0").Set("clgpu[0].CUDAVersion", "").GetText());
    EXPECT_EQ(Show(GetAnswers(without), "clgpu[0]", "CUDAVersion"), "- not printed by this device");
    EXPECT_FALSE(GetAnswers(without).fDevices.at(0).fFailed);
    const Report nameless = ReadReport(Sample(0, 1).Set("clgpu[0].CUDAVersion", "").GetText());
    EXPECT_EQ(Show(GetAnswers(nameless), "clgpu[0]", "CUDAVersion"),
              "- not printed by this device");
    const Report ended = ReadReport(Sample(0, 1)
                                        .Set("clgpu[0].CUDASupported", "0")
                                        .EndAfter("clgpu[0].CUDASupported")
                                        .GetText());
    EXPECT_EQ(Show(GetAnswers(ended), "clgpu[0]", "CUDAVersion"), "- not printed by this device");
    EXPECT_EQ(Show(GetAnswers(ended), "clgpu[0]", "CLBandwidth"), "- run ended before");
    EXPECT_STREQ(GetMissingText(Missing::kNot), "");
}

TEST(Answers, HaveTheLowerBoundsOfTheOutcome)
{
    RunOutcome outcome;
    outcome.fLowerBounds = {{"clgpu[1].CLBandwidth", 5}};
    const Report report = ReadReport(Sample(0, 2).GetText() + "clgpu[1].Extra=1\n");
    const Answers answers = GetAnswers(report, outcome);
    for (const DeviceAnswers& device : answers.fDevices)
        for (const Answer& answer : device.fAnswers)
            EXPECT_EQ(answer.fLowerBound,
                      device.fTag + "." + answer.fKey == "clgpu[1].CLBandwidth" ? 5 : 0)
                << answer.fKey;
}

TEST(Answers, NameTheFailedDevices)
{
    const Report report = ReadReport(
        Sample(2, 2).Fail("glgpu[0]", "GLMemoryMB").Fail("clgpu[1]", "CUDAVersion").GetText());
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(Show(answers, "glgpu[0]", "IsIntegratedGLGPU"), "0");
    EXPECT_EQ(Show(answers, "glgpu[0]", "GLMemoryMB"), "- device failed before");
    EXPECT_EQ(Show(answers, "glgpu[0]", "extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]"),
              "- device failed before");
    EXPECT_EQ(Show(answers, "clgpu[1]", "CUDASupported"), "1");
    EXPECT_EQ(Show(answers, "clgpu[1]", "CUDAVersion"), "- device failed before");
    EXPECT_EQ(Show(answers, "clgpu[1]", "CLCompute"), "- device failed before");
    EXPECT_TRUE(answers.fDevices[0].fFailed);
    EXPECT_FALSE(answers.fDevices[0].fComplete);
    EXPECT_FALSE(answers.fDevices[1].fFailed);
    EXPECT_TRUE(answers.fDevices[1].fComplete);
    EXPECT_FALSE(answers.fDevices[2].fFailed);
    EXPECT_TRUE(answers.fDevices[3].fFailed);
}

TEST(Answers, DistinguishFailedDevicesFromTheCurrentOne)
{
    const Report report =
        ReadReport(Sample(3, 0).Fail("glgpu[0]", "GLName").EndAfter("glgpu[1].GLVendor").GetText());
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(Show(answers, "glgpu[0]", "GLName"), "- device failed before");
    EXPECT_EQ(Show(answers, "glgpu[0]", "GLFrameBufferOK"), "- device failed before");
    EXPECT_EQ(Show(answers, "glgpu[1]", "GLVendor"), "Example Corporation");
    EXPECT_EQ(Show(answers, "glgpu[1]", "GLVendorID"), "- run ended before");
    EXPECT_EQ(Show(answers, "glgpu[2]", "GLName"), "Accelerator 4000");
    EXPECT_EQ(Show(answers, "glgpu[2]", "GLVendor"), "- run ended before");
    EXPECT_EQ(Show(answers, "", "NumCLGPUs"), "- run ended before");
    EXPECT_EQ(Show(answers, "", "assayEnd"), "- run ended before");
    EXPECT_EQ(answers.fNext, "glgpu[2].GLVendor");
}

TEST(Answers, TakeAFailureFromTheLog)
{
    const std::string text = Sample(1, 0).EndAfter("glgpu[0].GLName").GetText();
    EXPECT_EQ(Show(GetAnswers(ReadReport(text)), "glgpu[0]", "GLVendor"), "- run ended before");
    const Report report = ReadReport(text + "# 00009.x Testing terminated for glgpu[0]\n");
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(Show(answers, "glgpu[0]", "GLVendor"), "- device failed before");
    EXPECT_TRUE(answers.fDevices.at(0).fFailed);
    EXPECT_EQ(answers.fNext, "NumCLGPUs");
    const Report other = ReadReport(text + "Testing terminated for glgpu[0]\n");
    EXPECT_FALSE(GetAnswers(other).fDevices.at(0).fFailed);
}

TEST(Answers, IncludeDevicesThatAreOnlyCounted)
{
    const Report ended = ReadReport(Sample(2, 0).EndAfter("NumGLGPUs").GetText());
    EXPECT_EQ(GetAnswers(ended).fDevices.size(), 2U);
    EXPECT_EQ(Show(GetAnswers(ended), "glgpu[1]", "GLVersion"), "- run ended before");
    const Report failed = ReadReport(Sample(1, 0).Fail("glgpu[0]", "GLVersion").GetText());
    EXPECT_EQ(Show(GetAnswers(failed), "glgpu[0]", "GLVersion"), "- device failed before");
}

TEST(Answers, FindNoLinesOfADeviceThatIsCountedTooLate)
{
    const Report report =
        ReadReport("glgpu[0].GLVersion=\"4.1\"\nNumGLGPUs=2\nglgpu[0].IsIntegratedGLGPU=0\n");
    EXPECT_EQ(Show(GetAnswers(report), "glgpu[1]", "GLVersion"), "- no readable line");
    EXPECT_EQ(Show(GetAnswers(report), "glgpu[1]", "GLName"), "- run ended before");
}

TEST(Answers, NameTheLackOfOpenCL)
{
    const Report report = ReadReport(Sample(1, -1).GetText());
    EXPECT_EQ(Show(GetAnswers(report), "", "NumCLGPUs"), "- no OpenCL");
    const Report none = ReadReport(Sample(1, 0).GetText());
    EXPECT_EQ(Show(GetAnswers(none), "", "NumCLGPUs"), "0");
}

TEST(Answers, DistinguishALostLineFromAFailure)
{
    const Report report = ReadReport(Sample(1, 1)
                                         .Set("glgpu[0].GLName", "\"open")
                                         .Set("NumCLGPUs", "")
                                         .Set("Tester", "")
                                         .GetText());
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(Show(answers, "glgpu[0]", "GLName"), "- no readable line");
    EXPECT_EQ(Show(answers, "", "NumCLGPUs"), "- no readable line");
    EXPECT_EQ(Show(answers, "", "Tester"), "- no readable line");
    EXPECT_FALSE(answers.fDevices[0].fFailed);
}

TEST(Answers, IncludeUnknownKeys)
{
    const Report report =
        ReadReport("Extra=1\nglgpu[0].Extra=2\nglgpu[7].GLName=\"x\"\ngputag.GL_X=3\nExtra=4\n");
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(Show(answers, "", "Extra"), "4");
    EXPECT_EQ(Show(answers, "", "gputag.GL_X"), "3");
    EXPECT_EQ(answers.fReport.size(), 10U);
    EXPECT_EQ(Show(answers, "glgpu[0]", "Extra"), "2");
    EXPECT_EQ(answers.fDevices[0].fAnswers.back().fKnown, nullptr);
    EXPECT_EQ(answers.fDevices[1].fIndex, 7U);
}

TEST(Answers, OfAnEmptyReportHaveNoLines)
{
    const Report report;
    const Answers answers = GetAnswers(report);
    EXPECT_TRUE(answers.fDevices.empty());
    EXPECT_EQ(answers.fReport.size(), 8U);
    for (const Answer& answer : answers.fReport)
        EXPECT_EQ(answer.fMissing, Missing::kRunEnded);
    EXPECT_EQ(answers.fNext, "Tester");
}

TEST(Answers, LimitTheNumberOfDevices)
{
    const Report counted = ReadReport("NumGLGPUs=18446744073709551615\nNumCLGPUs=x\n");
    EXPECT_EQ(GetAnswers(counted).fDevices.size(), 256U);
    std::string text;
    for (int index = 999; index >= 0; --index)
        text += "clgpu[" + std::to_string(index) + "].CLName=\"x\"\n";
    const Report named = ReadReport(text);
    EXPECT_EQ(GetAnswers(named).fDevices.size(), 256U);
    EXPECT_EQ(GetAnswers(named).fDevices.back().fTag, "clgpu[255]");
    EXPECT_EQ(GetAnswers(named).fDevicesLeftOut, 744U);
}

TEST(Answers, NameTheNextLine)
{
    const auto ended = [](const char* key) { return Next(Sample(2, 2).EndAfter(key).GetText()); };
    EXPECT_EQ(ended("Tester"), "assayStart");
    EXPECT_EQ(ended("OGLContextCreated"), "NumGLGPUs");
    EXPECT_EQ(ended("NumGLGPUs"), "glgpu[0].GLVersion");
    EXPECT_EQ(ended("glgpu[0].GLFrameBufferOK"), "glgpu[1].GLFrameBufferOK");
    EXPECT_EQ(ended("glgpu[1].GLFrameBufferOK"), "gputag.GL_SHADING_LANGUAGE_VERSION");
    EXPECT_EQ(ended("glgpu[1].extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]"), "NumCLGPUs");
    EXPECT_EQ(ended("NumCLGPUs"), "clgpu[0].CLPlatformVersion");
    EXPECT_EQ(ended("clgpu[1].CLCompute"), "assayEnd");
    EXPECT_EQ(Next(Sample(0, 0).EndAfter("NumGLGPUs").GetText()), "NumCLGPUs");
    EXPECT_EQ(Next(Sample(0, 0).EndAfter("NumCLGPUs").GetText()), "assayEnd");
}

TEST(Answers, SkipDevicesThatPrintNothingNext)
{
    EXPECT_EQ(Next(Sample(2, 0).Fail("glgpu[1]", "GLName").EndAfter("glgpu[0].GLVendor").GetText()),
              "glgpu[0].GLVendorID");
    EXPECT_EQ(Next(Sample(0, 1)
                       .Set("clgpu[0].CUDASupported", "0")
                       .EndAfter("clgpu[0].CUDASupported")
                       .GetText()),
              "clgpu[0].CLBandwidth");
    EXPECT_EQ(Next(Sample(0, 1).EndAfter("clgpu[0].CUDASupported").GetText()),
              "clgpu[0].CUDAVersion");
    const std::string text = Sample(1, 0).EndAfter("glgpu[0].GLFrameBufferOK").GetText();
    EXPECT_EQ(Next(text + "gputag.GL_SHADING_LANGUAGE_VERSION=35724\n# log\nraw\nX=1\n"),
              "glgpu[0].glGetString[GL_SHADING_LANGUAGE_VERSION]");
}

} // namespace
} // namespace assay_host
