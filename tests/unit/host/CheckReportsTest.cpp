// The check of stored reports, from its options to its status and its output.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>

#include "app/Commands.h"

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
        testing::internal::CaptureStdout();
        const int status = Check(choice);
        fText = testing::internal::GetCapturedStdout();
        return status;
    }

    const std::string fOne = testing::TempDir() + "assay-check-one";
    const std::string fTwo = testing::TempDir() + "assay-check-two";
    std::string fText;

private:
    static void Write(const std::string& path, const std::string& text)
    {
        std::ofstream(path, std::ios::binary) << text;
    }
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

TEST_F(CheckReportsTest, FailsForAFileThatIsNotThere)
{
    EXPECT_EQ(CheckAll("NumGLGPUs>=1", {fOne + ".none"}), kErrorStatus);
    EXPECT_EQ(CheckAll("NumGLGPUs>=1", {fOne + ".none", fTwo}), kErrorStatus);
}

} // namespace
} // namespace assay_host
