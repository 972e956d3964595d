#include <algorithm>
#include <exception>
#include <limits>
#include <utility>
#include <vector>

#include <boost/nowide/utf/convert.hpp>

#include "linux/gpu/DrmAdapters.h"
#include "linux/gpu/SystemNumbers.h"
#include "pmutil/System.h"
#include "pmutil_gpu/AdapterSource.h"
#include "pmutil_gpu/DXGIData.h"
#include "qgf/SystemFiles.h"

namespace pmutil {
namespace {

// The codes that Windows returns for a missing property (WBEM_E_NOT_FOUND), the end of a list
// (DXGI_ERROR_NOT_FOUND) and a removed device (DXGI_ERROR_DEVICE_REMOVED).
constexpr ResultCode kPropertyNotFound = static_cast<ResultCode>(0x80041002U);
constexpr ResultCode kNotFound = static_cast<ResultCode>(0x887A0002U);
constexpr ResultCode kDeviceRemoved = static_cast<ResultCode>(0x887A0005U);

std::u16string Wide(const std::string& text)
{
    return boost::nowide::utf::convert_string<char16_t>(text.data(), text.data() + text.size());
}

template <std::size_t size>
void Store(const std::string& text, std::array<char16_t, size>& field)
{
    const std::u16string wide = Wide(text);
    std::copy_n(wide.begin(), std::min(wide.size(), size - 1), field.begin());
}

// A recorded machine's memory comes from its /proc/meminfo.
bool PhysicalMemory(std::uint64_t& bytes)
{
    if (!QGF::SystemRoot().empty()) {
        std::string meminfo;
        return QGF::ReadSystemFile("/proc/meminfo", meminfo) && ParseMemoryTotal(meminfo, bytes);
    }
    try {
        bytes = GetPhysicalMemoryBytes();
        return true;
    } catch (const std::exception&) {
        return false;
    }
}

PropertyValue Text(const std::string& text)
{
    PropertyValue value;
    value.type = PropertyValue::kString;
    value.text = Wide(text);
    return value;
}

PropertyValue TextOrNull(const std::string& text)
{
    PropertyValue value = Text(text);
    if (text.empty())
        value.type = PropertyValue::kNull;
    return value;
}

PropertyValue Memory(const std::optional<std::uint64_t>& bytes)
{
    PropertyValue value;
    value.type = PropertyValue::kNull;
    if (bytes) {
        constexpr std::uint64_t kMaxBytes = std::numeric_limits<std::uint32_t>::max();
        value.type = PropertyValue::kInt32;
        value.integer = static_cast<std::int32_t>(std::min(*bytes, kMaxBytes));
    }
    return value;
}

PropertyValue VideoMode(const DrmAdapter& adapter)
{
    for (const DrmConnector& connector : adapter.connectors)
        if (connector.width != 0)
            return Text(std::to_string(connector.width) + " x " + std::to_string(connector.height));
    return TextOrNull(std::string());
}

class LinuxRow : public AdapterRow {
public:
    explicit LinuxRow(const DrmAdapter& adapter)
        : fProperties{
              {u"AdapterRAM", Memory(adapter.dedicatedBytes)},
              {u"Name", Text(adapter.name)},
              {u"Caption", Text(adapter.name)},
              {u"InstalledDisplayDrivers", TextOrNull(adapter.driver)},
              {u"VideoModeDescription", VideoMode(adapter)},
              {u"DriverVersion", TextOrNull(adapter.driverVersion)},
              {u"DriverDate", Text(adapter.driverDate)},
              {u"Status", Text("OK")},
          }
    {}

    ResultCode Get(const char16_t* name, PropertyValue& value) override
    {
        const auto property = std::find_if(fProperties.begin(), fProperties.end(),
                                           [&](const auto& entry) { return entry.first == name; });
        if (property == fProperties.end())
            return kPropertyNotFound;
        value = property->second;
        return 0;
    }

private:
    std::vector<std::pair<std::u16string, PropertyValue>> fProperties;
};

class LinuxRows : public AdapterRows {
public:
    ResultCode Next(std::unique_ptr<AdapterRow>& row) override
    {
        row.reset();
        if (fNext != fAdapters->size()) {
            row = std::make_unique<LinuxRow>((*fAdapters)[fNext]);
            ++fNext;
        }
        return 0;
    }

private:
    const std::shared_ptr<const std::vector<DrmAdapter>> fAdapters = CachedDrmAdapters();
    std::size_t fNext = 0;
};

// The kernel's files need no connection, so only QueryAdapters does something.
class LinuxService : public ManagementService {
public:
    ResultCode Initialize() override { return 0; }
    ResultCode CreateLocator() override { return 0; }
    ResultCode ConnectServer() override { return 0; }
    ResultCode SetProxyBlanket() override { return 0; }
    ResultCode QueryAdapters(std::unique_ptr<AdapterRows>& rows) override
    {
        rows = std::make_unique<LinuxRows>();
        return 0;
    }
    void Release() override {}
    void Uninitialize() override {}
};

class LinuxOutput : public AdapterOutput {
public:
    explicit LinuxOutput(const DrmConnector& connector) : fConnector(connector) {}

