#include <exception>

#include "pmutil/System.h"
#include "pmutil_gpu/AdapterSource.h"
#include "win/gpu/DXGIAdapters.h"
#include "win/gpu/WMIService.h"

namespace pmutil {

namespace {

class WindowsAdapterSource : public AdapterSource {
public:
    ResultCode CreateFactory(std::unique_ptr<AdapterFactory>& factory) override
    {
        return MakeDXGIAdapterFactory(factory);
    }

    std::unique_ptr<ManagementService> CreateManagementService() override
    {
        return MakeWMIService();
    }

    bool GetPhysicalMemory(std::uint64_t& bytes) override
    {
        try {
            bytes = GetPhysicalMemoryBytes();
            return true;
        } catch (const std::exception&) {
            return false;
        }
    }
};

} // namespace

AdapterSource& NativeAdapterSource()
{
    static WindowsAdapterSource source;
    return source;
}

} // namespace pmutil
