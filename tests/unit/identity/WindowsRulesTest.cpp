#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "identity/WindowsRules.h"

namespace assay_host {
namespace {

const std::string kCard = R"(PCI\VEN_10DE&DEV_2484&SUBSYS_40C11458&REV_A1\4&1&0&0008)";
const std::string kEnum = R"(SYSTEM\CurrentControlSet\Enum\)";
const std::string kClass = R"(SYSTEM\CurrentControlSet\Control\Class\)";
const std::string kDisplay = "{4d36e968-e325-11ce-bfc1-08002be10318}";
const std::string kComponent = "{5c4c3332-344d-483c-8739-259e934c9cc8}";
const std::string kVendors = R"(SOFTWARE\Khronos\OpenCL\Vendors)";
const std::string kSystem = R"(C:\Windows\System32\)";

RegistryValue MakeText(const std::string& name, const std::string& text)
{
    return {name, {text}, {}};
}

// A registry and files in memory.
class FakeWindows : public WindowsSource {
public:
    std::vector<std::string> ListKeys(const std::string& key) override
    {
        std::set<std::string> keys;
        for (const auto& [path, values] : fKeys)
            if (path.compare(0, key.size() + 1, key + "\\") == 0)
                keys.insert(
                    path.substr(key.size() + 1, path.find('\\', key.size() + 1) - key.size() - 1));
        return {keys.begin(), keys.end()};
    }

    std::vector<RegistryValue> ListValues(const std::string& key) override { return fKeys[key]; }

    std::vector<std::string> ListPresentDevices(const std::string& classId) override
    {
        return fDevices[classId];
    }

    std::optional<DriverFile> FindFile(const std::string& path) override
    {
        const auto file = fFiles.find(path);
        if (file == fFiles.end())
            return std::nullopt;
        DriverFile found;
        found.fPath = path;
        found.fSize = file->second;
        return found;
    }

    std::string GetSystemFolder() override { return R"(C:\Windows\System32)"; }
    std::string GetVariable(const std::string& name) override { return fVariables[name]; }

    std::map<std::string, std::vector<RegistryValue>> fKeys;
    std::map<std::string, std::vector<std::string>> fDevices; // by class
    std::map<std::string, std::uint64_t> fFiles;              // sizes by path
    std::map<std::string, std::string> fVariables;
};

class WindowsRulesTest : public testing::Test {
protected:
    WindowsRulesTest()
    {
        fWindows.fFiles = {{kSystem + "opengl32.dll", 1},   {kSystem + "OpenCL.dll", 2},
                           {R"(C:\Store\nvoglv64.dll)", 3}, {R"(C:\Store\nvopencl64.dll)", 4},
                           {kSystem + "igdrcl64.dll", 5},   {R"(C:\Other\pocl.dll)", 6},
                           {kSystem + "ig9icd64.dll", 7}};
        fWindows.fDevices[kDisplay] = {kCard};
        fWindows.fKeys[kEnum + kCard] = {MakeText("Service", "nvlddmkm"),
                                         MakeText("Driver", kDisplay + "\\0000")};
        fWindows.fKeys[kClass + kDisplay + "\\0000"] = {
            MakeText("DriverVersion", "31.0.15.5123"),
            {"OpenGLDriverName", {R"(C:\Store\nvoglv64.dll)"}, {}},
            MakeText("OpenCLDriverName", R"(C:\Store\nvopencl64.dll)")};
    }

    std::vector<std::string> List(DeviceKind kind)
    {
        std::vector<std::string> paths;
        for (const DriverFile& file : GetWindowsIdentity(fWindows).fFiles)
            if (file.fInterface == kind)
                paths.push_back(file.fPath);
        return paths;
    }

    bool Has(const std::string& path)
    {
        const Identity identity = GetWindowsIdentity(fWindows);
        return std::any_of(identity.fFiles.begin(), identity.fFiles.end(),
                           [&](const DriverFile& file) { return file.fPath == path; });
    }

