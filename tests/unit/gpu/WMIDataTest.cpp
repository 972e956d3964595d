#include "pmutil_gpu/WMIData.h"

#include <algorithm>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "pmutil_gpu/GPUImplHardware.h"
#include "support/CapturedLog.h"
#include "support/ScriptedAdapters.h"

namespace {

using namespace assay_test;
using pmutil::PropertyValue;
using pmutil::WMIData;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;
using testing::IsSupersetOf;

class WMIDataTest : public testing::Test {
protected:
    // A single row, for the property readers.
    std::unique_ptr<pmutil::AdapterRow> OnlyRow(const ScriptedRow& row)
    {
        fScript.rows = {row};
        const auto service = fScript.CreateManagementService();
        std::unique_ptr<pmutil::AdapterRows> rows;
        service->QueryAdapters(rows);
        std::unique_ptr<pmutil::AdapterRow> result;
        rows->Next(result);
        return result;
    }

    std::vector<WMIData> GetAllDevices()
    {
        testing::internal::CaptureStderr();
        std::vector<WMIData> devices = WMIData::GetAllDevices();
        fStandardError = testing::internal::GetCapturedStderr();
        return devices;
    }

    CapturedLog fLog{pmutil::gGPUAssay};
    ScriptedAdapters fScript;
    std::string fStandardError;
};

TEST_F(WMIDataTest, ARecordWithoutARowHasQuestionMarks)
{
    const WMIData data;
    EXPECT_EQ(data.fAdapterRAM, 0U);
    EXPECT_EQ(data.GetMemoryMB(), 0U);
    EXPECT_EQ(data.GetVendorID(), 0U);
    EXPECT_EQ(data.GetDeviceID(), 0U);
    EXPECT_EQ(data.GetDescription(), "?");
    EXPECT_EQ(data.GetDeviceName(), "?");
    EXPECT_EQ(data.GetCaption(), "?");
    EXPECT_EQ(data.GetInstalledDisplayDrivers(), "?");
    EXPECT_EQ(data.GetVideoModeDescription(), "?");
    EXPECT_EQ(data.GetDriverVersion(), "?");
    EXPECT_EQ(data.GetDriverDate(), "?");
}

TEST_F(WMIDataTest, ARowFillsEveryField)
{
    const auto row = OnlyRow(MakeRow(u"Card"));
    fScript.calls.clear();
    const WMIData data(*row, 11, 22);
    EXPECT_EQ(data.GetMemoryMB(), 0x10000000U);
    EXPECT_EQ(data.GetVendorID(), 11U);
    EXPECT_EQ(data.GetDeviceID(), 22U);
    EXPECT_EQ(data.GetDescription(), "Card");
    EXPECT_EQ(data.GetDeviceName(), "Card");
    EXPECT_EQ(data.GetCaption(), "Caption of Card");
    EXPECT_EQ(data.GetInstalledDisplayDrivers(), "drivers.dll");
    EXPECT_EQ(data.GetVideoModeDescription(), "1920 x 1080");
    EXPECT_EQ(data.GetDriverVersion(), "1.2.3");
    EXPECT_EQ(data.GetDriverDate(), "20240102000000.000000-000");
    EXPECT_THAT(fScript.calls,
                ElementsAre("Get AdapterRAM", "Get Name", "Get Caption",
                            "Get InstalledDisplayDrivers", "Get VideoModeDescription",
                            "Get DriverVersion", "Get DriverDate"));
    EXPECT_THAT(fLog.Lines(), IsEmpty());
}

TEST_F(WMIDataTest, UnreadablePropertiesAreEmptyStrings)
{
    const auto row = OnlyRow({});
    const WMIData data(*row, 0, 0);
    EXPECT_EQ(data.fAdapterRAM, 0U);
    EXPECT_EQ(data.GetDescription(), "");
    EXPECT_EQ(data.GetCaption(), "");
    EXPECT_EQ(data.GetInstalledDisplayDrivers(), "");
    EXPECT_EQ(data.GetVideoModeDescription(), "");
    EXPECT_EQ(data.GetDriverVersion(), "");
    EXPECT_EQ(data.GetDriverDate(), "");
    EXPECT_THAT(
        fLog.Lines(),
        ElementsAre("WIData::GetProperty L\"AdapterRAM\": hr=-2147217406, type=0",
                    "WIData::GetProperty L\"Name\": hr=-2147217406, type=0",
                    "WIData::GetProperty L\"Caption\": hr=-2147217406, type=0",
                    "WIData::GetProperty L\"InstalledDisplayDrivers\": hr=-2147217406, type=0",
                    "WIData::GetProperty L\"VideoModeDescription\": hr=-2147217406, type=0",
                    "WIData::GetProperty L\"DriverVersion\": hr=-2147217406, type=0",
                    "WIData::GetProperty L\"DriverDate\": hr=-2147217406, type=0"));
}

TEST_F(WMIDataTest, AdapterRAMIsReadAsUnsigned)
{
    ScriptedRow properties = MakeRow(u"Card");
    properties[u"AdapterRAM"] = {IntegerValue(-1048576)}; // 4095 MB
    const auto row = OnlyRow(properties);
    EXPECT_EQ(WMIData(*row, 0, 0).GetMemoryMB(), 0xFFF00000U);
}

TEST_F(WMIDataTest, GetIntPropertyKeepsItsOutputOnFailure)
{
    ScriptedRow properties = MakeRow(u"Card");
    properties[u"AdapterRAM"] = {TextValue(u"4096")}; // a text isn't converted
    const auto row = OnlyRow(properties);
    std::uint32_t out = 77;
    EXPECT_FALSE(pmutil::GetIntProperty(*row, out));
    EXPECT_EQ(out, 77U);
    EXPECT_THAT(fLog.Lines(), ElementsAre("WIData::GetProperty L\"AdapterRAM\": hr=0, type=8"));
}

// Types next to the two accepted ones, and these as arrays, vectors and references.
TEST_F(WMIDataTest, NoOtherTypeIsAccepted)
{
    constexpr std::uint16_t kVector = 0x1000;
    constexpr std::uint16_t kArray = 0x2000;
    constexpr std::uint16_t kByRef = 0x4000;
    for (const std::uint16_t accepted : {PropertyValue::kInt32, PropertyValue::kString}) {
        for (const int type : {0,
                               1,
                               2,
                               4,
                               7,
                               9,
                               11,
                               16,
                               17,
                               18,
                               19,
                               20,
                               21,
                               22,
                               23,
                               30,
                               31,
                               accepted | kVector,
                               accepted | kArray,
                               accepted | kByRef}) {
            PropertyValue value = ValueOfType(static_cast<std::uint16_t>(type));
            value.integer = 4096;
            value.text = u"text";
            const auto row = OnlyRow({{u"AdapterRAM", {value}}, {u"Name", {value}}});
            std::uint32_t integer = 77;
            EXPECT_FALSE(pmutil::GetIntProperty(*row, integer)) << type;
            EXPECT_EQ(integer, 77U) << type;
            std::string text = "as it was";
            EXPECT_FALSE(WMIData::GetStrProperty(*row, u"Name", text)) << type;
            EXPECT_EQ(text, "as it was") << type;
        }
    }
}

TEST_F(WMIDataTest, GetStrPropertyKeepsItsOutputOnFailure)
{
    ScriptedRow properties;
    properties[u"Name"] = {IntegerValue(5)};
    properties[u"Caption"] = {TextValue(u"right type, failed result"), kFail};
    const auto row = OnlyRow(properties);
    std::string out = "as it was";
    EXPECT_FALSE(WMIData::GetStrProperty(*row, u"Name", out));
    EXPECT_FALSE(WMIData::GetStrProperty(*row, u"Caption", out));
    EXPECT_EQ(out, "as it was");
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("WIData::GetProperty L\"Name\": hr=0, type=3",
                            "WIData::GetProperty L\"Caption\": hr=-2147467259, type=8"));
}

