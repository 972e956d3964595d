#include "all/NativeCommand.h"

#include <boost/nowide/convert.hpp>

namespace pmutil {

ChildCommand MakeNativeCommand(const std::string& program, const std::vector<std::string>& args)
{
    return {boost::nowide::widen(program), {args.begin(), args.end()}};
}

} // namespace pmutil
