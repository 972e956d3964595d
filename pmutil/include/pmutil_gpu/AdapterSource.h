// The interface to the operating system's adapter lists: rows of named values, and raw adapters
// with their outputs. The structures are those of Windows' WMI and DXGI; other platforms fill them
// from their own sources. An implementation only reads data: filtering and conversion belong to
// WMIData and DXGIData.
//
// An operation that fails returns a negative result code and leaves its output pointer null. An
// exception ends the enumeration as a failure does. The caller owns each returned object and
// destroys it before the object that returned it. Main thread only.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string>

namespace pmutil {

// A result as in COM: negative for a failure, 0 (S_OK) or 1 (S_FALSE) for a success.
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
    // Reads a property with its own type. Fails if `name` is null or the row lacks the property.
    virtual ResultCode Get(const char16_t* name, PropertyValue& value) = 0;
};

// An iterator over the rows of a query.
class AdapterRows {
public:
    virtual ~AdapterRows() = default;
    // Reads the next row. After the last row it succeeds and leaves `row` null.
    virtual ResultCode Next(std::unique_ptr<AdapterRow>& row) = 0;
};

// The connection to the management service. Call the operations in their order here. The destructor
// releases the connection and the locator if Release wasn't called; only Uninitialize undoes
// Initialize.
class ManagementService {
public:
    virtual ~ManagementService() = default;
    // Initializes COM for this thread; does nothing where there is no COM.
    virtual ResultCode Initialize() = 0;
    virtual ResultCode CreateLocator() = 0;
    virtual ResultCode ConnectServer() = 0;
    virtual ResultCode SetProxyBlanket() = 0;
    // May succeed and leave `rows` null.
    virtual ResultCode QueryAdapters(std::unique_ptr<AdapterRows>& rows) = 0;
    // Releases the service, then the locator. The rows must be released before.
    virtual void Release() = 0;
    virtual void Uninitialize() = 0;
};

// The fields of DXGI_ADAPTER_DESC. Sizes are in bytes.
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

// The fields of DXGI_OUTPUT_DESC.
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
    // Fails if there is no output of that index.
    virtual ResultCode EnumOutputs(std::uint32_t index, std::unique_ptr<AdapterOutput>& output) = 0;
};

class AdapterFactory {
public:
    virtual ~AdapterFactory() = default;
    // Fails if there is no adapter of that index.
    virtual ResultCode EnumAdapters(std::uint32_t index, std::unique_ptr<Adapter>& adapter) = 0;
};

// The adapter lists of a platform.
class AdapterSource {
public:
    virtual ~AdapterSource() = default;
    // May succeed and leave `factory` null.
    virtual ResultCode CreateFactory(std::unique_ptr<AdapterFactory>& factory) = 0;
    // Returns a new object, never null. Doesn't connect to the service.
    virtual std::unique_ptr<ManagementService> CreateManagementService() = 0;
    // Sets the total physical memory in bytes. Returns false if it is unknown.
    virtual bool GetPhysicalMemory(std::uint64_t& bytes) = 0;
};

// Returns the platform's own source. Each platform has its own source file for it.
AdapterSource& NativeAdapterSource();

// Returns the source set by ReplaceAdapterSource, else the native source.
AdapterSource& CurrentAdapterSource();

// Replaces the native source; null restores it. Not owned. For tests.
void ReplaceAdapterSource(AdapterSource* source);

} // namespace pmutil
