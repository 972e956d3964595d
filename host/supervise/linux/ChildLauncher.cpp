#include "supervise/ChildLauncher.h"

#include <boost/make_shared.hpp>

#include "pmutil/LauncherPosix.h"

namespace assay_host {

boost::shared_ptr<pmutil::Launcher> MakeChildLauncher()
{
    return boost::make_shared<pmutil::LauncherPosix>(pmutil::LauncherPosix::Group::kOwn);
}

} // namespace assay_host
