#include "pmutil_gpu/WMIData.h"

#include <exception>
#include <memory>

#include "all/gpu/EscapedText.h"
#include "pmutil/PMLogging.h"
#include "pmutil/Requirement.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace pmutil {

namespace {

constexpr char kUnknown[] = "?";

const std::string& StatusOK()
{
    static const std::string text("OK");
    return text;
}

const std::string& StatusError()
{
    static const std::string text("Error");
    return text;
}

void RequireSuccess(ResultCode result, const char* failure)
{
    if (Failed(result))
        RequirementFailed(nullptr, 0, failure, true);
}

// Reads a property that must have the given type; no type is converted.
bool ReadProperty(AdapterRow& row, const char16_t* name, std::uint16_t type, PropertyValue& value)
{
    const ResultCode result = row.Get(name, value);
    if (!Failed(result) && value.type == type)
        return true;
    PM_LOG(gGPUAssay, "WIData::GetProperty L\"" << EscapedOrNull(name) << "\": hr=" << result
                                                << ", type=" << value.type);
    return false;
}

struct AdapterIDs {
    std::uint32_t vendor = 0;
    std::uint32_t device = 0;
};

AdapterIDs GetRawAdapterIDs(AdapterFactory* factory, std::unique_ptr<Adapter>& adapter,
                            std::uint32_t index)
{
    AdapterIDs ids;
    if (factory != nullptr && !Failed(factory->EnumAdapters(index, adapter)) && adapter) {
        AdapterDescriptor descriptor;
        adapter->GetDesc(descriptor); // on failure the ids stay 0
        ids.vendor = descriptor.VendorId;
        ids.device = descriptor.DeviceId;
    }
    return ids;
}

void AppendRow(std::vector<WMIData>& devices, std::unique_ptr<AdapterRow> row,
               AdapterFactory* factory)
{
    std::string status;
    WMIData::GetStrProperty(*row, u"Status", status);
    if (status != StatusOK())
        PM_LOG(gGPUAssay,
               "WMIData::GetStrProperty(*pclsObj, L\"Status\") returns \"" << status << "\"");
    if (status == StatusError())
        return;

    // Rows and raw adapters are paired by position: they have no common key.
    std::unique_ptr<Adapter> adapter; // released before the row
    const AdapterIDs ids =
        GetRawAdapterIDs(factory, adapter, static_cast<std::uint32_t>(devices.size()));
    devices.emplace_back(*row, ids.vendor, ids.device);
}

// Appends the rows to `devices`. Throws on a failure; `devices` keeps the rows before it.
void GatherRows(AdapterSource& source, std::unique_ptr<AdapterFactory>& factory,
                std::vector<WMIData>& devices)
{
    RequireSuccess(source.CreateFactory(factory), "CreateDXGIFactory");

    const std::unique_ptr<ManagementService> service = source.CreateManagementService();
    RequireSuccess(service->Initialize(), "CoInitializeEx");
    RequireSuccess(service->CreateLocator(), "CoCreateInstance");
    RequireSuccess(service->ConnectServer(), "pLoc->ConnectServer");
    RequireSuccess(service->SetProxyBlanket(), "Could not set proxy blanket.");

    std::unique_ptr<AdapterRows> rows;
    RequireSuccess(service->QueryAdapters(rows), "pSvc->ExecQuery");
    while (rows) {
        std::unique_ptr<AdapterRow> row;
        RequireSuccess(rows->Next(row), "pEnumerator->Next");
        if (!row)
            break;
        AppendRow(devices, std::move(row), factory.get());
    }

    // After a failure these calls aren't made: the owners release the objects, and the thread stays
    // initialized.
    rows.reset();
    service->Release();
    service->Uninitialize();
}

} // namespace

const char16_t* const kWMIPropertyNames[] = {
    u"AcceleratorCapabilities",
    u"AdapterCompatibility",
    u"AdapterDACType",
    u"AdapterRAM",
    u"Availability",
    u"CapabilityDescriptions",
    u"Caption",
    u"ColorTableEntries",
    u"ConfigManagerErrorCode",
    u"ConfigManagerUserConfig",
    u"CreationClassName",
    u"CurrentBitsPerPixel",
    u"CurrentHorizontalResolution",
    u"CurrentNumberOfColors",
    u"CurrentNumberOfColumns",
    u"CurrentNumberOfRows",
    u"CurrentRefreshRate",
    u"CurrentScanMode",
    u"CurrentVerticalResolution",
    u"Description",
    u"DeviceID",
    u"DeviceSpecificPens",
    u"DitherType",
    u"DriverDate",
    u"DriverVersion",
    u"ErrorCleared",
    u"ErrorDescription",
    u"ICMIntent",
    u"ICMMethod",
    u"InfFilename",
    u"InfSection",
    u"InstallDate",
    u"InstalledDisplayDrivers",
    u"LastErrorCode",
    u"MaxMemorySupported",
    u"MaxNumberControlled",
    u"MaxRefreshRate",
    u"MinRefreshRate",
    u"Monochrome",
    u"Name",
    u"NumberOfColorPlanes",
    u"NumberOfVideoPages",
    u"PNPDeviceID",
    u"PowerManagementCapabilities",
    u"PowerManagementSupported",
    u"ProtocolSupported",
    u"ReservedSystemPaletteEntries",
    u"SpecificationVersion",
    u"Status",
    u"StatusInfo",
    u"SystemCreationClassName",
    u"SystemName",
    u"SystemPaletteEntries",
    u"TimeOfLastReset",
    u"VideoArchitecture",
    u"VideoMemoryType",
    u"VideoMode",
    u"VideoModeDescription",
    u"VideoProcessor",
    nullptr,
};

