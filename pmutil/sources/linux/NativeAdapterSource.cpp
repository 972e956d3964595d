#include <exception>

#include "pmutil/System.h"
#include "pmutil_gpu/AdapterSource.h"

namespace pmutil {

namespace {

// The kernel's own lists aren't read yet: this machine has no rows and no adapters.
class EmptyRows : public AdapterRows {
public:
    ResultCode Next(std::unique_ptr<AdapterRow>& row) override
    {
        row.reset();
        return 0;
    }
};

class EmptyService : public ManagementService {
public:
    ResultCode Initialize() override { return 0; }
    ResultCode CreateLocator() override { return 0; }
    ResultCode ConnectServer() override { return 0; }
    ResultCode SetProxyBlanket() override { return 0; }
    ResultCode QueryAdapters(std::unique_ptr<AdapterRows>& rows) override
    {
        rows = std::make_unique<EmptyRows>();
        return 0;
    }
    void Release() override {}
    void Uninitialize() override {}
};

class EmptyFactory : public AdapterFactory {
public:
    ResultCode EnumAdapters(std::uint32_t /*index*/, std::unique_ptr<Adapter>& /*adapter*/) override
    {
        return -1;
    }
};

class EmptySource : public AdapterSource {
public:
    ResultCode CreateFactory(std::unique_ptr<AdapterFactory>& factory) override
    {
        factory = std::make_unique<EmptyFactory>();
        return 0;
    }
    std::unique_ptr<ManagementService> CreateManagementService() override
    {
        return std::make_unique<EmptyService>();
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
    static EmptySource source;
    return source;
}

} // namespace pmutil
