#include <windows.h>

#include <set>
#include <utility>

#include <boost/make_shared.hpp>

#include "pmutil/LauncherWin.h"
#include "supervise/Containment.h"
#include "supervise/win/Job.h"

namespace assay_host {

namespace {

// A job of the child's own, of which the host isn't a member. It ends with its last handle, and so
// with the host.
class JobContainment : public Containment {
public:
    JobContainment()
        : fJob(MakeKillingJob()), fLauncher(boost::make_shared<pmutil::LauncherWin>(fJob))
    {}
    ~JobContainment() override
    {
        if (fJob != nullptr)
            ::CloseHandle(fJob);
    }

    boost::shared_ptr<pmutil::Launcher> GetLauncher() override { return fLauncher; }

    bool EndAll(double seconds) override
    {
        return fJob != nullptr && EndNewProcesses(fJob, {}, seconds);
    }

private:
    const HANDLE fJob;
    const boost::shared_ptr<pmutil::LauncherWin> fLauncher;
};

} // namespace

std::unique_ptr<Containment> MakeForeignContainment()
{
    return std::make_unique<JobContainment>();
}

} // namespace assay_host
