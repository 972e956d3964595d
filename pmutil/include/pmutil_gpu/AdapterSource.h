// The seam to the operating system's adapter lists: rows of named values as a management service
// keeps them, and raw adapters with their outputs as a display interface lists them. The shapes are
// those of Windows' WMI and DXGI; other platforms fill the same shapes from what they have.
//
// Every operation may fail by a result code below 0; an exception that comes out of one ends the
// enumeration like a failure does. A pointer that an operation fills stays null when it fails.
// Nothing here decides anything: that is WMIData's and DXGIData's work. Each object that is handed
// out is released by its destructor, before the object that gave it. Main thread only.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string>

namespace pmutil {

// A result in the manner of COM: failed if negative. 0 is plain success, 1 success of another kind.
using ResultCode = std::int32_t;
inline constexpr bool Failed(ResultCode result)
{
    return result < 0;
}

// A typed value of a row, with the type numbers of a COM variant.
struct PropertyValue {
    static constexpr std::uint16_t kEmpty = 0;
    static constexpr std::uint16_t kNull = 1;
    static constexpr std::uint16_t kInt32 = 3;
    static constexpr std::uint16_t kString = 8;

    std::uint16_t type = kEmpty;
    std::int32_t integer = 0; // meaningful for kInt32
    std::u16string text;      // meaningful for kString
};

// One row of Win32_VideoController.
class AdapterRow {
public:
    virtual ~AdapterRow() = default;
    // The property of that name, in the type it has. A null name, and one that the row lacks, fail.
    virtual ResultCode Get(const char16_t* name, PropertyValue& value) = 0;
};

// The rows of a query, one after the other.
class AdapterRows {
public:
    virtual ~AdapterRows() = default;
    // Success with a null row is the end.
    virtual ResultCode Next(std::unique_ptr<AdapterRow>& row) = 0;
};

// The management service, in the steps that reaching it takes, to be called in this order. The
// destructor releases the connection and the locator where Release hasn't, but undoes Initialize in
// no case: that is Uninitialize's work.
class ManagementService {
public:
    virtual ~ManagementService() = default;
    // Starts COM, or what stands for it, for this thread.
    virtual ResultCode Initialize() = 0;
    virtual ResultCode CreateLocator() = 0;
    virtual ResultCode ConnectServer() = 0;
    virtual ResultCode SetProxyBlanket() = 0;
    // May succeed and leave `rows` null.
    virtual ResultCode QueryAdapters(std::unique_ptr<AdapterRows>& rows) = 0;
    // Releases the service, then the locator; the rows are gone by then.
    virtual void Release() = 0;
    virtual void Uninitialize() = 0;
};

// What a raw adapter says of itself. Sizes are bytes.
struct AdapterDescriptor {
    std::array<char16_t, 128> Description{}; // zero-terminated
    std::uint32_t VendorId = 0;
    std::uint32_t DeviceId = 0;
    std::uint32_t SubSysId = 0;
    std::uint32_t Revision = 0;
    std::uint64_t DedicatedVideoMemory = 0;
    std::uint64_t DedicatedSystemMemory = 0;
    std::uint64_t SharedSystemMemory = 0;
};

// What an output of an adapter says of itself.
struct OutputDescriptor {
    struct Rect {
        std::int32_t left = 0;
        std::int32_t top = 0;
        std::int32_t right = 0;
        std::int32_t bottom = 0;
    };

    std::array<char16_t, 32> DeviceName{}; // zero-terminated
    Rect DesktopCoordinates;
    std::int32_t AttachedToDesktop = 0;
    std::int32_t Rotation = 0;
    const void* Monitor = nullptr;
};

class AdapterOutput {
public:
    virtual ~AdapterOutput() = default;
    virtual ResultCode GetDesc(OutputDescriptor& description) = 0;
};

class Adapter {
public:
    virtual ~Adapter() = default;
    virtual ResultCode GetDesc(AdapterDescriptor& description) = 0;
    // A failure is the end of the outputs.
    virtual ResultCode EnumOutputs(std::uint32_t index, std::unique_ptr<AdapterOutput>& output) = 0;
};

class AdapterFactory {
public:
    virtual ~AdapterFactory() = default;
    // A failure is the end of the adapters.
    virtual ResultCode EnumAdapters(std::uint32_t index, std::unique_ptr<Adapter>& adapter) = 0;
};

// One platform's adapter lists.
class AdapterSource {
public:
    virtual ~AdapterSource() = default;
    // May succeed and leave `factory` null.
    virtual ResultCode CreateFactory(std::unique_ptr<AdapterFactory>& factory) = 0;
    // Never null. Does nothing but make the object: reaching the service is the object's work.
    virtual std::unique_ptr<ManagementService> CreateManagementService() = 0;
    // Total physical memory in bytes; false if the system doesn't say.
    virtual bool GetPhysicalMemory(std::uint64_t& bytes) = 0;
};

// The platform's own source. One twin source per platform implements it.
AdapterSource& NativeAdapterSource();

// The source in force: the native one, unless a test has replaced it. Null restores the native one.
AdapterSource& CurrentAdapterSource();
void ReplaceAdapterSource(AdapterSource* source);

} // namespace pmutil