    ResultCode GetDesc(OutputDescriptor& description) override
    {
        if (!fConnector.connected)
            return kDeviceRemoved;
        description = OutputDescriptor();
        Store(fConnector.name, description.DeviceName);
        description.DesktopCoordinates.right = static_cast<std::int32_t>(fConnector.width);
        description.DesktopCoordinates.bottom = static_cast<std::int32_t>(fConnector.height);
        description.AttachedToDesktop = *fConnector.connected ? 1 : 0;
        return 0;
    }

private:
    DrmConnector fConnector;
};

class LinuxAdapter : public Adapter {
public:
    explicit LinuxAdapter(DrmAdapter adapter) : fAdapter(std::move(adapter))
    {
        // A card without a monitor or without connectors can render too. Give it an attached output
        // with the name of its render node, since adapters without one are left out.
        const bool attached =
            std::any_of(fAdapter.connectors.begin(), fAdapter.connectors.end(),
                        [](const DrmConnector& connector) { return connector.connected == true; });
        if (!attached && fAdapter.renders) {
            DrmConnector connector;
            connector.name = fAdapter.renderName;
            connector.connected = true;
            fAdapter.connectors.push_back(connector);
        }
    }

    ResultCode GetDesc(AdapterDescriptor& description) override
    {
        description = AdapterDescriptor();
        Store(fAdapter.name, description.Description);
        description.VendorId = fAdapter.vendor;
        description.DeviceId = fAdapter.device;
        description.SubSysId = fAdapter.subsystem;
        description.Revision = fAdapter.revision;
        description.DedicatedVideoMemory = fAdapter.dedicatedBytes.value_or(0);
        description.SharedSystemMemory = SharedMemory();
        return 0;
    }

    ResultCode EnumOutputs(std::uint32_t index, std::unique_ptr<AdapterOutput>& output) override
    {
        if (index >= fAdapter.connectors.size())
            return kNotFound;
        output = std::make_unique<LinuxOutput>(fAdapter.connectors[index]);
        return 0;
    }

private:
    // The driver's figure, else half of the physical memory for an integrated adapter.
    std::uint64_t SharedMemory() const
    {
        if (fAdapter.sharedBytes)
            return *fAdapter.sharedBytes;
        const bool mayBeIntegrated =
            fAdapter.vendor == kVendorIntel || fAdapter.vendor == kVendorAMD;
        std::uint64_t installed = 0;
        if (!mayBeIntegrated || fAdapter.dedicatedBytes.value_or(0) != 0 ||
            !PhysicalMemory(installed))
            return 0;
        return installed / 2;
    }

    DrmAdapter fAdapter;
};

class LinuxFactory : public AdapterFactory {
public:
    ResultCode EnumAdapters(std::uint32_t index, std::unique_ptr<Adapter>& adapter) override
    {
        if (index >= fAdapters->size())
            return kNotFound;
        adapter = std::make_unique<LinuxAdapter>((*fAdapters)[index]);
        return 0;
    }

private:
    const std::shared_ptr<const std::vector<DrmAdapter>> fAdapters = CachedDrmAdapters();
};

class LinuxSource : public AdapterSource {
public:
    ResultCode CreateFactory(std::unique_ptr<AdapterFactory>& factory) override
    {
        factory = std::make_unique<LinuxFactory>();
        return 0;
    }
    std::unique_ptr<ManagementService> CreateManagementService() override
    {
        return std::make_unique<LinuxService>();
    }
    bool GetPhysicalMemory(std::uint64_t& bytes) override { return PhysicalMemory(bytes); }
};

} // namespace

AdapterSource& NativeAdapterSource()
{
    static LinuxSource source;
    return source;
}

} // namespace pmutil
