#include "supervise/ChildCommand.h"

#include <boost/make_shared.hpp>
#include <boost/nowide/convert.hpp>

#include "pmutil/LauncherPosix.h"

namespace assay_host {

ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args)
{
    return {boost::nowide::widen(program), {args.begin(), args.end()}};
}

boost::shared_ptr<pmutil::Launcher> MakeChildLauncher()
{
    return boost::make_shared<pmutil::LauncherPosix>(pmutil::LauncherPosix::Group::kOwn);
}

} // namespace assay_host
