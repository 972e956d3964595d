#include <gtest/gtest.h>
#include <unistd.h>

#include "pmutil_gpu/AdapterSource.h"
#include "pmutil_gpu/DXGIData.h"
#include "pmutil_gpu/WMIData.h"
#include "support/AdapterTree.h"

namespace pmutil {
namespace {

const char kRadeon[] =
    "/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/0000:02:00.0/0000:03:00.0";

std::unique_ptr<AdapterRow> FirstRow()
{
    std::unique_ptr<AdapterRows> rows;
    NativeAdapterSource().CreateManagementService()->QueryAdapters(rows);
    std::unique_ptr<AdapterRow> row;
    rows->Next(row);
    return row;
}

PropertyValue Property(const char16_t* name)
{
    PropertyValue value;
    EXPECT_EQ(FirstRow()->Get(name, value), 0);
    return value;
}

AdapterDescriptor FirstDescriptor()
{
    std::unique_ptr<AdapterFactory> factory;
    NativeAdapterSource().CreateFactory(factory);
    std::unique_ptr<Adapter> adapter;
    AdapterDescriptor descriptor;
    if (!Failed(factory->EnumAdapters(0, adapter)))
        adapter->GetDesc(descriptor);
    return descriptor;
}

TEST(NativeAdapterSourceTest, ARowHasThePropertiesThatAreRead)
{
    const AdapterTree tree("amd-discrete");
    const std::u16string name =
        u"Advanced Micro Devices, Inc. [AMD/ATI] Navi 31 [Radeon RX 7900 XT/7900 XTX]";
    EXPECT_EQ(Property(u"Name").type, PropertyValue::kString);
    EXPECT_EQ(Property(u"Name").text, name);
    EXPECT_EQ(Property(u"Caption").text, name);
    EXPECT_EQ(Property(u"InstalledDisplayDrivers").text, u"amdgpu");
    EXPECT_EQ(Property(u"VideoModeDescription").text, u"2560 x 1440");
    EXPECT_EQ(Property(u"DriverVersion").text, u"6.12.117+deb12-amd64");
    EXPECT_EQ(Property(u"DriverDate").type, PropertyValue::kString);
    EXPECT_EQ(Property(u"DriverDate").text, u"");
    EXPECT_EQ(Property(u"Status").text, u"OK");
}

TEST(NativeAdapterSourceTest, AnotherPropertyFails)
{
    const AdapterTree tree("amd-discrete");
    PropertyValue value;
    EXPECT_TRUE(Failed(FirstRow()->Get(u"VideoProcessor", value)));
    EXPECT_EQ(value.type, PropertyValue::kEmpty);
}

TEST(NativeAdapterSourceTest, AdapterRamSaturatesAt32Bits)
{
    const AdapterTree tree("amd-discrete");
    EXPECT_EQ(Property(u"AdapterRAM").type, PropertyValue::kInt32);
    EXPECT_EQ(static_cast<std::uint32_t>(Property(u"AdapterRAM").integer), 0xFFFFFFFFU);
    tree.write(std::string(kRadeon) + "/mem_info_vram_total", "3221225472\n");
    EXPECT_EQ(static_cast<std::uint32_t>(Property(u"AdapterRAM").integer), 0xC0000000U);
}

TEST(NativeAdapterSourceTest, UnknownMemoryIsNull)
{
    const AdapterTree tree("nvidia-drm");
    EXPECT_EQ(Property(u"AdapterRAM").type, PropertyValue::kNull);
}

TEST(NativeAdapterSourceTest, ACardWithoutADriverHasNullDriverStrings)
{
    const AdapterTree tree("amd-discrete");
    tree.remove(std::string(kRadeon) + "/driver");
    EXPECT_EQ(Property(u"InstalledDisplayDrivers").type, PropertyValue::kNull);
    EXPECT_EQ(Property(u"DriverVersion").type, PropertyValue::kNull);
}

TEST(NativeAdapterSourceTest, WithoutADisplayTheVideoModeIsNull)
{
    const AdapterTree tree("nvidia-no-drm");
    EXPECT_EQ(Property(u"VideoModeDescription").type, PropertyValue::kNull);
}

TEST(NativeAdapterSourceTest, TextsAreUtf16)
{
    const AdapterTree tree("amd-discrete");
    tree.write("/sys/module/amdgpu/version", "1.0-\xC3\xA9\xF0\x9F\x98\x80\xFF\n");
    EXPECT_EQ(Property(u"DriverVersion").text, u"1.0-\u00E9\xD83D\xDE00\uFFFD");
}

TEST(NativeAdapterSourceTest, RowsEndWithNull)
{
    const AdapterTree tree("server-bmc");
    std::unique_ptr<AdapterRows> rows;
    NativeAdapterSource().CreateManagementService()->QueryAdapters(rows);
    std::unique_ptr<AdapterRow> row;
    for (int i = 0; i != 3; ++i) {
        EXPECT_EQ(rows->Next(row), 0);
        EXPECT_TRUE(row);
    }
    EXPECT_EQ(rows->Next(row), 0);
    EXPECT_FALSE(row);
}

TEST(NativeAdapterSourceTest, RowsAndAdaptersHaveOneOrder)
{
    const AdapterTree tree("server-bmc");
    const std::vector<WMIData> rows = WMIData::GetAllDevices();
    ASSERT_EQ(rows.size(), 3U);
    EXPECT_EQ(rows[0].fVendorID, 0x1A03U);
    EXPECT_EQ(rows[1].fVendorID, 0x1002U);
    EXPECT_EQ(rows[2].fDeviceID, 0x740FU);
}

TEST(NativeAdapterSourceTest, ADescriptorHasIdsAndSizes)
{
    const AdapterTree tree("amd-discrete");
    const AdapterDescriptor descriptor = FirstDescriptor();
    EXPECT_EQ(std::u16string(descriptor.Description.data()),
              u"Advanced Micro Devices, Inc. [AMD/ATI] Navi 31 [Radeon RX 7900 XT/7900 XTX]");
    EXPECT_EQ(descriptor.VendorId, 0x1002U);
    EXPECT_EQ(descriptor.DeviceId, 0x744CU);
    EXPECT_EQ(descriptor.SubSysId, 0x471E1DA2U);
    EXPECT_EQ(descriptor.Revision, 0xC8U);
    EXPECT_EQ(descriptor.DedicatedVideoMemory, 25753026560U);
    EXPECT_EQ(descriptor.DedicatedSystemMemory, 0U);
    EXPECT_EQ(descriptor.SharedSystemMemory, 16767705088U);
}

TEST(NativeAdapterSourceTest, TheMappableMemoryIsShared)
{
    const AdapterTree tree("amd-integrated");
    EXPECT_EQ(FirstDescriptor().SharedSystemMemory, std::uint64_t{7680} << 20);
    EXPECT_EQ(FirstDescriptor().DedicatedVideoMemory, std::uint64_t{64} << 20);
}

TEST(NativeAdapterSourceTest, OtherwiseAnIntegratedPartSharesHalfOfTheMemory)
{
    const AdapterTree tree("intel-integrated");
    EXPECT_EQ(FirstDescriptor().DedicatedVideoMemory, 0U);
    EXPECT_EQ(FirstDescriptor().SharedSystemMemory, std::uint64_t{2} << 30);
    tree.remove("/proc/meminfo");
    EXPECT_EQ(FirstDescriptor().SharedSystemMemory, 0U);
}

TEST(NativeAdapterSourceTest, OtherCardsHaveNoSharedMemory)
{
    for (const char* name : {"intel-arc-i915", "nvidia-drm", "virtio-gpu"}) {
        const AdapterTree tree(name);
        EXPECT_EQ(FirstDescriptor().SharedSystemMemory, 0U) << name;
    }
}

// 0 is the only result of a call that did what it was asked for.
TEST(NativeAdapterSourceTest, EachCallSucceeds)
{
    const AdapterTree tree("amd-discrete");
    const auto service = NativeAdapterSource().CreateManagementService();
    EXPECT_EQ(service->Initialize(), 0);
    EXPECT_EQ(service->CreateLocator(), 0);
    EXPECT_EQ(service->ConnectServer(), 0);
    EXPECT_EQ(service->SetProxyBlanket(), 0);
    std::unique_ptr<AdapterRows> rows;
    EXPECT_EQ(service->QueryAdapters(rows), 0);
    std::unique_ptr<AdapterRow> row;
    EXPECT_EQ(rows->Next(row), 0);
    PropertyValue value;
    EXPECT_EQ(row->Get(u"Name", value), 0);
    std::unique_ptr<AdapterFactory> factory;
    EXPECT_EQ(NativeAdapterSource().CreateFactory(factory), 0);
    std::unique_ptr<Adapter> adapter;
    EXPECT_EQ(factory->EnumAdapters(0, adapter), 0);
    AdapterDescriptor descriptor;
    EXPECT_EQ(adapter->GetDesc(descriptor), 0);
    std::unique_ptr<AdapterOutput> output;
    EXPECT_EQ(adapter->EnumOutputs(0, output), 0);
    OutputDescriptor outputDescriptor;
    EXPECT_EQ(output->GetDesc(outputDescriptor), 0);
}

// What a source leaves out is 0.
TEST(NativeAdapterSourceTest, DescriptorsBeginEmpty)
{
    const AdapterDescriptor adapter;
    for (const std::uint32_t id :
         {adapter.VendorId, adapter.DeviceId, adapter.SubSysId, adapter.Revision})
        EXPECT_EQ(id, 0U);
    for (const std::uint64_t bytes :
         {adapter.DedicatedVideoMemory, adapter.DedicatedSystemMemory, adapter.SharedSystemMemory})
        EXPECT_EQ(bytes, 0U);
    const OutputDescriptor output;
    const auto& place = output.DesktopCoordinates;
    for (const std::int32_t number : {place.left, place.top, place.right, place.bottom,
                                      output.AttachedToDesktop, output.Rotation})
        EXPECT_EQ(number, 0);
    EXPECT_EQ(PropertyValue().type, PropertyValue::kEmpty);
    EXPECT_EQ(PropertyValue().integer, 0);
}

// As Windows numbers them.
TEST(NativeAdapterSourceTest, TypesHaveTheNumbersOfVariants)
{
    EXPECT_EQ(PropertyValue::kEmpty, 0);
    EXPECT_EQ(PropertyValue::kNull, 1);
    EXPECT_EQ(PropertyValue::kInt32, 3);
    EXPECT_EQ(PropertyValue::kString, 8);
}

// The names of the adapter's outputs; '*' marks those that are attached to the desktop.
std::string Outputs(std::uint32_t index)
{
    std::unique_ptr<AdapterFactory> factory;
    NativeAdapterSource().CreateFactory(factory);
    std::unique_ptr<Adapter> adapter;
    if (Failed(factory->EnumAdapters(index, adapter)))
        return "none";
    std::string names;
    std::unique_ptr<AdapterOutput> output;
    for (std::uint32_t i = 0; !Failed(adapter->EnumOutputs(i, output)); ++i) {
        OutputDescriptor descriptor;
        if (Failed(output->GetDesc(descriptor))) {
            names += "? ";
            continue;
        }
        names += NarrowProperty(descriptor.DeviceName.data());
        EXPECT_LE(descriptor.AttachedToDesktop, 1);
        names += descriptor.AttachedToDesktop != 0 ? "* " : " ";
    }
    return names;
}

TEST(NativeAdapterSourceTest, ConnectorsAreOutputs)
{
    const AdapterTree tree("amd-discrete");
    EXPECT_EQ(Outputs(0), "DP-1* DP-2 HDMI-A-1* ");
    EXPECT_EQ(Outputs(1), "none");
}

TEST(NativeAdapterSourceTest, AnOutputHasTheSizeOfItsMode)
{
    const AdapterTree tree("amd-discrete");
    std::unique_ptr<AdapterFactory> factory;
    NativeAdapterSource().CreateFactory(factory);
    std::unique_ptr<Adapter> adapter;
    factory->EnumAdapters(0, adapter);
    std::unique_ptr<AdapterOutput> output;
    adapter->EnumOutputs(0, output);
    OutputDescriptor descriptor;
    EXPECT_EQ(output->GetDesc(descriptor), 0);
    EXPECT_EQ(descriptor.DesktopCoordinates.left, 0);
    EXPECT_EQ(descriptor.DesktopCoordinates.top, 0);
    EXPECT_EQ(descriptor.DesktopCoordinates.right, 2560);
    EXPECT_EQ(descriptor.DesktopCoordinates.bottom, 1440);
}

TEST(NativeAdapterSourceTest, ACardThatRendersWithoutConnectorsHasOneOutput)
{
    const AdapterTree tree("server-bmc");
    EXPECT_EQ(Outputs(0), "VGA-1* ");
    EXPECT_EQ(Outputs(1), "renderD128* ");
    EXPECT_EQ(Outputs(2), "renderD129* ");
}

TEST(NativeAdapterSourceTest, TheNvidiaDriversEntryIsAnOutput)
{
    const AdapterTree tree("nvidia-no-drm");
    EXPECT_EQ(Outputs(0), "nvidia* ");
    tree.remove("/proc/driver/nvidia/gpus");
    EXPECT_EQ(Outputs(0), "");
}

TEST(NativeAdapterSourceTest, ACardThatRendersWithoutADisplayHasOneMoreOutput)
{
    const AdapterTree tree("hybrid-laptop");
    EXPECT_EQ(Outputs(1), "HDMI-A-1 renderD129* ");
    EXPECT_EQ(DXGIData::GetAllDevices().size(), 2U);
    tree.remove("/sys/class/drm/renderD129");
    tree.remove("/proc/driver/nvidia/gpus");
    EXPECT_EQ(Outputs(1), "HDMI-A-1 ");
    EXPECT_EQ(DXGIData::GetAllDevices().size(), 1U);
}

TEST(NativeAdapterSourceTest, ACardWithADisplayHasNoExtraOutput)
{
    const AdapterTree tree("amd-discrete");
    EXPECT_EQ(Outputs(0), "DP-1* DP-2 HDMI-A-1* ");
}

TEST(NativeAdapterSourceTest, ACardOfAVirtualMachineHasARowButNoOutput)
{
    const AdapterTree tree("vfio");
    const std::vector<WMIData> rows = WMIData::GetAllDevices();
    ASSERT_EQ(rows.size(), 2U);
    EXPECT_EQ(rows[1].GetInstalledDisplayDrivers(), "vfio_pci");
    EXPECT_EQ(Outputs(1), "");
    EXPECT_EQ(DXGIData::GetAllDevices().size(), 1U);
}

TEST(NativeAdapterSourceTest, AConnectorOfUnknownStateIsAnOutputThatFails)
{
    const AdapterTree tree("unreadable");
    EXPECT_EQ(Outputs(1), "? HDMI-A-1* ");
}

TEST(NativeAdapterSourceTest, PhysicalMemoryIsTheRecordedMachines)
{
    std::uint64_t bytes = 0;
    {
        const AdapterTree tree("intel-integrated");
        EXPECT_TRUE(NativeAdapterSource().GetPhysicalMemory(bytes));
        EXPECT_EQ(bytes, std::uint64_t{4} << 30);
        tree.remove("/proc/meminfo");
        EXPECT_FALSE(NativeAdapterSource().GetPhysicalMemory(bytes));
    }
    EXPECT_TRUE(NativeAdapterSource().GetPhysicalMemory(bytes));
    EXPECT_EQ(bytes, static_cast<std::uint64_t>(sysconf(_SC_PHYS_PAGES)) *
                         static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE)));
}

TEST(NativeAdapterSourceTest, TheConnectionAlwaysSucceeds)
{
    const auto service = NativeAdapterSource().CreateManagementService();
    EXPECT_EQ(service->Initialize(), 0);
    EXPECT_EQ(service->CreateLocator(), 0);
    EXPECT_EQ(service->ConnectServer(), 0);
    EXPECT_EQ(service->SetProxyBlanket(), 0);
    service->Release();
    service->Uninitialize();
}

} // namespace
} // namespace pmutil
