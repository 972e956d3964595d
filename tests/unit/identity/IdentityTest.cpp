#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include "identity/Identity.h"

namespace assay_host {
namespace {

Identity MakeSample()
{
    Identity identity;
    identity.fAdapters = {{"0000:01:00.0", 0x10DE, 0x2484, "nvidia", "550.54.15"},
                          {"0000:00:02.0", 0x8086, 0xA7A0, "i915", ""}};
    identity.fFiles = {{DeviceKind::kOpenCL, "/usr/lib/libOpenCL.so.1.0.0", 100, 2, "ab"},
                       {DeviceKind::kOpenGL, "/usr/lib/libEGL.so.1.1.0", 200, 1, ""}};
    identity.fVariables = {"DRI_PRIME=1"};
    identity.fSystem = "Debian; 6.12";
    identity.fAssayVersion = "1.0.0";
    SortIdentity(identity);
    return identity;
}

TEST(Identity, DiffersByEveryField)
{
    const std::vector<std::function<void(Identity&)>> changes = {
        [](Identity& i) { i.fAdapters[0].fSlot = "0000:00:03.0"; },
        [](Identity& i) { i.fAdapters[0].fVendor = 0x1002; },
        [](Identity& i) { i.fAdapters[0].fDevice = 1; },
        [](Identity& i) { i.fAdapters[0].fDriver = "xe"; },
        [](Identity& i) { i.fAdapters[0].fDriverVersion = "1"; },
        [](Identity& i) { i.fAdapters.pop_back(); },
        [](Identity& i) { i.fFiles[0].fInterface = DeviceKind::kOpenCL; },
        [](Identity& i) { i.fFiles[0].fPath += "x"; },
        [](Identity& i) { ++i.fFiles[0].fSize; },
        [](Identity& i) { ++i.fFiles[0].fTime; },
        [](Identity& i) { i.fFiles[0].fBuildId = "cd"; },
        [](Identity& i) { i.fFiles.pop_back(); },
        [](Identity& i) { i.fVariables[0] = "DRI_PRIME=0"; },
        [](Identity& i) { i.fVariables.pop_back(); },
        [](Identity& i) { i.fSystem = "Debian; 6.13"; },
        [](Identity& i) { i.fAssayVersion = "1.0.1"; },
    };
    EXPECT_EQ(MakeSample(), MakeSample());
    EXPECT_FALSE(MakeSample() != MakeSample());
    for (std::size_t index = 0; index < changes.size(); ++index) {
        Identity changed = MakeSample();
        changes[index](changed);
        EXPECT_NE(changed, MakeSample()) << "change " << index;
        EXPECT_FALSE(changed == MakeSample()) << "change " << index;
    }
}

TEST(Identity, IsTheSameInAnyOrder)
{
    Identity identity = MakeSample();
    EXPECT_EQ(identity.fAdapters[0].fSlot, "0000:00:02.0");
    EXPECT_EQ(identity.fFiles[0].fPath, "/usr/lib/libEGL.so.1.1.0");
    std::swap(identity.fAdapters[0], identity.fAdapters[1]);
    std::swap(identity.fFiles[0], identity.fFiles[1]);
    identity.fFiles.push_back(identity.fFiles[0]);
    EXPECT_NE(identity, MakeSample());
    SortIdentity(identity);
    EXPECT_EQ(identity, MakeSample());
}

} // namespace
} // namespace assay_host
