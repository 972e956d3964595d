// The check of stored reports, from its options to its status and its output.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>

#include "app/Commands.h"
#include "support/TempPath.h"

namespace assay_host {
namespace {

using testing::HasSubstr;
using testing::Not;

class CheckReportsTest : public testing::Test {
protected:
    CheckReportsTest()
    {
        Write(fOne, "assayStart=\"x\"\nNumGLGPUs=1\n");
        Write(fTwo, "assayStart=\"x\"\nNumGLGPUs=2\n");
    }
    ~CheckReportsTest() override
    {
        std::remove(fOne.c_str());
        std::remove(fTwo.c_str());
    }

    int CheckAll(const std::string& requirement, const std::vector<std::string>& reports)
    {
        CheckChoice choice;
        choice.fRequirements = {requirement};
        choice.fReports = reports;
        return CheckAll(choice);
    }

    int CheckAll(const CheckChoice& choice)
    {
        testing::internal::CaptureStdout();
        const int status = Check(choice);
        fText = testing::internal::GetCapturedStdout();
        return status;
    }

    static void Write(const std::string& path, const std::string& text)
    {
        std::ofstream(path, std::ios::binary) << text;
    }

    const std::string fOne = MakeTempPath("assay-check-one");
    const std::string fTwo = MakeTempPath("assay-check-two");
    std::string fText;
};

TEST_F(CheckReportsTest, HasTheStatusOfWhetherAllMeetAll)
{
    EXPECT_EQ(CheckAll("NumGLGPUs>=1", {fOne, fTwo}), 0);
    EXPECT_EQ(CheckAll("NumGLGPUs>=2", {fTwo}), 0);
    EXPECT_EQ(CheckAll("NumGLGPUs>=2", {fOne}), kUnmetStatus);
    EXPECT_EQ(CheckAll("NumGLGPUs>=2", {fOne, fTwo}), kUnmetStatus);
    EXPECT_EQ(CheckAll("NumGLGPUs>=2", {fTwo, fOne}), kUnmetStatus);
    EXPECT_EQ(CheckAll("NumGLGPUs>=3", {fOne, fTwo}), kUnmetStatus);
}

TEST_F(CheckReportsTest, NamesTheReportsIfThereAreMore)
{
    CheckAll("NumGLGPUs>=2", {fOne});
    EXPECT_THAT(fText, Not(HasSubstr(fOne)));
    EXPECT_THAT(fText, HasSubstr("NumGLGPUs>=2"));
    CheckAll("NumGLGPUs>=2", {fOne, fTwo});
    EXPECT_THAT(fText, HasSubstr(fOne + ": "));
}

// A measurement may be larger, and smaller by the tolerance.
TEST_F(CheckReportsTest, HoldsMeasurementsToABaseline)
{
    const auto write = [](const std::string& path, const std::string& score) {
        Write(path, "assayStart=\"x\"\nNumGLGPUs=0\nNumCLGPUs=1\nclgpu[0].CLCompute=" + score +
                        "\nassayEnd=\"y\"\n");
    };
    write(fOne, "100");
    CheckChoice choice;
    choice.fBaseline = fOne;
    choice.fReports = {fTwo};
    write(fTwo, "200");
    EXPECT_EQ(CheckAll(choice), 0);
    EXPECT_EQ(fText, "met: the baseline\n");
    write(fTwo, "91");
    EXPECT_EQ(CheckAll(choice), 0);
    write(fTwo, "89");
    EXPECT_EQ(CheckAll(choice), kUnmetStatus);
    EXPECT_THAT(fText, HasSubstr("not as the baseline: clgpu[0].CLCompute: 100 -> 89"));
    EXPECT_THAT(fText, Not(HasSubstr("met: ")));
    choice.fTolerance = 0.2;
    EXPECT_EQ(CheckAll(choice), 0);
    choice.fRequirements = {"NumCLGPUs>=1", "NumGLGPUs==0"};
    EXPECT_EQ(CheckAll(choice), 0);
    EXPECT_EQ(fText, "met: all 2 requirements and the baseline\n");
    choice.fRequirements = {"NumCLGPUs>=2"};
    EXPECT_EQ(CheckAll(choice), kUnmetStatus);
    EXPECT_EQ(fText, "not met: NumCLGPUs>=2: 1\n");
}

TEST_F(CheckReportsTest, FailsForAFileThatIsNotThere)
{
    EXPECT_EQ(CheckAll("NumGLGPUs>=1", {fOne + ".none"}), kErrorStatus);
    EXPECT_EQ(CheckAll("NumGLGPUs>=1", {fOne + ".none", fTwo}), kErrorStatus);
}

} // namespace
} // namespace assay_host
