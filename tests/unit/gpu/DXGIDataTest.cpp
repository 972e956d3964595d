#include "pmutil_gpu/DXGIData.h"

#include <sstream>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/OGL.h"
#include "support/CapturedLog.h"
#include "support/ScriptedAdapters.h"

namespace {

using namespace assay_test;
using pmutil::DXGIData;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::uint64_t kMB = 1048576;
constexpr std::uint64_t kGB = 1024 * kMB;

template <typename T>
std::string Printed(const T& value)
{
    std::ostringstream out;
    out << value;
    return out.str();
}

DXGIData Described(std::u16string_view description)
{
    return DXGIData(MakeAdapter(description, 0, 0).descriptor);
}

DXGIData Sized(std::uint32_t vendorID, std::uint64_t video, std::uint64_t system = 0,
               std::uint64_t shared = 0)
{
    pmutil::AdapterDescriptor descriptor;
    descriptor.VendorId = vendorID;
    descriptor.DedicatedVideoMemory = video;
    descriptor.DedicatedSystemMemory = system;
    descriptor.SharedSystemMemory = shared;
    return DXGIData(descriptor);
}

class DXGIDataTest : public testing::Test {
protected:
    std::vector<DXGIData> GetAllDevices()
    {
        testing::internal::CaptureStderr();
        std::vector<DXGIData> devices = DXGIData::GetAllDevices();
        fStandardError = testing::internal::GetCapturedStderr();
        return devices;
    }

    CapturedLog fLog{pmutil::gGPUAssay};
    ScriptedAdapters fScript;
    std::string fStandardError;
};

TEST_F(DXGIDataTest, ADefaultRecordIsAllZero)
{
    const DXGIData data;
    EXPECT_EQ(data.GetDeviceName(), "");
    EXPECT_EQ(data.GetDescription(), "");
    EXPECT_EQ(data.GetVendorID(), 0U);
    EXPECT_EQ(data.GetDeviceID(), 0U);
    EXPECT_EQ(data.GetMemoryMB(), 0U);
    EXPECT_FALSE(data.IsIntegrated());
}

TEST_F(DXGIDataTest, TheRecordReturnsItsDescriptor)
{
    pmutil::AdapterDescriptor descriptor = MakeAdapter(u"Card", 11, 22).descriptor;
    descriptor.DedicatedVideoMemory = 3 * kGB;
    const DXGIData data(descriptor);
    EXPECT_EQ(data.GetDeviceName(), "Card");
    EXPECT_EQ(data.GetDescription(), "Card");
    EXPECT_EQ(data.GetVendorID(), 11U);
    EXPECT_EQ(data.GetDeviceID(), 22U);
    EXPECT_EQ(data.GetMemoryMB(), 3072U);
}

TEST_F(DXGIDataTest, NamesAreEscaped)
{
    EXPECT_EQ(Described(u"\b\t\n\f\r").GetDeviceName(), "\\b\\t\\n\\f\\r");
    EXPECT_EQ(Described(u"a\\b").GetDeviceName(), "a\\\\b");
    EXPECT_EQ(Described(u"a \"b\" 'c'").GetDeviceName(), "a \\\"b\\\" 'c'");
    EXPECT_EQ(Described(u"a \"b\" 'c'").GetDescription(), "a \\\"b\\\" 'c'");
    EXPECT_EQ(Described(u"Card\u00AE").GetDeviceName(), "Card\\x00ae");
    EXPECT_EQ(Described(u"\u007F\u1234\v").GetDeviceName(), "\\x007f\\x1234\\x000b");
}

TEST_F(DXGIDataTest, ADescriptionThatFillsItsArrayNeedsNoTerminator)
{
    const pmutil::AdapterDescriptor descriptor =
        MakeAdapter(std::u16string(128, u'x'), 0x8086, 0).descriptor;
    const DXGIData data(descriptor);
    EXPECT_EQ(data.GetDeviceName(), std::string(128, 'x'));
    EXPECT_EQ(data.GetDescription(), std::string(128, 'x'));
    EXPECT_THAT(Printed(descriptor),
                testing::EndsWith("Description=" + std::string(128, 'x') + "}"));
}

TEST_F(DXGIDataTest, ADescriptionEndsAtItsTerminator)
{
    EXPECT_EQ(Described(std::u16string(127, u'x')).GetDeviceName(), std::string(127, 'x'));
    const DXGIData data = Described(std::u16string(u"ab\0cd", 5));
    EXPECT_EQ(data.GetDeviceName(), "ab");
    EXPECT_EQ(data.GetDescription(), "ab");
    EXPECT_THAT(Printed(data.fAdapterDesc), testing::EndsWith("Description=ab}"));
}

TEST_F(DXGIDataTest, TheAdapterTextIsClosed)
{
    pmutil::AdapterDescriptor descriptor = MakeAdapter(u"A \"Card\"", 4098, 4294967295U).descriptor;
    descriptor.SubSysId = 3;
    descriptor.Revision = 4;
    descriptor.DedicatedVideoMemory = 18446744073709551615U;
    descriptor.DedicatedSystemMemory = 6;
    descriptor.SharedSystemMemory = 7;
    EXPECT_EQ(Printed(descriptor),
              "{ VendorID=4098 DeviceId=4294967295 SubSysId=3 Revision=4"
              " DedicatedVideoMemory=18446744073709551615 DedicatedSystemMemory=6"
              " SharedSystemMemory=7 Description=A \\\"Card\\\"}");
}

TEST_F(DXGIDataTest, TheOutputTextStaysOpen)
{
    pmutil::OutputDescriptor descriptor;
    CopyText(descriptor.DeviceName, u"\\\\.\\DISPLAY1");
    descriptor.DesktopCoordinates = {-1920, 0, 0, 1080};
    descriptor.AttachedToDesktop = 1;
    descriptor.Rotation = 2;
    descriptor.Monitor = &descriptor;
    EXPECT_EQ(Printed(descriptor),
              "{ DesktopCoordinates={ left=-1920 top=0 right=0 bottom=1080} AttachedToDesktop=1"
              " Rotation=2 Monitor=" +
                  Printed(descriptor.Monitor) + " DeviceName=\\\\\\\\.\\\\DISPLAY1");
}

TEST_F(DXGIDataTest, TheDisplayDeviceTextIsEscaped)
{
    EXPECT_EQ(Printed(QGF::OGL::DisplayDeviceKey("\\\\.\\D1", "A \"Card\"", "caf\xC3\xA9")),
              "{ DeviceName=\\\\\\\\.\\\\D1 DeviceString=A \\\"Card\\\""
              " DisplayID=caf\\xc3\\xa9}");
    EXPECT_EQ(Printed(QGF::OGL::DisplayDeviceKey()), "{ DeviceName= DeviceString= DisplayID=}");
}

TEST_F(DXGIDataTest, NoAdaptersAreAnEmptyListAndNoLine)
{
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), IsEmpty());
    EXPECT_THAT(fScript.calls, ElementsAre("CreateFactory", "EnumAdapters 0", "~factory"));
}

