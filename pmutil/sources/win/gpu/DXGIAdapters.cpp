#include "win/gpu/DXGIAdapters.h"

#include <algorithm>

#include "qgf/Core.h"
#include "win/gpu/ComTypes.h"

#include <dxgi.h>

namespace pmutil {

namespace {

template <std::size_t size>
void CopyText(const wchar_t (&from)[size], std::array<char16_t, size>& to)
{
    std::transform(std::begin(from), std::end(from), to.begin(),
                   [](wchar_t unit) { return static_cast<char16_t>(unit); });
}

class DXGIOutput : public AdapterOutput {
public:
    explicit DXGIOutput(ComPtr<IDXGIOutput> output) : fOutput(std::move(output)) {}

    ResultCode GetDesc(OutputDescriptor& description) override
    {
        DXGI_OUTPUT_DESC answer{};
        const HRESULT result = fOutput->GetDesc(&answer);
        CopyText(answer.DeviceName, description.DeviceName);
        description.DesktopCoordinates = {
            answer.DesktopCoordinates.left, answer.DesktopCoordinates.top,
            answer.DesktopCoordinates.right, answer.DesktopCoordinates.bottom};
        description.AttachedToDesktop = answer.AttachedToDesktop;
        description.Rotation = answer.Rotation;
        description.Monitor = answer.Monitor;
        return result;
    }

private:
    ComPtr<IDXGIOutput> fOutput;
};

class DXGIAdapter : public Adapter {
public:
    explicit DXGIAdapter(ComPtr<IDXGIAdapter> adapter) : fAdapter(std::move(adapter)) {}

    ResultCode GetDesc(AdapterDescriptor& description) override
    {
        DXGI_ADAPTER_DESC answer{};
        const HRESULT result = fAdapter->GetDesc(&answer);
        CopyText(answer.Description, description.Description);
        description.VendorId = answer.VendorId;
        description.DeviceId = answer.DeviceId;
        description.SubSysId = answer.SubSysId;
        description.Revision = answer.Revision;
        description.DedicatedVideoMemory = answer.DedicatedVideoMemory;
        description.DedicatedSystemMemory = answer.DedicatedSystemMemory;
        description.SharedSystemMemory = answer.SharedSystemMemory;
        return result;
    }

    ResultCode EnumOutputs(std::uint32_t index, std::unique_ptr<AdapterOutput>& output) override
    {
        IDXGIOutput* found = nullptr;
        const HRESULT result = fAdapter->EnumOutputs(index, &found);
        if (found != nullptr)
            output = std::make_unique<DXGIOutput>(TakeReference(found));
        return result;
    }

private:
    ComPtr<IDXGIAdapter> fAdapter;
};

class DXGIFactory : public AdapterFactory {
public:
    explicit DXGIFactory(ComPtr<IDXGIFactory> factory) : fFactory(std::move(factory)) {}

    ResultCode EnumAdapters(std::uint32_t index, std::unique_ptr<Adapter>& adapter) override
    {
        IDXGIAdapter* found = nullptr;
        const HRESULT result = fFactory->EnumAdapters(index, &found);
        if (found != nullptr)
            adapter = std::make_unique<DXGIAdapter>(TakeReference(found));
        return result;
    }

private:
    ComPtr<IDXGIFactory> fFactory;
};

// The first call loads the library for the rest of the process. Null if the system lacks it.
decltype(&::CreateDXGIFactory) FindCreateFunction()
{
    static const char* const kNames[] = {"dxgi.dll", nullptr};
    try {
        static const QGF::Core::DynamicLibrary* const gLibrary =
            QGF::Core::OpenLibrary(kNames).release();
        return reinterpret_cast<decltype(&::CreateDXGIFactory)>(
            gLibrary->getProc("CreateDXGIFactory"));
    } catch (const QGF::LogicalException&) {
        return nullptr;
    }
}

} // namespace

ResultCode MakeDXGIAdapterFactory(std::unique_ptr<AdapterFactory>& factory)
{
    const auto create = FindCreateFunction();
    if (create == nullptr)
        return HRESULT_FROM_WIN32(ERROR_MOD_NOT_FOUND);
    void* made = nullptr;
    const HRESULT result = create(IID_IDXGIFactory, &made);
    if (made != nullptr)
        factory = std::make_unique<DXGIFactory>(TakeReference(static_cast<IDXGIFactory*>(made)));
    return result;
}

} // namespace pmutil