    FakeWindows fWindows;
};

using Names = std::vector<std::string>;

TEST_F(WindowsRulesTest, HaveAdaptersAndTheirFiles)
{
    const Identity identity = GetWindowsIdentity(fWindows);
    ASSERT_EQ(identity.fAdapters.size(), 1U);
    EXPECT_EQ(identity.fAdapters[0],
              (AdapterIdentity{kCard, 0x10DE, 0x2484, "nvlddmkm", "31.0.15.5123"}));
    EXPECT_EQ(List(DeviceKind::kOpenGL),
              (Names{R"(C:\Store\nvoglv64.dll)", kSystem + "opengl32.dll"}));
    EXPECT_EQ(List(DeviceKind::kOpenCL),
              (Names{R"(C:\Store\nvopencl64.dll)", kSystem + "OpenCL.dll"}));
}

TEST_F(WindowsRulesTest, AreEmptyOnABareSystem)
{
    FakeWindows bare;
    const Identity identity = GetWindowsIdentity(bare);
    EXPECT_EQ(identity.fAdapters.size(), 0U);
    EXPECT_EQ(identity.fFiles.size(), 0U);
}

TEST_F(WindowsRulesTest, FindNamesInTheSystemFolder)
{
    auto& values = fWindows.fKeys[kClass + kDisplay + "\\0000"];
    values = {{"openGLdrivername", {"ig9icd64", "gone.dll"}, {}},
              MakeText("OpenCLDriverName", R"(\SystemRoot\System32\igdrcl64.dll)")};
    EXPECT_EQ(List(DeviceKind::kOpenGL),
              (Names{kSystem + "ig9icd64.dll", kSystem + "opengl32.dll"}));
    EXPECT_EQ(List(DeviceKind::kOpenCL), (Names{kSystem + "OpenCL.dll", kSystem + "igdrcl64.dll"}));
}

TEST_F(WindowsRulesTest, FindNothingForAnEmptyName)
{
    fWindows.fFiles[kSystem + ".dll"] = 8;
    fWindows.fKeys[kClass + kDisplay + "\\0000"] = {{"OpenGLDriverName", {""}, {}}};
    EXPECT_FALSE(Has(kSystem + ".dll"));
}

TEST_F(WindowsRulesTest, ReadTheListsForOpenCL)
{
    fWindows.fKeys[kVendors] = {{R"(C:\Other\pocl.dll)", {}, 0}, {"igdrcl64.dll", {}, 1}};
    EXPECT_TRUE(Has(R"(C:\Other\pocl.dll)"));
    EXPECT_FALSE(Has(kSystem + "igdrcl64.dll"));
    fWindows.fKeys[kVendors] = {{R"(C:\Other\pocl.dll)", {"text"}, {}}};
    EXPECT_FALSE(Has(R"(C:\Other\pocl.dll)"));
    fWindows.fKeys[R"(SOFTWARE\Khronos\OpenCL\Layers)"] = {{R"(C:\Other\pocl.dll)", {}, 7}};
    EXPECT_TRUE(Has(R"(C:\Other\pocl.dll)"));
    fWindows.fKeys.clear();
    fWindows.fVariables["OCL_ICD_FILENAMES"] = R"(gone.dll;;C:\Other\pocl.dll)";
    EXPECT_TRUE(Has(R"(C:\Other\pocl.dll)"));
    fWindows.fVariables = {{"OPENCL_LAYERS", "igdrcl64.dll"}};
    EXPECT_FALSE(Has(R"(C:\Other\pocl.dll)"));
    EXPECT_TRUE(Has(kSystem + "igdrcl64.dll"));
}

TEST_F(WindowsRulesTest, ReadSoftwareComponents)
{
    fWindows.fDevices[kComponent] = {R"(SWC\1)"};
    fWindows.fKeys[kEnum + R"(SWC\1)"] = {MakeText("Driver", kComponent + "\\0003")};
    fWindows.fKeys[kClass + kComponent + "\\0003"] = {
        MakeText("OpenCLDriverName", R"(C:\Other\pocl.dll)")};
    EXPECT_TRUE(Has(R"(C:\Other\pocl.dll)"));
    EXPECT_EQ(GetWindowsIdentity(fWindows).fAdapters.size(), 1U);
}

TEST_F(WindowsRulesTest, ReadTheListForOpenGL)
{
    fWindows.fKeys[R"(SOFTWARE\Microsoft\Windows NT\CurrentVersion\OpenGLDrivers\MSOGL)"] = {
        MakeText("DLL", "ig9icd64.dll")};
    EXPECT_TRUE(Has(kSystem + "ig9icd64.dll"));
}

// As under Wine.
TEST_F(WindowsRulesTest, TakeTheKeysWithoutAListOfPresentDevices)
{
    fWindows.fDevices.clear();
    EXPECT_EQ(GetWindowsIdentity(fWindows).fAdapters.size(), 0U);
    fWindows.fKeys[kEnum + kCard].push_back(
        MakeText("ClassGUID", "{4D36E968-E325-11CE-BFC1-08002BE10318}"));
    fWindows.fKeys[kEnum + R"(PCI\VEN_8086&DEV_1502\1)"] = {
        MakeText("ClassGUID", "{4D36E972-E325-11CE-BFC1-08002BE10318}")};
    const Identity identity = GetWindowsIdentity(fWindows);
    ASSERT_EQ(identity.fAdapters.size(), 1U);
    EXPECT_EQ(identity.fAdapters[0].fSlot, kCard);
    EXPECT_EQ(identity.fAdapters[0].fDriver, "nvlddmkm");
}

TEST_F(WindowsRulesTest, MayHaveADeviceWithoutAnything)
{
    fWindows.fDevices[kDisplay] = {R"(ROOT\BASICDISPLAY\0000)", R"(PCI\VEN_10D)",
                                   R"(PCI\VEN_XYZW)"};
    const Identity identity = GetWindowsIdentity(fWindows);
    ASSERT_EQ(identity.fAdapters.size(), 3U);
    for (const AdapterIdentity& adapter : identity.fAdapters) {
        EXPECT_EQ(adapter.fVendor, 0U);
        EXPECT_EQ(adapter.fDriver, "");
    }
}

TEST_F(WindowsRulesTest, HaveTheIdsOfTheFirstMarks)
{
    const struct {
        const char* fDevice;
        unsigned fVendor;
        unsigned fModel;
    } kRows[] = {
        {R"(PCI\VEN_8086&DEV_A7A0)", 0x8086, 0xA7A0},
        {R"(pci\ven_8086&dev_a7a0\1)", 0x8086, 0xA7A0},
        {R"(PCI\VEN_10DE2&DEV_24)", 0x10DE, 0},
        {R"(PCI\VEN_&DEV_2484)", 0, 0x2484},
        {R"(PCI\VEN_10D)", 0, 0},
        {R"(PCI\VEN_1&VEN_10DE)", 0, 0},
        {R"(PCI\VEN_)", 0, 0},
        {"", 0, 0},
    };
    for (const auto& row : kRows) {
        fWindows.fDevices[kDisplay] = {row.fDevice};
        const Identity identity = GetWindowsIdentity(fWindows);
        ASSERT_EQ(identity.fAdapters.size(), 1U);
        EXPECT_EQ(identity.fAdapters[0].fVendor, row.fVendor) << row.fDevice;
        EXPECT_EQ(identity.fAdapters[0].fDevice, row.fModel) << row.fDevice;
    }
}

TEST_F(WindowsRulesTest, ChangeTheIdentity)
{
    const Identity before = GetWindowsIdentity(fWindows);
    EXPECT_EQ(GetWindowsIdentity(fWindows), before);
    ++fWindows.fFiles[R"(C:\Store\nvoglv64.dll)"];
    EXPECT_NE(GetWindowsIdentity(fWindows), before) << "a driver's file was replaced";
    --fWindows.fFiles[R"(C:\Store\nvoglv64.dll)"];
    EXPECT_EQ(GetWindowsIdentity(fWindows), before);
    fWindows.fDevices[kDisplay].push_back(R"(PCI\VEN_8086&DEV_A7A0\3&11583659&0&10)");
    EXPECT_NE(GetWindowsIdentity(fWindows), before) << "an adapter was added";
    fWindows.fDevices[kDisplay] = {kCard};
    fWindows.fKeys[kVendors] = {{R"(C:\Other\pocl.dll)", {}, 0}};
    EXPECT_NE(GetWindowsIdentity(fWindows), before) << "a driver was added";
    fWindows.fKeys[kVendors].clear();
    fWindows.fKeys[kClass + kDisplay + "\\0000"][0] = MakeText("DriverVersion", "31.0.15.5124");
    EXPECT_NE(GetWindowsIdentity(fWindows), before) << "the driver has another version";
    fWindows.fKeys[kClass + kDisplay + "\\0000"][0] = MakeText("DriverVersion", "31.0.15.5123");
    EXPECT_EQ(GetWindowsIdentity(fWindows), before);
    fWindows.fVariables["GALLIUM_DRIVER"] = "llvmpipe";
    EXPECT_NE(GetWindowsIdentity(fWindows), before) << "a variable selects another driver";
}

} // namespace
} // namespace assay_host