TEST_F(WMIDataTest, TheDeviceNameIsAVirtualCall)
{
    class Renamed : public WMIData {
    public:
        std::string GetDescription() const override { return "another"; }
    };
    const Renamed data;
    EXPECT_EQ(static_cast<const pmutil::GPUData&>(data).GetDeviceName(), "another");
}

TEST_F(WMIDataTest, APropertyReadWithAnotherSuccessCodeIsAccepted)
{
    ScriptedRow properties;
    properties[u"Name"] = {TextValue(u"Card"), kFalse};
    const auto row = OnlyRow(properties);
    std::string out;
    EXPECT_TRUE(WMIData::GetStrProperty(*row, u"Name", out));
    EXPECT_EQ(out, "Card");
}

TEST_F(WMIDataTest, TheNameOfAFailedPropertyIsEscaped)
{
    const auto row = OnlyRow({});
    std::string out;
    EXPECT_FALSE(WMIData::GetStrProperty(*row, u"a\"b\u00AE", out));
    EXPECT_FALSE(WMIData::GetStrProperty(*row, nullptr, out));
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("WIData::GetProperty L\"a\\\"b\\x00ae\": hr=-2147217406, type=0",
                            "WIData::GetProperty L\"<NULL>\": hr=-2147217406, type=0"));
}