TEST_F(DXGIDataTest, ObjectsAreReleasedInOrder)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20)};
    EXPECT_EQ(GetAllDevices().size(), 2U);
    EXPECT_THAT(fScript.calls,
                ElementsAre("CreateFactory", "EnumAdapters 0", "GetDesc 0", "EnumOutputs 0 0",
                            "GetDesc 0 0", "~output 0 0", "EnumOutputs 0 1", "~adapter 0",
                            "EnumAdapters 1", "GetDesc 1", "EnumOutputs 1 0", "GetDesc 1 0",
                            "~output 1 0", "EnumOutputs 1 1", "~adapter 1", "EnumAdapters 2",
                            "~factory"));
}

TEST_F(DXGIDataTest, AnAdapterWithADisplayIsListedAndLogged)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.adapters[0].outputs.push_back(MakeOutput(true));
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_EQ(devices[0].GetDeviceName(), "One");
    EXPECT_THAT(
        fLog.Lines(),
        ElementsAre(
            "adapter[0]{ VendorID=1 DeviceId=10 SubSysId=0 Revision=0 DedicatedVideoMemory=0"
            " DedicatedSystemMemory=0 SharedSystemMemory=0 Description=One}",
            "output[0]{ DesktopCoordinates={ left=0 top=0 right=0 bottom=0} AttachedToDesktop=1"
            " Rotation=0 Monitor=" +
                Printed(static_cast<const void*>(nullptr)) + " DeviceName=",
            "output[1]{ DesktopCoordinates={ left=0 top=0 right=0 bottom=0} AttachedToDesktop=1"
            " Rotation=0 Monitor=" +
                Printed(static_cast<const void*>(nullptr)) + " DeviceName=",
            "adapter[0] displays: 2"));
}

