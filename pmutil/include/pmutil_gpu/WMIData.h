// One video adapter as the operating system's management service sees it.
#pragma once

#include <vector>

#include "pmutil_gpu/AdapterSource.h"
#include "pmutil_gpu/GPUData.h"

namespace pmutil {

class WMIData : public GPUData {
public:
    // A record that never met a row: its six strings are "?".
    WMIData();

    // Reads a row's properties; one that can't be read leaves its field empty or 0 and logs a line.
    WMIData(AdapterRow& row, std::uint32_t vendorID, std::uint32_t deviceID);

    // The rows of the current adapter source in their order, less those whose Status is "Error";
    // the k-th row kept gets the ids of the k-th raw adapter. A failure is logged and ends the
    // list; no exception comes out.
    static std::vector<WMIData> GetAllDevices();

    std::string GetDeviceName() const override;
    // The adapter's memory in bytes, in spite of the name.
    std::uint32_t GetMemoryMB() const override;
    std::uint32_t GetVendorID() const override;
    std::uint32_t GetDeviceID() const override;
    std::string GetDescription() const override;

    std::string GetCaption() const { return fCaption; }
    std::string GetInstalledDisplayDrivers() const { return fInstalledDisplayDrivers; }
    std::string GetVideoModeDescription() const { return fVideoModeDescription; }
    std::string GetDriverVersion() const { return fDriverVersion; }
    std::string GetDriverDate() const { return fDriverDate; }

    // Reads a text property, narrowed. False leaves `out` alone and logs the result and the type.
    static bool GetStrProperty(AdapterRow& row, const char16_t* name, std::string& out);

    std::uint32_t fAdapterRAM; // bytes
    std::uint32_t fVendorID;
    std::uint32_t fDeviceID;
    std::string fName;
    std::string fCaption;
    std::string fInstalledDisplayDrivers;
    std::string fVideoModeDescription;
    std::string fDriverVersion;
    std::string fDriverDate;
};

// Reads "AdapterRAM". A failure leaves `out` alone and logs the result and the type.
bool GetIntProperty(AdapterRow& row, std::uint32_t& out);

// Printable ASCII as it stands, any other code unit as "\x" and four hexadecimal digits.
std::string NarrowProperty(const std::u16string& wide);

// "name=value" of each property that can be read, with nothing between the pairs. For diagnosis.
std::string AllPropertiesString(AdapterRow& row);

// The property names of Win32_VideoController in alphabetical order, ended by a null.
extern const char16_t* const kWMIPropertyNames[];

} // namespace pmutil