TEST_F(WMIDataTest, NarrowPropertyKeepsPrintableASCIIOnly)
{
    EXPECT_EQ(pmutil::NarrowProperty(u""), "");
    EXPECT_EQ(pmutil::NarrowProperty(u" ~"), " ~");
    EXPECT_EQ(pmutil::NarrowProperty(u"\u00AE"), "\\x00ae");
    EXPECT_EQ(pmutil::NarrowProperty(u"\u001F\u007F"), "\\x001f\\x007f");
    EXPECT_EQ(pmutil::NarrowProperty(u"\n"), "\\x000a");
    EXPECT_EQ(pmutil::NarrowProperty(u"\u1234\uFFFD"), "\\x1234\\xfffd");
    EXPECT_EQ(pmutil::NarrowProperty(u"\U0001F600"), "\\xd83d\\xde00");
    EXPECT_EQ(pmutil::NarrowProperty(u"\"\\"), "\"\\");
    EXPECT_EQ(pmutil::NarrowProperty(std::u16string(u"ab\0cd", 5)), "ab");
}

TEST_F(WMIDataTest, ThePropertyNamesAreThoseOfTheClass)
{
    std::vector<std::string> names;
    for (const char16_t* const* name = pmutil::kWMIPropertyNames; *name != nullptr; ++name)
        names.push_back(pmutil::NarrowProperty(*name));
    EXPECT_THAT(names, ElementsAreArray({"AcceleratorCapabilities",
                                         "AdapterCompatibility",
                                         "AdapterDACType",
                                         "AdapterRAM",
                                         "Availability",
                                         "CapabilityDescriptions",
                                         "Caption",
                                         "ColorTableEntries",
                                         "ConfigManagerErrorCode",
                                         "ConfigManagerUserConfig",
                                         "CreationClassName",
                                         "CurrentBitsPerPixel",
                                         "CurrentHorizontalResolution",
                                         "CurrentNumberOfColors",
                                         "CurrentNumberOfColumns",
                                         "CurrentNumberOfRows",
                                         "CurrentRefreshRate",
                                         "CurrentScanMode",
                                         "CurrentVerticalResolution",
                                         "Description",
                                         "DeviceID",
                                         "DeviceSpecificPens",
                                         "DitherType",
                                         "DriverDate",
                                         "DriverVersion",
                                         "ErrorCleared",
                                         "ErrorDescription",
                                         "ICMIntent",
                                         "ICMMethod",
                                         "InfFilename",
                                         "InfSection",
                                         "InstallDate",
                                         "InstalledDisplayDrivers",
                                         "LastErrorCode",
                                         "MaxMemorySupported",
                                         "MaxNumberControlled",
                                         "MaxRefreshRate",
                                         "MinRefreshRate",
                                         "Monochrome",
                                         "Name",
                                         "NumberOfColorPlanes",
                                         "NumberOfVideoPages",
                                         "PNPDeviceID",
                                         "PowerManagementCapabilities",
                                         "PowerManagementSupported",
                                         "ProtocolSupported",
                                         "ReservedSystemPaletteEntries",
                                         "SpecificationVersion",
                                         "Status",
                                         "StatusInfo",
                                         "SystemCreationClassName",
                                         "SystemName",
                                         "SystemPaletteEntries",
                                         "TimeOfLastReset",
                                         "VideoArchitecture",
                                         "VideoMemoryType",
                                         "VideoMode",
                                         "VideoModeDescription",
                                         "VideoProcessor"}));
}

TEST_F(WMIDataTest, AllPropertiesAreConcatenatedWithoutASeparator)
{
    ScriptedRow properties;
    properties[u"Name"] = {TextValue(u"Card\u00AE")};
    properties[u"DriverVersion"] = {TextValue(u"1.2")};
    properties[u"AdapterRAM"] = {IntegerValue(1)};
    const auto row = OnlyRow(properties);
    EXPECT_EQ(pmutil::AllPropertiesString(*row), "DriverVersion=1.2Name=Card\\x00ae");
    EXPECT_EQ(fLog.Lines().size(), 57U);
    EXPECT_THAT(fLog.Lines(),
                IsSupersetOf({"WIData::GetProperty L\"AdapterRAM\": hr=0, type=3",
                              "WIData::GetProperty L\"VideoProcessor\": hr=-2147217406, type=0"}));
}

