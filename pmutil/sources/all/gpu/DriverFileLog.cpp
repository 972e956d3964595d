#include "pmutil_gpu/DriverFileLog.h"

#include <exception>
#include <memory>
#include <set>
#include <string>
#include <utility>

#include "all/gpu/ModuleList.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/DriverCall.h"

namespace pmutil {

namespace {

using QGF::Core::Interface;

const char* GetName(Interface kind)
{
    return kind == Interface::kOpenGL ? "OpenGL" : "OpenCL";
}

class DriverFileLog : public QGF::Core::DriverCallObserver {
public:
    DriverFileLog() : fCount(CountLoads())
    {
        for (std::string& path : ListModules())
            fKnown.insert(std::move(path));
    }

    void BeforeCall(Interface) noexcept override
    {
        Look([](const std::string&) {});
    }

    void AfterCall(Interface kind) noexcept override
    {
        Look([kind](const std::string& path) {
            PM_LOG(gGPUAssay, "loaded for " << GetName(kind) << ": " << path);
        });
    }

private:
    // Calls `found` for each path that is new since the last call.
    template <typename Found>
    void Look(Found found) noexcept
    {
        const LastError kept;
        const std::uint64_t count = CountLoads();
        if (count == fCount)
            return;
        fCount = count;
        try {
            for (const std::string& path : ListModules())
                if (fKnown.insert(path).second)
                    found(path);
        } catch (const std::exception&) {
            // Without memory the list has gaps.
        }
    }

    std::uint64_t fCount;
    std::set<std::string> fKnown;
};

} // namespace

void LogDriverFiles()
{
    const std::int32_t value = GetDebugValue(gGPUAssay);
    if (value <= 0 || (value & kLogDriverFiles) == 0 || QGF::Core::IsObserved())
        return;
    // Never destroyed: drivers are called until the process ends.
    static auto* const log = new std::unique_ptr<DriverFileLog>;
    *log = std::make_unique<DriverFileLog>();
    QGF::Core::ObserveDriverCalls(log->get());
    PM_LOG(gGPUAssay, "driver files are logged");
}

} // namespace pmutil