TEST_F(DXGIDataTest, AnAdapterWithoutAnAttachedDisplayIsLeftOut)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.adapters[0].outputs = {MakeOutput(false), MakeOutput(false)};
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(),
                ElementsAre(testing::StartsWith("adapter[0]{ "), testing::StartsWith("output[0]{ "),
                            testing::StartsWith("output[1]{ ")));
}

TEST_F(DXGIDataTest, AnAdapterWithoutOutputsIsLeftOut)
{
    fScript.adapters = {MakeAdapter(u"Software", 1, 10)};
    fScript.adapters[0].outputs.clear();
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), ElementsAre(testing::StartsWith("adapter[0]{ ")));
}

TEST_F(DXGIDataTest, EveryValueButZeroIsAttached)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    std::vector<ScriptedOutput>& outputs = fScript.adapters[0].outputs;
    outputs.clear();
    for (const std::int32_t attached : {-1, 0, 1, 2, 0x100, INT32_MIN}) {
        outputs.push_back(MakeOutput(true));
        outputs.back().descriptor.AttachedToDesktop = attached;
    }
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_EQ(fLog.Lines().back(), "adapter[0] displays: 5");
}

TEST_F(DXGIDataTest, AnOutputOfAFailedCallDoesNotCount)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.results["EnumOutputs 0 0"] = kFail;
    fScript.contrary = {"EnumOutputs 0 0"};
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_EQ(fScript.CountCalls("GetDesc 0 0"), 0U);
    EXPECT_EQ(fScript.CountCalls("~output 0 0"), 1U);
}

TEST_F(DXGIDataTest, ASuccessWithoutAnOutputEndsTheOutputs)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.adapters[0].outputs = {MakeOutput(true), MakeOutput(true), MakeOutput(true)};
    fScript.contrary = {"EnumOutputs 0 1"};
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_EQ(fLog.Lines().back(), "adapter[0] displays: 1");
    EXPECT_EQ(fScript.CountCalls("EnumOutputs 0 2"), 0U);
}

TEST_F(DXGIDataTest, AnAdapterOfAFailedCallIsNotListed)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20)};
    fScript.results["EnumAdapters 1"] = kFail;
    fScript.contrary = {"EnumAdapters 1"};
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_EQ(fScript.CountCalls("GetDesc 1"), 0U);
}

TEST_F(DXGIDataTest, ASuccessWithoutAnAdapterEndsTheAdapters)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20)};
    fScript.contrary = {"EnumAdapters 0"};
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_EQ(fScript.CountCalls("EnumAdapters 1"), 0U);
}

TEST_F(DXGIDataTest, AnOutputWhoseGetDescFailsDoesNotStopLaterOnes)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.adapters[0].outputs = {MakeOutput(true), MakeOutput(true), MakeOutput(true)};
    fScript.adapters[0].outputs[1].result = kFail;
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre(testing::StartsWith("adapter[0]{ "), testing::StartsWith("output[0]{ "),
                            testing::StartsWith("output[2]{ "), "adapter[0] displays: 2"));
    EXPECT_EQ(fScript.CountCalls("~output 0 1"), 1U);
    EXPECT_EQ(fStandardError, "");
}

TEST_F(DXGIDataTest, AFailedEnumOutputsEndsTheOutputsSilently)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.adapters[0].outputs = {MakeOutput(true), MakeOutput(true)};
    fScript.results["EnumOutputs 0 1"] = kFail;
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre(testing::StartsWith("adapter[0]{ "), testing::StartsWith("output[0]{ "),
                            "adapter[0] displays: 1"));
    EXPECT_EQ(fStandardError, "");
}

TEST_F(DXGIDataTest, AnyFailedEnumAdaptersEndsTheAdaptersSilently)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20)};
    fScript.results["EnumAdapters 1"] = kFail; // not the code for "no more"
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_EQ(fStandardError, "");
}

TEST_F(DXGIDataTest, ADroppedAdapterLeavesAGapInTheNumbering)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20),
                        MakeAdapter(u"Three", 3, 30)};
    fScript.adapters[1].outputs.clear();
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 2U);
    EXPECT_EQ(devices[1].GetDeviceName(), "Three");
    EXPECT_THAT(fLog.Lines(),
                ElementsAre(testing::StartsWith("adapter[0]{ "), testing::StartsWith("output[0]{ "),
                            "adapter[0] displays: 1", testing::StartsWith("adapter[1]{ "),
                            testing::StartsWith("adapter[2]{ "), testing::StartsWith("output[0]{ "),
                            "adapter[2] displays: 1"));
}

