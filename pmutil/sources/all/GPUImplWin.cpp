#include "pmutil_gpu/GPUImplWin.h"

#include <cstdio>

#include <boost/make_shared.hpp>

#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPU.h"

namespace pmutil {

namespace {

constexpr std::uint32_t kGLTextureFreeMemoryATI = 0x87FC;
constexpr std::uint32_t kGLGPUMemoryInfoDedicatedVidmemNVX = 0x9047;
constexpr std::size_t kGLTextureFreeMemoryValues = 4;
constexpr unsigned kKilobyteShift = 10;
constexpr unsigned kMegabyteShift = 20;

// A vendor's OpenGL query for memory in kilobytes.
struct MemoryQuery {
    std::uint32_t vendorID;
    std::uint32_t name;
    const char* failure;
};

constexpr MemoryQuery kMemoryQueries[] = {
    {kVendorAMD, kGLTextureFreeMemoryATI, ": vendorID=kVendorAMD, GLGetIntegerv failure"},
    {kVendorNVIDIA, kGLGPUMemoryInfoDedicatedVidmemNVX,
     ": vendorID=kVendorNVIDIA, GLGetIntegerv failure"},
};

// Writes the line in one call, so that no other output splits it.
void PrintToStandardError(const std::string& text)
{
    const std::string line = text + "\n";
    std::fwrite(line.data(), 1, line.size(), stderr);
    std::fflush(stderr);
}

// Returns bytes by the vendor's OpenGL query; 0 if the vendor has none or the query fails.
std::uint64_t QueryGLBytes(GPUImpl& impl, std::uint32_t vendorID)
{
    for (const MemoryQuery& query : kMemoryQueries) {
        if (query.vendorID != vendorID)
            continue;
        try {
            std::int32_t values[kGLTextureFreeMemoryValues] = {};
            impl.GLGetIntegerv(query.name, values);
            return static_cast<std::uint64_t>(std::int64_t{values[0]}) << kKilobyteShift;
        } catch (...) {
            PM_LOG(gGPUAssay, "GPUImplWin::DoGetGLMemoryMB" << query.failure);
        }
    }
    return 0;
}

// Returns the object of that name. If the list has none, appends one with the entry's context.
GPUImplWin& FindOrAppend(GPUImplWins& impls, const std::string& name, const DeviceContext& entry)
{
    const auto found = FindImplByName(impls.begin(), impls.end(), name);
    if (found != impls.end())
        return **found;
    const auto impl = boost::make_shared<GPUImplWin>();
    impl->context = entry.first;
    impls.push_back(impl);
    return *impl;
}

} // namespace

GPUImplWin::GPUImplWin() = default;

GPUImplWin::~GPUImplWin() = default;

GPUImplWins::const_iterator FindImplByName(GPUImplWins::const_iterator first,
                                           GPUImplWins::const_iterator last,
                                           const std::string& name)
{
    for (; first != last; ++first)
        if ((*first)->GetGLName() == name)
            break;
    return first;
}

ContextsByDeviceString GPUImplWin::CreateContexts()
{
    ContextsByDeviceString contexts;
    const int numDevices = QGF::OGL::Context::NumDisplayDevice();
    PM_LOG(gGPUAssay, "qgfNumDevices=" << numDevices);
    for (int index = 0; index < numDevices; ++index) {
        PM_LOG(gGPUAssay, "qgfDeviceIndex=" << index);
        try {
            QGF::OGL::DisplayDeviceKey key;
            boost::shared_ptr<QGF::OGL::ContextOffscreen> context;
            if (!QGF::OGL::Context::DisplayDevice(index, key))
                continue;
            // Log before the call, so that this line is the last one if the driver crashes.
            PM_LOG(gGPUAssay, "creating ContextOffscreen for " << key);
            context = boost::make_shared<QGF::OGL::ContextOffscreen>(key);
            const std::string deviceString = key.deviceString();
            PM_LOG(gGPUAssay, "qgfDevice[" << index << "]=" << key);
            DeviceContext& entry = contexts[deviceString];
            entry.first = context;
            entry.second = key;
        } catch (...) {
            PM_LOG(gGPUAssay, "ContextOffscreen exception caught and ignored.");
            PrintToStandardError("ContextOffscreen exception caught and ignored.");
        }
    }
    return contexts;
}

GPUImplWins JoinDevices(const ContextsByDeviceString& contexts,
                        const std::vector<DXGIData>& dxgiDevices,
                        const std::vector<WMIData>& wmiDevices)
{
    GPUImplWins impls;
    for (const DXGIData& device : dxgiDevices) {
        const std::string name = device.GetDeviceName();
        const auto entry = contexts.find(name);
        if (entry == contexts.end()) {
            PM_LOG(gGPUAssay, "QGF Device for DXGI " << name << " not found");
            continue;
        }
        FindOrAppend(impls, name, entry->second).fDXGI.fAdapterDesc = device.fAdapterDesc;
    }
    for (const WMIData& device : wmiDevices) {
        const std::string name = device.GetDeviceName();
        const auto entry = contexts.find(name);
        if (entry == contexts.end()) {
            PM_LOG(gGPUAssay, "QGF Device for WMI " << name << " not found");
            continue;
        }
        FindOrAppend(impls, name, entry->second).fWMI = device;
    }
    return impls;
}

GPUImpl::GLGPUs GPUImplWin::DoGetGPUs()
{
    GLGPUs result;
    ContextsByDeviceString contexts;
    std::size_t numContexts = 0;
    try {
        // Read the system's lists before any context exists.
        const std::vector<WMIData> wmiDevices = WMIData::GetAllDevices();
        PM_LOG(gGPUAssay, "wmiNumDevices=" << wmiDevices.size());
        const std::vector<DXGIData> dxgiDevices = DXGIData::GetAllDevices();
        PM_LOG(gGPUAssay, "dxgiNumDevices=" << dxgiDevices.size());
        contexts = CreateContexts();
        numContexts = contexts.size();
        PM_LOG(gGPUAssay, "qgfNumContexts=" << numContexts);
        for (const auto& impl : JoinDevices(contexts, dxgiDevices, wmiDevices))
            result.push_back(boost::make_shared<GLGPU>(impl));
    } catch (...) {
        PM_LOG(gGPUAssay, "DoGetGPUs fails with exception");
        PrintToStandardError("DoGetGPUs fails with exception");
    }

    if (result.empty() && numContexts != 0) {
        PM_LOG(gGPUAssay, "successful context creation but no matching WMI or DXGI devices found");
        try {
            const auto impl = boost::make_shared<GPUImplWin>();
            impl->context = contexts.begin()->second.first;
            result.push_back(boost::make_shared<GLGPU>(impl));
        } catch (...) {
            // Return an empty list.
        }
    }
    return result;
}

std::uint32_t GPUImplWin::DoGetGLMemoryMB()
{
    std::uint64_t wmiBytes = fWMI.GetMemoryMB();
    const std::uint64_t glBytes = QueryGLBytes(*this, fDXGI.GetVendorID());
    if (glBytes > wmiBytes)
        wmiBytes = glBytes;
    const auto wmiVRAM = static_cast<std::uint32_t>(wmiBytes >> kMegabyteShift);
    const std::uint32_t dxgiVRAM = fDXGI.GetMemoryMB();
    PM_LOG(gGPUAssay, "wmiVRAM=" << wmiVRAM << " dxgiVRAM=" << dxgiVRAM);
    return wmiVRAM > dxgiVRAM ? wmiVRAM : dxgiVRAM;
}

std::string GPUImplWin::DoGetGLName()
{
    return fDXGI.GetDescription();
}

std::uint32_t GPUImplWin::DoGetGLVendorID()
{
    return fDXGI.GetVendorID();
}

std::string GPUImplWin::DoGetGLDriverVersion()
{
    return fWMI.GetDriverVersion();
}

std::uint32_t GPUImplWin::DoGetGLRendererID()
{
    return fDXGI.GetDeviceID();
}

std::string GPUImplWin::DoGetGLDriver()
{
    return fWMI.GetInstalledDisplayDrivers();
}

std::string GPUImplWin::DoGetGLDriverDate()
{
    return fWMI.GetDriverDate();
}

std::string GPUImplWin::DoGetGLDriverExtra()
{
    return fWMI.GetCaption();
}

bool GPUImplWin::DoIsIntegratedGLGPU()
{
    return fDXGI.IsIntegrated();
}

} // namespace pmutil
