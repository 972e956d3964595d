#include "supervise/ChildLauncher.h"

namespace assay_host {

boost::shared_ptr<pmutil::Launcher> MakeChildLauncher()
{
    return pmutil::MakeLauncher();
}

} // namespace assay_host
