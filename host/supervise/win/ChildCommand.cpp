#include "supervise/ChildCommand.h"

#include <boost/nowide/convert.hpp>

#include "supervise/win/Quoting.h"

namespace assay_host {

ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args)
{
    // Nothing is escaped in a program's path, which can't hold a quotation mark.
    ChildCommand command;
    command.fProgram = L'"' + boost::nowide::widen(program) + L'"';
    for (const std::string& arg : args)
        command.fProgram += L' ' + Quote(boost::nowide::widen(arg));
    return command;
}

boost::shared_ptr<pmutil::Launcher> MakeChildLauncher()
{
    return pmutil::MakeLauncher();
}

} // namespace assay_host
