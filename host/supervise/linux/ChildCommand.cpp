#include "supervise/ChildCommand.h"

#include <boost/nowide/convert.hpp>

namespace assay_host {

ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args)
{
    return {boost::nowide::widen(program), {args.begin(), args.end()}};
}

} // namespace assay_host
