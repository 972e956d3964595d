#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "identity/Identity.h"

namespace assay_host {
namespace {

TEST(RealMachine, HasTheLoaderOfOpenGL)
{
    const Identity identity = GetIdentity("gone.exe");
    const auto file = std::find_if(
        identity.fFiles.begin(), identity.fFiles.end(), [](const DriverFile& candidate) {
            std::string path = candidate.fPath;
            std::transform(path.begin(), path.end(), path.begin(), [](char letter) {
                return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter + 32) : letter;
            });
            return path == R"(c:\windows\system32\opengl32.dll)";
        });
    ASSERT_NE(file, identity.fFiles.end());
    EXPECT_EQ(file->fInterface, DeviceKind::kOpenGL);
    EXPECT_GT(file->fSize, 0U);
    EXPECT_GT(file->fTime, 0);
    EXPECT_EQ(identity.fAssayVersion, "");
}

TEST(RealMachine, StaysTheSame)
{
    const Identity identity = GetIdentity("gone.exe");
    EXPECT_EQ(GetIdentity("gone.exe"), identity);
    EXPECT_NE(identity.fSystem, "");
}

} // namespace
} // namespace assay_host
