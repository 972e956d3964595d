#include <gtest/gtest.h>

#include <set>
#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/Answers.h"

namespace assay_host {
namespace {

// Returns the answer of the sample's first device after replacing one of its values.
Unknown Judge(const std::string& key, const std::string& value)
{
    const bool isGL = key.rfind("CL", 0) != 0 && key != "IsIntegratedCLGPU";
    Sample sample = isGL ? Sample(1, 0) : Sample(0, 1);
    const Report report =
        ReadReport(sample.Set((isGL ? "glgpu[0]." : "clgpu[0].") + key, value).GetText());
    const Answers answers = GetAnswers(report);
    for (const Answer& answer : answers.fDevices.at(0).fAnswers)
        if (answer.fKey == key)
            return answer.fUnknown;
    ADD_FAILURE() << key;
    return Unknown::kNot;
}

TEST(Unknown, IsNoValueOfAGoodMachine)
{
    const Report report = ReadReport(Sample(2, 2).GetText());
    for (const DeviceAnswers& device : GetAnswers(report).fDevices) {
        for (const Answer& answer : device.fAnswers) {
            EXPECT_EQ(answer.fUnknown, Unknown::kNot) << answer.fKey;
            EXPECT_TRUE(answer.IsKnown()) << answer.fKey;
        }
    }
}

TEST(Unknown, IsNamedByItsReason)
{
    EXPECT_STREQ(GetUnknownText(Unknown::kNot), "");
    EXPECT_STREQ(GetUnknownText(Unknown::kCut), "only the beginning of the line came");
    EXPECT_STREQ(GetUnknownText(Unknown::kEmpty), "the driver returned an empty text");
    EXPECT_STREQ(GetUnknownText(Unknown::kNoAdapter),
                 "no adapter of the system matches the device");
    EXPECT_STREQ(GetUnknownText(Unknown::kNotListed), "the system's adapter lists do not have it");
    EXPECT_STREQ(GetUnknownText(Unknown::kNoFigure), "no source has the value");
    EXPECT_STREQ(GetUnknownText(Unknown::kNoTime), "the device's clock reported no elapsed time");
    EXPECT_STREQ(GetUnknownText(Unknown::kImplausible), "the device's clock is unreliable");
}

TEST(Unknown, HasAFormForEachKindOfKey)
{
    EXPECT_EQ(Judge("GLDriver", "\"?\""), Unknown::kNotListed);
    EXPECT_EQ(Judge("GLDriverVersion", "\"?\""), Unknown::kNotListed);
    EXPECT_EQ(Judge("GLDriverDate", "\"?\""), Unknown::kNotListed);
    EXPECT_EQ(Judge("GLVendor", "\"\""), Unknown::kEmpty);
    EXPECT_EQ(Judge("CLDriverVersion", "\"\""), Unknown::kEmpty);
    EXPECT_EQ(Judge("GLName", "\"\""), Unknown::kNoAdapter);
    EXPECT_EQ(Judge("GLVendorID", "0"), Unknown::kNoAdapter);
    EXPECT_EQ(Judge("GLRendererID", "0"), Unknown::kNoAdapter);
    EXPECT_EQ(Judge("CLVendorID", "0"), Unknown::kNoFigure);
    EXPECT_EQ(Judge("GLMemoryMB", "0"), Unknown::kNoFigure);
    EXPECT_EQ(Judge("CLMemoryMB", "0"), Unknown::kNoFigure);
    EXPECT_EQ(Judge("CLBandwidth", "0"), Unknown::kNoTime);
    EXPECT_EQ(Judge("CLBandwidth", "1.1e+13"), Unknown::kImplausible);
    EXPECT_EQ(Judge("CLCompute", "nan"), Unknown::kImplausible);
    EXPECT_EQ(Judge("CLCompute", "1e+08"), Unknown::kNot);
    EXPECT_EQ(Judge("CLCompute", "1.00001e+08"), Unknown::kImplausible);
    EXPECT_EQ(Judge("CLCompute", "100000001"), Unknown::kImplausible);
    EXPECT_EQ(Judge("CLBandwidth", "10000000000001"), Unknown::kImplausible);
    EXPECT_EQ(Judge("CLCompute", "0"), Unknown::kNoTime);
    EXPECT_EQ(Judge("CLCompute", "-1"), Unknown::kImplausible);
    EXPECT_EQ(Judge("CLBandwidth", "1e+13"), Unknown::kNot);
    for (const char* small : {"0.5", "1", "1e-300"})
        EXPECT_EQ(Judge("CLBandwidth", small), Unknown::kNot) << small;
}

TEST(Unknown, IsNoZeroThatIsAnAnswer)
{
    for (const char* key : {"IsIntegratedGLGPU", "HasGLNPOTSupport", "CanCompileProgramGLSL",
                            "GLFrameBufferOK", "GLRectTextureSize"})
        EXPECT_EQ(Judge(key, "0"), Unknown::kNot) << key;
    EXPECT_EQ(Judge("glGetIntegerv[GL_MAX_TEXTURE_UNITS]", "[0]"), Unknown::kNot);
    EXPECT_EQ(Judge("IsIntegratedCLGPU", "0"), Unknown::kNot);
    EXPECT_EQ(Judge("GLMemoryMB", "many"), Unknown::kNot);
}

TEST(Unknown, IsWhatFollowsFromAMissingAdapter)
{
    const Report report = ReadReport(Sample(1, 0).Set("glgpu[0].GLVendorID", "0").GetText());
    const Answers answers = GetAnswers(report);
    std::set<std::string> keys;
    for (const Answer& answer : answers.fDevices.at(0).fAnswers)
        if (answer.fUnknown == Unknown::kNoAdapter)
            keys.insert(answer.fKey);
    EXPECT_EQ(keys, (std::set<std::string>{"IsIntegratedGLGPU", "GLVendorID"}));
}

TEST(Unknown, IsALineThatBrokeOff)
{
    const Report report = ReadReport("glgpu[0].GLMemoryMB=40");
    const Answers answers = GetAnswers(report);
    EXPECT_EQ(answers.fDevices.at(0).fAnswers.at(2).fUnknown, Unknown::kCut);
    EXPECT_FALSE(answers.fDevices.at(0).fAnswers.at(2).IsKnown());
    EXPECT_FALSE(answers.fDevices.at(0).fAnswers.at(3).IsKnown()); // missing
    EXPECT_EQ(answers.fDevices.at(0).fAnswers.at(3).fUnknown, Unknown::kNot);
}

TEST(Unknown, HasATextForEachReason)
{
    std::set<std::string> texts;
    for (int reason = 0; reason <= static_cast<int>(Unknown::kImplausible); ++reason)
        texts.insert(GetUnknownText(static_cast<Unknown>(reason)));
    EXPECT_EQ(texts.size(), static_cast<std::size_t>(Unknown::kImplausible) + 1);
    EXPECT_EQ(texts.count(""), 1U);
}

} // namespace
} // namespace assay_host