TEST_F(WMIDataTest, NoRowsAreAnEmptyListAndNoLine)
{
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), IsEmpty());
    EXPECT_EQ(fStandardError, "");
}

TEST_F(WMIDataTest, TheFactoryIsMadeFirstAndReleasedLast)
{
    fScript.rows = {MakeRow(u"Card")};
    fScript.adapters = {MakeAdapter(u"Card", 1, 2)};
    GetAllDevices();
    EXPECT_THAT(fScript.calls,
                ElementsAre("CreateFactory", "Initialize", "CreateLocator", "ConnectServer",
                            "SetProxyBlanket", "QueryAdapters", "Next", "Get Status",
                            "EnumAdapters 0", "GetDesc 0", "Get AdapterRAM", "Get Name",
                            "Get Caption", "Get InstalledDisplayDrivers",
                            "Get VideoModeDescription", "Get DriverVersion", "Get DriverDate",
                            "~adapter 0", "~row", "Next", "~rows", "Release", "Uninitialize",
                            "~service", "~factory"));
}

TEST_F(WMIDataTest, ARepeatedInitialisationCountsAsSuccess)
{
    fScript.rows = {MakeRow(u"Card")};
    fScript.results["Initialize"] = kFalse;
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_THAT(fLog.Lines(), IsEmpty());
    EXPECT_EQ(fScript.CountCalls("Uninitialize"), 1U);
}

struct FailingStep {
    const char* call;
    const char* text;
    std::vector<std::string> calls;
};

void PrintTo(const FailingStep& step, std::ostream* out)
{
    *out << step.call;
}

class WMIDataFailureTest : public WMIDataTest, public testing::WithParamInterface<FailingStep> {};

TEST_P(WMIDataFailureTest, AFailedStepEndsTheEnumerationWithItsText)
{
    fScript.rows = {MakeRow(u"Card")};
    fScript.results[GetParam().call] = kFail;
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(),
                ElementsAre(std::string("WMIData::GetAllDevices() exception: ") + GetParam().text));
    EXPECT_EQ(fStandardError, std::string(GetParam().text) + "\n");
    EXPECT_EQ(fScript.calls, GetParam().calls);
}

INSTANTIATE_TEST_SUITE_P(
    Steps, WMIDataFailureTest,
    testing::Values(
        FailingStep{"CreateFactory", "CreateDXGIFactory", {"CreateFactory"}},
        FailingStep{"Initialize",
                    "CoInitializeEx",
                    {"CreateFactory", "Initialize", "~service", "~factory"}},
        FailingStep{"CreateLocator",
                    "CoCreateInstance",
                    {"CreateFactory", "Initialize", "CreateLocator", "~service", "~factory"}},
        FailingStep{"ConnectServer",
                    "pLoc->ConnectServer",
                    {"CreateFactory", "Initialize", "CreateLocator", "ConnectServer", "~service",
                     "~factory"}},
        FailingStep{"SetProxyBlanket",
                    "Could not set proxy blanket.",
                    {"CreateFactory", "Initialize", "CreateLocator", "ConnectServer",
                     "SetProxyBlanket", "~service", "~factory"}},
        FailingStep{"QueryAdapters",
                    "pSvc->ExecQuery",
                    {"CreateFactory", "Initialize", "CreateLocator", "ConnectServer",
                     "SetProxyBlanket", "QueryAdapters", "~service", "~factory"}},
        FailingStep{"Next",
                    "pEnumerator->Next",
                    {"CreateFactory", "Initialize", "CreateLocator", "ConnectServer",
                     "SetProxyBlanket", "QueryAdapters", "Next", "~rows", "~service", "~factory"}}),
    [](const testing::TestParamInfo<FailingStep>& step) { return step.param.call; });