TEST_F(DXGIDataTest, EqualDescriptionsGiveTwoRecords)
{
    fScript.adapters = {MakeAdapter(u"Card", 1, 10), MakeAdapter(u"Card", 1, 11)};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 2U);
    EXPECT_EQ(devices[0].GetDeviceID(), 10U);
    EXPECT_EQ(devices[1].GetDeviceID(), 11U);
}

TEST_F(DXGIDataTest, AFailedFactoryEndsTheEnumerationWithItsText)
{
    fScript.results["CreateFactory"] = kFail;
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("DXGIData::GetAllDevices() exception: CreateGXGIFactory failed"));
    EXPECT_EQ(fStandardError, "CreateGXGIFactory failed\n");
}

TEST_F(DXGIDataTest, AGetDescFailureOnTheThirdAdapterKeepsTheFirstTwo)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20),
                        MakeAdapter(u"Three", 3, 30), MakeAdapter(u"Four", 4, 40)};
    fScript.adapters[2].result = kFail;
    EXPECT_EQ(GetAllDevices().size(), 2U);
    EXPECT_EQ(fLog.Lines().back(), "DXGIData::GetAllDevices() exception: pAdapter->GetDesc failed");
    EXPECT_EQ(fStandardError, "pAdapter->GetDesc failed\n");
    EXPECT_EQ(fScript.CountCalls("~adapter 2"), 1U);
    EXPECT_EQ(fScript.CountCalls("~factory"), 1U);
}

TEST_F(DXGIDataTest, AnUnknownExceptionIsLoggedWithoutText)
{
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.throws["EnumAdapters 1"] = [] { throw 5; };
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_EQ(fLog.Lines().back(), "DXGIData::GetAllDevices() exception");
}

TEST_F(DXGIDataTest, IntelWith127MBIsIntegrated)
{
    EXPECT_TRUE(Sized(0x8086, 127 * kMB).IsIntegrated());
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("fAdapterDesc.VendorId=32902", "minDedicatedMBforDiscreteGPU=128",
                            "dedicatedMB=127", "Looks like an integrated GPU"));
}

TEST_F(DXGIDataTest, IntelWith128MBIsDiscrete)
{
    EXPECT_FALSE(Sized(0x8086, 128 * kMB).IsIntegrated());
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("fAdapterDesc.VendorId=32902", "minDedicatedMBforDiscreteGPU=128",
                            "dedicatedMB=128", "Looks like a discrete GPU"));
    EXPECT_TRUE(Sized(0x8086, 128 * kMB - 1).IsIntegrated());
}

TEST_F(DXGIDataTest, OnlyDedicatedVideoMemoryClassifies)
{
    EXPECT_TRUE(Sized(0x1002, 0, 4 * kGB, 4 * kGB).IsIntegrated());
    EXPECT_FALSE(Sized(0x1002, 4 * kGB).IsIntegrated());
}

TEST_F(DXGIDataTest, DedicatedMemoryIsComparedSigned)
{
    EXPECT_TRUE(Sized(0x8086, 0x80000000U * kMB).IsIntegrated());
    EXPECT_FALSE(Sized(0x8086, 0x7FFFFFFFU * kMB).IsIntegrated());
    EXPECT_TRUE(Sized(0x8086, 0x100000000U * kMB).IsIntegrated()); // truncated to 32 bits: 0
}

TEST_F(DXGIDataTest, NVIDIAAndUnknownVendorsAreAlwaysDiscrete)
{
    EXPECT_FALSE(Sized(0x10DE, 0).IsIntegrated());
    EXPECT_FALSE(Sized(0, 0).IsIntegrated());
    EXPECT_FALSE(Sized(0x1AF4, 0).IsIntegrated());
    EXPECT_THAT(fLog.Lines(), ElementsAre("fAdapterDesc.VendorId=4318", "fAdapterDesc.VendorId=0",
                                          "fAdapterDesc.VendorId=6900"));
}

TEST_F(DXGIDataTest, SharedMemoryIsLimitedToAQuarterAndToTwoGigabytes)
{
    fScript.physicalMemory = 16 * kGB;
    EXPECT_EQ(Sized(0x8086, 64 * kMB, 0, 4 * kGB).GetMemoryMB(), 2048U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("fAdapterDesc.VendorId=32902", "minDedicatedMBforDiscreteGPU=128",
                            "dedicatedMB=64", "Looks like an integrated GPU",
                            "installedRam=17179869184", "installedRamToConsiderForGPU=4294967296",
                            "installedRamThatGPUCanUse=2147483648", "numBytes=2214592512",
                            "DXGI RAM=2147483648=2048MB"));
}

