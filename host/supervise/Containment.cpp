#include "supervise/Containment.h"

#include <utility>

#include "supervise/ChildLauncher.h"
#include "supervise/ProcessTree.h"

namespace assay_host {

namespace {

class OwnContainment : public Containment {
public:
    explicit OwnContainment(boost::shared_ptr<pmutil::Launcher> launcher)
        : fLauncher(std::move(launcher))
    {}

    boost::shared_ptr<pmutil::Launcher> GetLauncher() override { return fLauncher; }
    bool EndAll(double seconds) override { return fTree.EndAll(seconds); }

private:
    const boost::shared_ptr<pmutil::Launcher> fLauncher;
    ProcessTree fTree;
};

} // namespace

std::unique_ptr<Containment> MakeOwnContainment()
{
    return MakeOwnContainment(MakeChildLauncher());
}

std::unique_ptr<Containment> MakeOwnContainment(boost::shared_ptr<pmutil::Launcher> launcher)
{
    return std::make_unique<OwnContainment>(std::move(launcher));
}

} // namespace assay_host