TEST_F(WMIDataTest, RowsBeforeAFailedNextAreKept)
{
    fScript.rows = {MakeRow(u"One"), MakeRow(u"Two"), MakeRow(u"Three")};
    fScript.results["Next#3"] = kFail;
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 2U);
    EXPECT_EQ(devices[0].GetDescription(), "One");
    EXPECT_EQ(devices[1].GetDescription(), "Two");
    EXPECT_THAT(fLog.Lines(), ElementsAre("WMIData::GetAllDevices() exception: pEnumerator->Next"));
    EXPECT_EQ(fScript.CountCalls("Release"), 0U);
    EXPECT_EQ(fScript.CountCalls("Uninitialize"), 0U);
    EXPECT_EQ(fScript.CountCalls("~rows"), 1U);
    EXPECT_EQ(fScript.CountCalls("~service"), 1U);
    EXPECT_EQ(fScript.CountCalls("~factory"), 1U);
}

TEST_F(WMIDataTest, AnUnknownExceptionIsLoggedWithoutText)
{
    fScript.throws["ConnectServer"] = [] { throw 0x8007000EL; };
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), ElementsAre("WMIData::GetAllDevices() exception"));
    EXPECT_EQ(fScript.CountCalls("Uninitialize"), 0U);
}

TEST_F(WMIDataTest, AStandardExceptionIsLoggedWithItsText)
{
    fScript.throws["QueryAdapters"] = [] { throw std::out_of_range("far out"); };
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), ElementsAre("WMIData::GetAllDevices() exception: far out"));
}

TEST_F(WMIDataTest, AnExceptionFromARowKeepsTheRowsBeforeIt)
{
    fScript.rows = {MakeRow(u"One"), MakeRow(u"Two")};
    fScript.throws["Get Caption#2"] = [] { throw std::runtime_error("gone"); };
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_THAT(fLog.Lines(), ElementsAre("WMIData::GetAllDevices() exception: gone"));
    EXPECT_EQ(fScript.CountCalls("~row"), 2U);
}

TEST_F(WMIDataTest, NothingIsLoggedWithLoggingOff)
{
    fLog.SetOn(false);
    fScript.rows = {ScriptedRow{}};
    fScript.results["Next#2"] = kFail;
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_EQ(fLog.Text(), "");
    EXPECT_EQ(fStandardError, "pEnumerator->Next\n");
}

TEST_F(WMIDataTest, AQueryWithoutAnEnumeratorSkipsTheLoopAndCleansUp)
{
    fScript.returnsRows = false;
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fScript.calls, ElementsAre("CreateFactory", "Initialize", "CreateLocator",
                                           "ConnectServer", "SetProxyBlanket", "QueryAdapters",
                                           "Release", "Uninitialize", "~service", "~factory"));
    EXPECT_THAT(fLog.Lines(), IsEmpty());
}

TEST_F(WMIDataTest, ARowWithAnUnknownStatusIsKeptAndLogged)
{
    const std::string odd[] = {"Degraded", "ok",     "error",    "ERROR", "OK ",    "OKAY",     "O",
                               " OK",      "Errors", "Error OK", "Erro",  " Error", "Pred Fail"};
    std::vector<std::string> lines;
    for (const std::string& status : odd) {
        ScriptedRow row = MakeRow(u"Card");
        row[u"Status"] = {TextValue(std::u16string(status.begin(), status.end()))};
        fScript.rows.push_back(row);
        lines.push_back("WMIData::GetStrProperty(*pclsObj, L\"Status\") returns \"" + status +
                        "\"");
    }
    EXPECT_EQ(GetAllDevices().size(), std::size(odd));
    EXPECT_EQ(fLog.Lines(), lines);
}

TEST_F(WMIDataTest, ARowWithStatusErrorIsDropped)
{
    ScriptedRow row = MakeRow(u"Card");
    row[u"Status"] = {TextValue(u"Error")};
    fScript.rows = {row};
    EXPECT_THAT(GetAllDevices(), IsEmpty());
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("WMIData::GetStrProperty(*pclsObj, L\"Status\") returns \"Error\""));
    EXPECT_EQ(fScript.CountCalls("~row"), 1U);
    EXPECT_EQ(fScript.CountCalls("EnumAdapters 0"), 0U);
    EXPECT_EQ(fScript.CountCalls("Get Name"), 0U);
}

TEST_F(WMIDataTest, ARowWhoseStatusCannotBeReadIsLoggedEmptyAndKept)
{
    ScriptedRow row = MakeRow(u"Card");
    row.erase(u"Status");
    fScript.rows = {row};
    EXPECT_EQ(GetAllDevices().size(), 1U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("WIData::GetProperty L\"Status\": hr=-2147217406, type=0",
                            "WMIData::GetStrProperty(*pclsObj, L\"Status\") returns \"\""));
}

