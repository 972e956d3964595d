// The check of what is remembered, from its options to its status and its output.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <stdexcept>
#include <string>

#include <boost/filesystem/operations.hpp>

#include "app/Commands.h"
#include "support/TempPath.h"

namespace assay_host {
namespace {

using testing::HasSubstr;
using testing::ThrowsMessage;

class CheckStateTest : public testing::Test {
protected:
    CheckStateTest() { Remove(); }
    ~CheckStateTest() override { Remove(); }

    int CheckAll(const std::string& requirement)
    {
        CheckChoice choice;
        choice.fRequirements = {requirement};
        choice.fState = fFolder;
        testing::internal::CaptureStdout();
        try {
            const int status = Check(choice);
            fText = testing::internal::GetCapturedStdout();
            return status;
        } catch (...) {
            testing::internal::GetCapturedStdout();
            throw;
        }
    }

    // That of MinGW's std::filesystem doesn't return if a file disappears at the same time.
    void Remove() const { boost::filesystem::remove_all(fFolder); }

    const std::string fFolder = MakeTempPath("assay-check-state");
    std::string fText;
};

TEST_F(CheckStateTest, FailsForAFolderThatIsNotThere)
{
    EXPECT_THAT([this] { CheckAll("opengl.usable==hardware"); },
                ThrowsMessage<std::runtime_error>(HasSubstr(fFolder + ": ")));
    EXPECT_FALSE(std::filesystem::exists(fFolder));
}

TEST_F(CheckStateTest, NothingIsMetByAnEmptyFolder)
{
    std::filesystem::create_directory(fFolder);
    EXPECT_EQ(CheckAll("opencl.usable!=broken"), kUnmetStatus);
    EXPECT_EQ(fText, "not met: opencl.usable!=broken: not known (OpenCL has not been tried.)\n");
    EXPECT_TRUE(std::filesystem::is_empty(fFolder));
}

} // namespace
} // namespace assay_host
