// A video adapter of the operating system's WMI list. On Linux the adapter source fills the same
// rows.
#pragma once

#include <vector>

#include "pmutil_gpu/AdapterSource.h"
#include "pmutil_gpu/GPUData.h"

namespace pmutil {

class WMIData : public GPUData {
public:
    // A record without a row: its six strings are "?".
    WMIData();

    // Reads the properties of a row. A property that can't be read is logged; its field is empty or
    // 0.
    WMIData(AdapterRow& row, std::uint32_t vendorID, std::uint32_t deviceID);

    // Reads the rows of the current adapter source. Rows whose Status is "Error" are left out; the
    // k-th other row gets the ids of the k-th raw adapter. A failure is logged and ends the list;
    // no exception is thrown.
    static std::vector<WMIData> GetAllDevices();

    std::string GetDeviceName() const override;
    // Returns the adapter's memory in bytes, not megabytes.
    std::uint32_t GetMemoryMB() const override;
    std::uint32_t GetVendorID() const override;
    std::uint32_t GetDeviceID() const override;
    std::string GetDescription() const override;

    std::string GetCaption() const { return fCaption; }
    std::string GetInstalledDisplayDrivers() const { return fInstalledDisplayDrivers; }
    std::string GetVideoModeDescription() const { return fVideoModeDescription; }
    std::string GetDriverVersion() const { return fDriverVersion; }
    std::string GetDriverDate() const { return fDriverDate; }

    // Reads a text property through NarrowProperty. On failure logs result and type, leaves `out`
    // unchanged and returns false.
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

// Reads "AdapterRAM". On failure logs result and type, leaves `out` unchanged and returns false.
bool GetIntProperty(AdapterRow& row, std::uint32_t& out);

// Converts a text up to its first zero: printable ASCII is copied, any other code unit becomes "\x"
// and four hexadecimal digits.
std::string NarrowProperty(const std::u16string& wide);

// Returns "name=value" of each text property that can be read, without a separator. For diagnosis.
std::string AllPropertiesString(AdapterRow& row);

// The property names of Win32_VideoController in alphabetical order; the last entry is null.
extern const char16_t* const kWMIPropertyNames[];

} // namespace pmutil