TEST_F(WMIDataTest, AdapterRAMOfTypeNullLogsItsTypeAndKeepsTheRow)
{
    ScriptedRow row = MakeRow(u"Card");
    row[u"AdapterRAM"] = {ValueOfType(PropertyValue::kNull)};
    fScript.rows = {row};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_EQ(devices[0].GetMemoryMB(), 0U);
    EXPECT_EQ(devices[0].GetDescription(), "Card");
    EXPECT_THAT(fLog.Lines(), ElementsAre("WIData::GetProperty L\"AdapterRAM\": hr=0, type=1"));
}

TEST_F(WMIDataTest, TheRowAfterADroppedOneGetsTheIdsOfTheFirstRawAdapter)
{
    ScriptedRow broken = MakeRow(u"Broken");
    broken[u"Status"] = {TextValue(u"Error")};
    fScript.rows = {broken, MakeRow(u"Well")};
    fScript.adapters = {MakeAdapter(u"Broken", 0x1002, 0x11), MakeAdapter(u"Well", 0x10DE, 0x22)};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_EQ(devices[0].GetDescription(), "Well");
    EXPECT_EQ(devices[0].GetVendorID(), 0x1002U);
    EXPECT_EQ(devices[0].GetDeviceID(), 0x11U);
}

TEST_F(WMIDataTest, RowsArePairedByPositionWithUnfilteredAdapters)
{
    ScriptedAdapter noDisplay = MakeAdapter(u"Two", 2, 20);
    noDisplay.outputs.clear();
    fScript.rows = {MakeRow(u"Two"), MakeRow(u"One")};
    fScript.adapters = {noDisplay, MakeAdapter(u"Elsewhere", 3, 30)};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 2U);
    EXPECT_EQ(devices[0].GetVendorID(), 2U);
    EXPECT_EQ(devices[0].GetDeviceID(), 20U);
    EXPECT_EQ(devices[1].GetVendorID(), 3U);
    EXPECT_EQ(devices[1].GetDeviceID(), 30U);
}

TEST_F(WMIDataTest, SurplusRowsGetIdsOfZero)
{
    fScript.rows = {MakeRow(u"One"), MakeRow(u"Two")};
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 2U);
    EXPECT_EQ(devices[0].GetVendorID(), 1U);
    EXPECT_EQ(devices[1].GetVendorID(), 0U);
    EXPECT_EQ(devices[1].GetDeviceID(), 0U);
    EXPECT_THAT(fLog.Lines(), IsEmpty());
}

TEST_F(WMIDataTest, TheResultOfTheRawAdaptersGetDescIsIgnored)
{
    fScript.rows = {MakeRow(u"One")};
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    fScript.adapters[0].result = kFail;
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_EQ(devices[0].GetVendorID(), 1U);
    EXPECT_EQ(devices[0].GetDeviceID(), 10U);
}

TEST_F(WMIDataTest, IdsNeedASuccessfulCallWithAnAdapter)
{
    fScript.rows = {MakeRow(u"One"), MakeRow(u"Two"), MakeRow(u"Three")};
    fScript.adapters = {MakeAdapter(u"One", 1, 10), MakeAdapter(u"Two", 2, 20),
                        MakeAdapter(u"Three", 3, 30)};
    fScript.results["EnumAdapters 0"] = kFail;
    fScript.contrary = {"EnumAdapters 0", "EnumAdapters 1"};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 3U);
    EXPECT_EQ(devices[0].GetVendorID(), 0U);
    EXPECT_EQ(devices[1].GetVendorID(), 0U);
    EXPECT_EQ(devices[2].GetVendorID(), 3U);
}

TEST_F(WMIDataTest, WithoutAFactoryTheIdsStayZero)
{
    fScript.returnsFactory = false;
    fScript.rows = {MakeRow(u"One")};
    fScript.adapters = {MakeAdapter(u"One", 1, 10)};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_EQ(devices[0].GetVendorID(), 0U);
}

TEST_F(WMIDataTest, ANonASCIINameIsNarrowed)
{
    fScript.rows = {MakeRow(u"Card\u00AE 5")};
    const auto devices = GetAllDevices();
    ASSERT_EQ(devices.size(), 1U);
    EXPECT_EQ(devices[0].GetDescription(), "Card\\x00ae 5");
}

} // namespace