WMIData::WMIData()
    : fAdapterRAM(0),
      fVendorID(0),
      fDeviceID(0),
      fName(kUnknown),
      fCaption(kUnknown),
      fInstalledDisplayDrivers(kUnknown),
      fVideoModeDescription(kUnknown),
      fDriverVersion(kUnknown),
      fDriverDate(kUnknown)
{}

WMIData::WMIData(AdapterRow& row, std::uint32_t vendorID, std::uint32_t deviceID)
    : fAdapterRAM(0), fVendorID(vendorID), fDeviceID(deviceID)
{
    GetIntProperty(row, fAdapterRAM);
    GetStrProperty(row, u"Name", fName);
    GetStrProperty(row, u"Caption", fCaption);
    GetStrProperty(row, u"InstalledDisplayDrivers", fInstalledDisplayDrivers);
    GetStrProperty(row, u"VideoModeDescription", fVideoModeDescription);
    GetStrProperty(row, u"DriverVersion", fDriverVersion);
    GetStrProperty(row, u"DriverDate", fDriverDate);
}

std::vector<WMIData> WMIData::GetAllDevices()
{
    std::vector<WMIData> devices;
    std::unique_ptr<AdapterFactory> factory; // made first, released last
    try {
        GatherRows(CurrentAdapterSource(), factory, devices);
    } catch (const std::exception& error) {
        PM_LOG(gGPUAssay, "WMIData::GetAllDevices() exception: " << error.what());
    } catch (...) {
        PM_LOG(gGPUAssay, "WMIData::GetAllDevices() exception");
    }
    return devices;
}

std::string WMIData::GetDeviceName() const
{
    return GetDescription();
}

std::uint32_t WMIData::GetMemoryMB() const
{
    return fAdapterRAM;
}

std::uint32_t WMIData::GetVendorID() const
{
    return fVendorID;
}

std::uint32_t WMIData::GetDeviceID() const
{
    return fDeviceID;
}

std::string WMIData::GetDescription() const
{
    return fName;
}

bool WMIData::GetStrProperty(AdapterRow& row, const char16_t* name, std::string& out)
{
    PropertyValue value;
    if (!ReadProperty(row, name, PropertyValue::kString, value))
        return false;
    out = NarrowProperty(value.text);
    return true;
}

bool GetIntProperty(AdapterRow& row, std::uint32_t& out)
{
    PropertyValue value;
    if (!ReadProperty(row, u"AdapterRAM", PropertyValue::kInt32, value))
        return false;
    out = static_cast<std::uint32_t>(value.integer);
    return true;
}

std::string NarrowProperty(const std::u16string& wide)
{
    constexpr char16_t kMinPrintable = 0x20;
    constexpr char16_t kMaxPrintable = 0x7E;
    constexpr char kDigits[] = "0123456789abcdef";
    constexpr unsigned kUnitBits = 16;
    constexpr unsigned kDigitBits = 4;
    constexpr unsigned kDigitMask = 0xF;

    std::string narrow;
    for (const char16_t unit : wide) {
        if (unit == 0)
            break;
        if (unit >= kMinPrintable && unit <= kMaxPrintable) {
            narrow += static_cast<char>(unit);
            continue;
        }
        narrow += "\\x";
        for (unsigned shift = kUnitBits; shift != 0; shift -= kDigitBits)
            narrow += kDigits[(unsigned{unit} >> (shift - kDigitBits)) & kDigitMask];
    }
    return narrow;
}

std::string AllPropertiesString(AdapterRow& row)
{
    std::string result;
    for (const char16_t* const* name = kWMIPropertyNames; *name != nullptr; ++name) {
        std::string value;
        if (!WMIData::GetStrProperty(row, *name, value))
            continue;
        result += NarrowProperty(*name);
        result += "=";
        result += value;
    }
    return result;
}

} // namespace pmutil
