#include "pmutil_gpu/DXGIData.h"

#include <algorithm>
#include <exception>
#include <memory>
#include <stdexcept>
#include <string_view>

#include "all/gpu/EscapedText.h"
#include "pmutil/Escape.h"
#include "pmutil/PMLogging.h"
#include "pmutil/Requirement.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/OGL.h"

namespace pmutil {

namespace {

constexpr unsigned kMegabyteShift = 20;
constexpr std::int32_t kMinDedicatedMBForDiscreteGPU = 128;
// Bytes: 1 GiB and 2 GiB.
constexpr std::uint64_t kMinMemoryWithoutShared = 0x40000000;
constexpr std::uint64_t kMaxMemoryWithShared = 0x80000000;
constexpr double kShareOfInstalledMemory = 0.25;

// Escapes the text of a fixed array up to its terminating zero.
template <std::size_t size>
std::string EscapedArray(const std::array<char16_t, size>& text)
{
    const auto end = std::find(text.begin(), text.end(), u'\0');
    const std::u16string_view view(text.data(), static_cast<std::size_t>(end - text.begin()));
    return EscapeText(view, '"');
}

// Returns the number of the adapter's outputs that are attached to the desktop.
std::int32_t CountDisplays(Adapter& adapter)
{
    std::int32_t displays = 0;
    for (std::uint32_t index = 0;; ++index) {
        std::unique_ptr<AdapterOutput> output;
        if (Failed(adapter.EnumOutputs(index, output)) || !output)
            return displays;
        OutputDescriptor descriptor;
        if (Failed(output->GetDesc(descriptor)))
            continue;
        PM_LOG(gGPUAssay, "output[" << index << "]" << descriptor);
        if (descriptor.AttachedToDesktop != 0)
            ++displays;
    }
}

// Appends the adapters to `devices`. Throws on a failure; `devices` keeps the adapters before it.
void GatherAdapters(AdapterSource& source, std::vector<DXGIData>& devices)
{
    std::unique_ptr<AdapterFactory> factory;
    if (Failed(source.CreateFactory(factory)))
        RequirementFailed(nullptr, 0, "CreateGXGIFactory failed", true);

    for (std::uint32_t index = 0; factory; ++index) {
        std::unique_ptr<Adapter> adapter;
        if (Failed(factory->EnumAdapters(index, adapter)) || !adapter)
            return;
        AdapterDescriptor descriptor;
        if (Failed(adapter->GetDesc(descriptor)))
            RequirementFailed(nullptr, 0, "pAdapter->GetDesc failed", true);
        PM_LOG(gGPUAssay, "adapter[" << index << "]" << descriptor);

        const std::int32_t displays = CountDisplays(*adapter);
        if (displays <= 0)
            continue;
        PM_LOG(gGPUAssay, "adapter[" << index << "] displays: " << displays);
        devices.emplace_back(descriptor);
    }
}

} // namespace

std::vector<DXGIData> DXGIData::GetAllDevices()
{
    std::vector<DXGIData> devices;
    try {
        GatherAdapters(CurrentAdapterSource(), devices);
    } catch (const std::exception& error) {
        PM_LOG(gGPUAssay, "DXGIData::GetAllDevices() exception: " << error.what());
    } catch (...) {
        PM_LOG(gGPUAssay, "DXGIData::GetAllDevices() exception");
    }
    return devices;
}

std::string DXGIData::GetDeviceName() const
{
    return EscapedArray(fAdapterDesc.Description);
}

std::uint32_t DXGIData::GetMemoryMB() const
{
    std::uint64_t numBytes = fAdapterDesc.DedicatedVideoMemory + fAdapterDesc.DedicatedSystemMemory;
    if (numBytes < kMinMemoryWithoutShared && fAdapterDesc.SharedSystemMemory != 0 &&
        IsIntegrated()) {
        std::uint64_t installedRam = 0;
        if (!CurrentAdapterSource().GetPhysicalMemory(installedRam))
            throw std::runtime_error("GlobalMemoryStatusEx failed");
        PM_LOG(gGPUAssay, "installedRam=" << installedRam);
        const auto installedRamToConsiderForGPU =
            static_cast<std::uint64_t>(static_cast<double>(installedRam) * kShareOfInstalledMemory);
        PM_LOG(gGPUAssay, "installedRamToConsiderForGPU=" << installedRamToConsiderForGPU);
        const std::uint64_t installedRamThatGPUCanUse =
            std::min(installedRamToConsiderForGPU, kMaxMemoryWithShared);
        PM_LOG(gGPUAssay, "installedRamThatGPUCanUse=" << installedRamThatGPUCanUse);
        numBytes += std::min(fAdapterDesc.SharedSystemMemory, installedRamThatGPUCanUse);
        PM_LOG(gGPUAssay, "numBytes=" << numBytes);
        numBytes = std::min(numBytes, kMaxMemoryWithShared);
    }
    const auto megabytes = static_cast<std::uint32_t>(numBytes >> kMegabyteShift);
    PM_LOG(gGPUAssay, "DXGI RAM=" << numBytes << "=" << megabytes << "MB");
    return megabytes;
}

std::uint32_t DXGIData::GetVendorID() const
{
    return fAdapterDesc.VendorId;
}

std::uint32_t DXGIData::GetDeviceID() const
{
    return fAdapterDesc.DeviceId;
}

std::string DXGIData::GetDescription() const
{
    return EscapedArray(fAdapterDesc.Description);
}

bool DXGIData::IsIntegrated() const
{
    PM_LOG(gGPUAssay, "fAdapterDesc.VendorId=" << fAdapterDesc.VendorId);
    if (fAdapterDesc.VendorId != kVendorAMD && fAdapterDesc.VendorId != kVendorIntel)
        return false;
    PM_LOG(gGPUAssay, "minDedicatedMBforDiscreteGPU=" << kMinDedicatedMBForDiscreteGPU);
    const auto dedicatedMB = static_cast<std::int32_t>(
        static_cast<std::uint32_t>(fAdapterDesc.DedicatedVideoMemory >> kMegabyteShift));
    PM_LOG(gGPUAssay, "dedicatedMB=" << dedicatedMB);
    const bool integrated = dedicatedMB < kMinDedicatedMBForDiscreteGPU;
    PM_LOG(gGPUAssay, "Looks like " << (integrated ? "an integrated" : "a discrete") << " GPU");
    return integrated;
}

std::ostream& operator<<(std::ostream& out, const AdapterDescriptor& descriptor)
{
    return out << "{ VendorID=" << descriptor.VendorId << " DeviceId=" << descriptor.DeviceId
               << " SubSysId=" << descriptor.SubSysId << " Revision=" << descriptor.Revision
               << " DedicatedVideoMemory=" << descriptor.DedicatedVideoMemory
               << " DedicatedSystemMemory=" << descriptor.DedicatedSystemMemory
               << " SharedSystemMemory=" << descriptor.SharedSystemMemory
               << " Description=" << EscapedArray(descriptor.Description) << "}";
}

// The first brace is never closed. Keep that: readers of the report parse the line in this form.
std::ostream& operator<<(std::ostream& out, const OutputDescriptor& descriptor)
{
    return out << "{ DesktopCoordinates=" << descriptor.DesktopCoordinates
               << " AttachedToDesktop=" << descriptor.AttachedToDesktop
               << " Rotation=" << descriptor.Rotation << " Monitor=" << descriptor.Monitor
               << " DeviceName=" << EscapedArray(descriptor.DeviceName);
}

std::ostream& operator<<(std::ostream& out, const OutputDescriptor::Rect& rect)
{
    return out << "{ left=" << rect.left << " top=" << rect.top << " right=" << rect.right
               << " bottom=" << rect.bottom << "}";
}

} // namespace pmutil

namespace QGF {
namespace OGL {

std::ostream& operator<<(std::ostream& out, const DisplayDeviceKey& key)
{
    return out << "{ DeviceName=" << pmutil::EscapedOrNull(key.deviceName().c_str())
               << " DeviceString=" << pmutil::EscapedOrNull(key.deviceString().c_str())
               << " DisplayID=" << pmutil::EscapedOrNull(key.displayID().c_str()) << "}";
}

} // namespace OGL
} // namespace QGF
