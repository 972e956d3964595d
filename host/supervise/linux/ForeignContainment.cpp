#include <boost/make_shared.hpp>

#include "pmutil/KeptLauncher.h"
#include "supervise/Containment.h"

namespace assay_host {

namespace {

class KeptContainment : public Containment {
public:
    ~KeptContainment() override { fLauncher->Leave(); }

    boost::shared_ptr<pmutil::Launcher> GetLauncher() override { return fLauncher; }
    bool EndAll(double seconds) override { return fLauncher->EndAll(seconds); }

private:
    const boost::shared_ptr<pmutil::KeptLauncher> fLauncher =
        boost::make_shared<pmutil::KeptLauncher>();
};

} // namespace

std::unique_ptr<Containment> MakeForeignContainment()
{
    return std::make_unique<KeptContainment>();
}

} // namespace assay_host
