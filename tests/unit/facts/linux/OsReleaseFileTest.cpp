// Where a distribution's file is, and which number of it is the build.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "facts/OsRelease.h"

namespace assay_host {
namespace {

namespace fs = std::filesystem;

class OsReleaseFile : public testing::Test {
protected:
    OsReleaseFile()
    {
        std::string folder = testing::TempDir() + "os-release-XXXXXX";
        EXPECT_NE(::mkdtemp(folder.data()), nullptr);
        fRoot = folder;
        fs::create_directories(fRoot + "/etc");
        fs::create_directories(fRoot + "/usr/lib");
    }
    ~OsReleaseFile() override { fs::remove_all(fRoot); }

    void Write(const std::string& path, const std::string& text) const
    {
        std::ofstream(fRoot + path, std::ios::binary) << text;
    }

    std::string fRoot;
};

TEST_F(OsReleaseFile, IsThatOfTheMachineBeforeThatOfTheDistribution)
{
    EXPECT_EQ(ReadOsRelease(fRoot), "");
    Write("/usr/lib/os-release", "NAME=usr\n");
    EXPECT_EQ(ReadOsRelease(fRoot), "NAME=usr\n");
    Write("/etc/os-release", "NAME=etc\n\xFF");
    EXPECT_EQ(ReadOsRelease(fRoot), "NAME=etc\n\xFF");
    fs::remove(fRoot + "/usr/lib/os-release");
    EXPECT_EQ(ReadOsRelease(fRoot), "NAME=etc\n\xFF");
}

TEST(OsRelease, HasABuildOrElseAVersion)
{
    EXPECT_EQ(FindOsBuild("VERSION_ID=12\nBUILD_ID=2026\n"), "2026");
    EXPECT_EQ(FindOsBuild("VERSION_ID=12\nBUILD_ID=\"\"\n"), "12");
    EXPECT_EQ(FindOsBuild("VERSION_ID=\"12\"\n"), "12");
    EXPECT_EQ(FindOsBuild("BUILD_ID=rolling\n"), "rolling");
    EXPECT_EQ(FindOsBuild("NAME=x\n"), "");
}

} // namespace
} // namespace assay_host