TEST_F(DXGIDataTest, SharedMemoryOfASmallMachineIsAQuarter)
{
    fScript.physicalMemory = 2 * kGB;
    EXPECT_EQ(Sized(0x8086, 64 * kMB, 0, 4 * kGB).GetMemoryMB(), 576U);
    EXPECT_EQ(fLog.Lines().back(), "DXGI RAM=603979776=576MB");
}

TEST_F(DXGIDataTest, AQuarterIsTruncatedToWholeBytes)
{
    fScript.physicalMemory = 4194307;
    Sized(0x8086, 0, 0, 4 * kGB).GetMemoryMB();
    EXPECT_THAT(fLog.Lines(),
                testing::IsSupersetOf({"installedRamToConsiderForGPU=1048576",
                                       "installedRamThatGPUCanUse=1048576", "numBytes=1048576"}));
}

TEST_F(DXGIDataTest, TheSmallerOfSharedAndUsableMemoryIsAdded)
{
    fScript.physicalMemory = 16 * kGB;
    EXPECT_EQ(Sized(0x1002, 64 * kMB, 0, 100 * kMB).GetMemoryMB(), 164U);
}

TEST_F(DXGIDataTest, BothDedicatedSizesAreAddedToTheSharedSize)
{
    fScript.physicalMemory = 16 * kGB;
    EXPECT_EQ(Sized(0x8086, 64 * kMB, 32 * kMB, 100 * kMB).GetMemoryMB(), 196U);
    EXPECT_EQ(Sized(0x8086, 0, 32 * kMB, 100 * kMB).GetMemoryMB(), 132U);
    EXPECT_EQ(Sized(0x10DE, 64 * kMB, 32 * kMB, 100 * kMB).GetMemoryMB(), 96U);
}

TEST_F(DXGIDataTest, ADiscreteCardDoesNotQueryPhysicalMemory)
{
    fScript.knowsPhysicalMemory = false;
    EXPECT_EQ(Sized(0x1002, 2 * kGB, 0, 4 * kGB).GetMemoryMB(), 2048U);
    EXPECT_THAT(fScript.calls, IsEmpty());
    EXPECT_THAT(fLog.Lines(), ElementsAre("DXGI RAM=2147483648=2048MB"));
}

TEST_F(DXGIDataTest, ADiscreteSizeIsNotLimited)
{
    EXPECT_EQ(Sized(0x10DE, 80 * kGB).GetMemoryMB(), 81920U);
}

TEST_F(DXGIDataTest, MegabytesAreTruncatedTo32Bits)
{
    EXPECT_EQ(Sized(0x10DE, 0xFFFFFFFFFFFFFFFFU).GetMemoryMB(), 0xFFFFFFFFU);
    EXPECT_EQ(fLog.Lines().back(), "DXGI RAM=18446744073709551615=4294967295MB");
}

TEST_F(DXGIDataTest, ATotalOfExactlyOneGigabyteTakesNoSharedMemory)
{
    fScript.physicalMemory = 16 * kGB;
    EXPECT_EQ(Sized(0x8086, 64 * kMB, 960 * kMB, 4 * kGB).GetMemoryMB(), 1024U);
    EXPECT_THAT(fLog.Lines(), ElementsAre("DXGI RAM=1073741824=1024MB"));
    EXPECT_THAT(fScript.calls, IsEmpty());
}

TEST_F(DXGIDataTest, WithoutSharedMemoryTheCardIsNotClassified)
{
    EXPECT_EQ(Sized(0x8086, 64 * kMB).GetMemoryMB(), 64U);
    EXPECT_THAT(fLog.Lines(), ElementsAre("DXGI RAM=67108864=64MB"));
}

TEST_F(DXGIDataTest, ASmallDiscreteCardIsClassifiedAndTakesNoSharedMemory)
{
    EXPECT_EQ(Sized(0x10DE, 512 * kMB, 0, 4 * kGB).GetMemoryMB(), 512U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("fAdapterDesc.VendorId=4318", "DXGI RAM=536870912=512MB"));
    EXPECT_THAT(fScript.calls, IsEmpty());
}

TEST_F(DXGIDataTest, UnknownPhysicalMemoryThrowsAndPrintsNothing)
{
    fScript.knowsPhysicalMemory = false;
    testing::internal::CaptureStderr();
    try {
        Sized(0x8086, 64 * kMB, 0, 4 * kGB).GetMemoryMB();
        ADD_FAILURE() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "GlobalMemoryStatusEx failed");
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

} // namespace
